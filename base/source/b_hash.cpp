#include "b_hash.h"

#ifdef MESHPORT_HAVE_MURMURHASH
#  include <murmurhash.h>
#endif

#include <algorithm>
#include <cstring>
#include <limits>

namespace base {

Hash::~Hash() = default;

std::uint64_t murmurHash3(const void* data, std::size_t size) {
#ifdef MESHPORT_HAVE_MURMURHASH
  // The library takes 32-bit lengths; larger blocks are beyond any list the forms can hold.
  std::uint32_t digest[4];
  lmmh_x86_128(data, static_cast<unsigned>(std::min<std::size_t>(size, std::numeric_limits<unsigned>::max())),
               /*seed=*/0, digest);
  std::uint64_t first;
  std::memcpy(&first, digest, sizeof first);
  return first;
#else
  (void)data;
  (void)size;
  return 0;
#endif
}

}  // namespace base
