#include "python_bridge.h"

#include "ply_columns.h"

namespace pymeshport {
namespace {

// The classes live as attributes of the module; these are plain handles to them.
struct ErrorClasses {
  py::handle error, notFound, unsupported, corrupt;
};
ErrorClasses errorClasses;

py::handle makeError(py::module_& module, const char* name, std::initializer_list<py::handle> bases, const char* doc) {
  py::tuple baseTuple(bases.size());
  std::size_t k = 0;
  for (const py::handle base : bases) baseTuple[k++] = py::reinterpret_borrow<py::object>(base);
  const std::string qualified = std::string("meshport.") + name;
  PyObject* type = PyErr_NewExceptionWithDoc(qualified.c_str(), doc, baseTuple.ptr(), nullptr);
  if (!type) throw py::error_already_set();
  module.add_object(name, py::reinterpret_steal<py::object>(type));
  return type;
}

int pythonLevel(int level) {
  switch (level) {
    case base::logError:
      return 40;
    case base::logWarning:
      return 30;
    case base::logInfo:
      return 20;
    default:
      return 10;
  }
}

}  // namespace

void defineErrors(py::module_& module) {
  errorClasses.error = makeError(module, "Error", {PyExc_Exception}, "A file could not be read or imported.");
  errorClasses.notFound =
      makeError(module, "NotFoundError", {errorClasses.error, PyExc_FileNotFoundError}, "The file does not exist.");
  errorClasses.unsupported =
      makeError(module, "UnsupportedError", {errorClasses.error}, "No scene plug-in imports this kind of file.");
  errorClasses.corrupt = makeError(module, "CorruptError", {errorClasses.error, PyExc_ValueError},
                                   "The file's content is not valid: a bad header, data that ends early, "
                                   "damaged compressed data.");
}

void raiseFailure(const CallFailure& failure) {
  using Kind = CallFailure::Kind;
  PyObject* type = errorClasses.error.ptr();
  switch (failure.kind) {
    case Kind::notFound:
      type = errorClasses.notFound.ptr();
      break;
    case Kind::unsupported:
      type = errorClasses.unsupported.ptr();
      break;
    case Kind::corrupt:
      type = errorClasses.corrupt.ptr();
      break;
    case Kind::badParameter:
      type = PyExc_TypeError;
      break;
    case Kind::badParameterValue:
      type = PyExc_ValueError;
      break;
    case Kind::outOfMemory:
      type = PyExc_MemoryError;
      break;
    case Kind::error:
      break;
  }
  PyErr_SetString(type, failure.message.c_str());
  throw py::error_already_set();
}

void forwardMessages(const std::vector<CallLog::Message>& messages, const std::string& raised) {
  if (messages.empty()) return;
  const py::object logger = py::module_::import("logging").attr("getLogger")("meshport");
  for (const CallLog::Message& message : messages) {
    if (!raised.empty() && raised.ends_with(message.text)) continue;
    logger.attr("log")(pythonLevel(message.level), "%s", message.text);
  }
}

py::dtype dtypeOf(ply::DataType type) {
  return ply::detail::forType<ply::Conversion::native>(
      type, []<ply::DataType T, ply::Conversion>() { return py::dtype::of<ply::detail::NativeType<T>>(); });
}

py::array arrayOf(const ValueBlock& block) {
  const py::dtype dtype = dtypeOf(block.type);
  std::vector<py::ssize_t> shape{static_cast<py::ssize_t>(block.rows)};
  if (block.width) shape.push_back(static_cast<py::ssize_t>(*block.width));
  // The capsule holds a reference to the storage for as long as the array (or a view of it)
  // lives.
  auto* keeper = new std::shared_ptr<void>(block.owner);
  const py::capsule base(keeper, [](void* held) { delete static_cast<std::shared_ptr<void>*>(held); });
  return py::array(dtype, shape, {}, block.data, base);
}

}  // namespace pymeshport
