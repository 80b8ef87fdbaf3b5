#include "bindings.h"
#include "call_log.h"
#include "python_bridge.h"

PYBIND11_MODULE(_meshport, module) {
  module.doc() = "The compiled part of the meshport package; use the package, not this module.";
  pymeshport::CallLog::install();
  pymeshport::defineErrors(module);
  pymeshport::bindReadPly(module);
  pymeshport::bindScene(module);
}
