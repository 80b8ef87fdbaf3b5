#include "ply_body.h"

namespace ply::detail {

void warnEndedEarly(const Element& element, std::uint64_t read) {
  base::log().message(base::logScene, base::logWarning, "The data ends early in element '{}': {} of {} instances read",
                      base::clipped(displayName(element)), read, element.count);
}

BinaryPlan::BinaryPlan(const Element& element) {
  std::uint32_t offset = 0;
  for (const Property& property : element.properties) {
    if (property.isList) {
      offsets.clear();
      return;
    }
    base::append(offsets, offset);
    offset += dataTypeSize(property.type);
  }
  recordSize = offset;
}

}  // namespace ply::detail
