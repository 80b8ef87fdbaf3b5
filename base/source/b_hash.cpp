#include "b_hash.h"

namespace base {

Hash::~Hash() = default;

}  // namespace base
