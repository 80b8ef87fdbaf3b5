// MurmurHash3, x86 128-bit variant, for builds without the MurmurHash3 library (the Windows
// cross build: its Debian source package is not on every mirror). Written from the public
// description of the algorithm; a test compares it with the library where both exist.

#include "b_murmurhash3.h"

#include <cstring>

namespace base::detail {
namespace {

constexpr std::uint32_t rotl(std::uint32_t x, int r) { return (x << r) | (x >> (32 - r)); }

constexpr std::uint32_t mix(std::uint32_t h) {
  h ^= h >> 16;
  h *= 0x85ebca6bu;
  h ^= h >> 13;
  h *= 0xc2b2ae35u;
  h ^= h >> 16;
  return h;
}

constexpr std::uint32_t c1 = 0x239b961bu, c2 = 0xab0e9789u, c3 = 0x38b34ae5u, c4 = 0xa1e38b93u;

// One 32-bit lane of a block: scrambled and folded into its hash word.
constexpr std::uint32_t scramble(std::uint32_t k, std::uint32_t first, int r, std::uint32_t second) {
  return rotl(k * first, r) * second;
}

std::uint32_t loadLittle(const std::uint8_t* p) {
  return std::uint32_t(p[0]) | std::uint32_t(p[1]) << 8 | std::uint32_t(p[2]) << 16 | std::uint32_t(p[3]) << 24;
}

}  // namespace

void murmurHash3x86_128(const void* data, std::uint32_t size, std::uint32_t seed, std::uint32_t out[4]) {
  const auto* bytes = static_cast<const std::uint8_t*>(data);
  std::uint32_t h1 = seed, h2 = seed, h3 = seed, h4 = seed;
  const std::uint32_t blocks = size / 16;
  for (std::uint32_t i = 0; i < blocks; ++i) {
    const std::uint8_t* block = bytes + 16 * std::size_t(i);
    h1 ^= scramble(loadLittle(block), c1, 15, c2);
    h1 = (rotl(h1, 19) + h2) * 5 + 0x561ccd1bu;
    h2 ^= scramble(loadLittle(block + 4), c2, 16, c3);
    h2 = (rotl(h2, 17) + h3) * 5 + 0x0bcaa747u;
    h3 ^= scramble(loadLittle(block + 8), c3, 17, c4);
    h3 = (rotl(h3, 15) + h4) * 5 + 0x96cd1c35u;
    h4 ^= scramble(loadLittle(block + 12), c4, 18, c1);
    h4 = (rotl(h4, 13) + h1) * 5 + 0x32ac3b17u;
  }
  // The last 1 to 15 bytes, as four little-endian lanes padded with zeros.
  const std::uint8_t* tail = bytes + 16 * std::size_t(blocks);
  const std::uint32_t rest = size & 15;
  std::uint8_t padded[16] = {};
  std::memcpy(padded, tail, rest);
  if (rest > 12) h4 ^= scramble(loadLittle(padded + 12), c4, 18, c1);
  if (rest > 8) h3 ^= scramble(loadLittle(padded + 8), c3, 17, c4);
  if (rest > 4) h2 ^= scramble(loadLittle(padded + 4), c2, 16, c3);
  if (rest > 0) h1 ^= scramble(loadLittle(padded), c1, 15, c2);

  h1 ^= size;
  h2 ^= size;
  h3 ^= size;
  h4 ^= size;
  h1 += h2 + h3 + h4;
  h2 += h1;
  h3 += h1;
  h4 += h1;
  h1 = mix(h1);
  h2 = mix(h2);
  h3 = mix(h3);
  h4 = mix(h4);
  h1 += h2 + h3 + h4;
  h2 += h1;
  h3 += h1;
  h4 += h1;
  out[0] = h1;
  out[1] = h2;
  out[2] = h3;
  out[3] = h4;
}

}  // namespace base::detail
