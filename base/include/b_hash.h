#pragma once

#include "b_alloc.h"
#include "b_api.h"
#include "b_containers.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace base {

/// A running hash that a stream can feed with the blocks it reads.
class BASE1_API Hash : public HostAllocated {
 public:
  virtual ~Hash();
  virtual void update(const void* data, std::size_t size) = 0;
  /// A new hash in the same state.
  virtual std::unique_ptr<Hash> clone() const = 0;
  /// Back to the state before the first update.
  virtual void reset() = 0;
  virtual base::vector<std::uint8_t> digest() const = 0;
};

/// The first 64 bits of the MurmurHash3 (x86, 128-bit) digest of `size` bytes with seed 0:
/// the MurmurHash3 library's, or where a build lacks it, the same algorithm's own code.
BASE1_API std::uint64_t murmurHash3(const void* data, std::size_t size);

}  // namespace base
