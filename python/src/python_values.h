#pragma once

#include "b_attribute.h"

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include <functional>
#include <string_view>

namespace pymeshport {

namespace py = pybind11;

/// Gives the array for a list of numbers: `data` holds `rows` values of `dtype`, `width`
/// components each (0: one, no second axis). The scene's view makes arrays over its own
/// storage; another caller may copy.
using ListArrayMaker = std::function<py::array(const base::Attribute& list, const void* data, std::size_t rows,
                                               std::size_t width, const py::dtype& dtype)>;

/// Bytes from a file (names as written, texts) as a Python str: what is not UTF-8 becomes
/// U+FFFD, as Python's "replace" error handler does.
py::str pythonText(std::string_view bytes);

/// The attribute as a Python value: a map as a dict by member name (sorted), a structure
/// list as a list, a list of numbers or of vectors of numbers through `makeArray`, and any
/// other value as its structured form gives it (numbers, booleans, texts, lists of them;
/// NaN and the infinities as floats).
py::object toPython(const base::Attribute& attribute, const ListArrayMaker& makeArray);

}  // namespace pymeshport
