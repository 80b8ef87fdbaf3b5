#include "descriptions.h"

#include "b_attribute_desc.h"
#include "b_log.h"
#include "b_path.h"

namespace scenetool {

void loadDescriptions() {
  const base::string folder = base::getDirectory(base::getDirectory(base::getExecutablePath()) + "../data/attributes/");
  if (base::attribDescManager().loadFolder(folder) == 0) {
    base::log().message(base::logScene, base::logWarning,
                        "No attribute descriptions found in {}: attribute types and defaults are unknown", folder);
  }
}

}  // namespace scenetool
