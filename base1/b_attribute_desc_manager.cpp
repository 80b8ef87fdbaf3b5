#include "b_attribute_desc.h"

namespace base {

AttribDescManager& attribDescManager() {
  static AttribDescManager manager;
  return manager;
}

}  // namespace base
