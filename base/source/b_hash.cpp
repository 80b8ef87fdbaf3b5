#include "b_hash.h"

#include "b_murmurhash3.h"

#ifdef MESHPORT_HAVE_MURMURHASH
#  include <murmurhash.h>
#endif

#include <algorithm>
#include <cstring>
#include <limits>

namespace base {

Hash::~Hash() = default;

std::uint64_t murmurHash3(const void* data, std::size_t size) {
  // 32-bit lengths; larger blocks are beyond any list the forms can hold.
  const auto length =
      static_cast<std::uint32_t>(std::min<std::size_t>(size, std::numeric_limits<std::uint32_t>::max()));
  std::uint32_t digest[4];
#ifdef MESHPORT_HAVE_MURMURHASH
  lmmh_x86_128(data, length, /*seed=*/0, digest);
#else
  detail::murmurHash3x86_128(data, length, /*seed=*/0, digest);
#endif
  std::uint64_t first;
  std::memcpy(&first, digest, sizeof first);
  return first;
}

}  // namespace base
