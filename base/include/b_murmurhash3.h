#pragma once

#include "b_api.h"

#include <cstdint>

namespace base::detail {

/// MurmurHash3 x86 128-bit of `size` bytes with `seed` into `out`: what the MurmurHash3
/// library computes, for builds without it.
BASE1_API void murmurHash3x86_128(const void* data, std::uint32_t size, std::uint32_t seed, std::uint32_t out[4]);

}  // namespace base::detail
