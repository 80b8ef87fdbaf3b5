#pragma once

// What the bindings share: the module's exception classes, NumPy arrays over the values the
// C++ side keeps, and the one way a call on a file runs: without the interpreter lock, its
// log held, its failure raised as the module's exception.

#include "call_failure.h"
#include "call_log.h"
#include "raw_ply.h"

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include <optional>
#include <string>

namespace pymeshport {

namespace py = pybind11;

/// Makes meshport.Error and its subclasses in `module`.
void defineErrors(py::module_& module);

/// Raises the module's exception for `failure` (the interpreter lock held).
[[noreturn]] void raiseFailure(const CallFailure& failure);

/// Hands held messages to the "meshport" logger of Python's logging, leaving out the one a
/// raised exception already carries.
void forwardMessages(const std::vector<CallLog::Message>& messages, const std::string& raised);

/// The NumPy dtype of a PLY value type.
py::dtype dtypeOf(ply::DataType type);

/// An array over `block`'s values that keeps the block's storage alive.
py::array arrayOf(const ValueBlock& block);

/// Runs `work()` on the file at `path` without the interpreter lock, with the call's log
/// held; whatever it throws is raised as the module's exception, the other messages go to
/// logging.
template <class Work>
auto runFileCall(const std::string& path, Work&& work) -> decltype(work()) {
  std::optional<decltype(work())> result;
  std::optional<CallFailure> failure;
  std::vector<CallLog::Message> messages;
  {
    py::gil_scoped_release release;
    CallLog log;
    try {
      result.emplace(work());
    } catch (...) {
      failure = failureOf(std::current_exception(), path, log.cause().value_or(std::string()));
    }
    messages = log.take();
  }
  forwardMessages(messages, failure ? failure->message : std::string());
  if (failure) raiseFailure(*failure);
  return std::move(*result);
}

}  // namespace pymeshport
