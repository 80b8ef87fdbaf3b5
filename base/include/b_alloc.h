#pragma once

#include "b_api.h"

#include <cstddef>
#include <cstdint>
#include <limits>
#include <new>

namespace base {

/// The host allocator. Every request names where it came from. When no memory can be had,
/// "Unable to allocate <size> bytes!" goes to standard error and std::bad_alloc is thrown.
struct BASE1_API StdAllocPolicy {
  static void* allocateBytes(std::size_t size, const char* file, int line, const char* function,
                             std::uint32_t flags = 0);
  static void deallocateBytes(void* pointer, std::uint32_t flags = 0);
};

/// Aligned blocks from the host allocator; the same failure behaviour.
struct BASE1_API AlignedAllocPolicy {
  static void* allocateBytes(std::size_t size, std::size_t alignment, const char* file, int line,
                             const char* function, std::uint32_t flags = 0);
  static void deallocateBytes(void* pointer, std::size_t alignment, std::uint32_t flags = 0);
};

/// Blocks aligned to `Alignment` bytes (a power of two).
template <std::size_t Alignment>
struct StdAlignAllocPolicy {
  static_assert((Alignment & (Alignment - 1)) == 0, "alignment must be a power of two");
  static void* allocateBytes(std::size_t size, const char* file, int line, const char* function,
                             std::uint32_t flags = 0) {
    return AlignedAllocPolicy::allocateBytes(size, Alignment, file, line, function, flags);
  }
  static void deallocateBytes(void* pointer, std::uint32_t flags = 0) {
    AlignedAllocPolicy::deallocateBytes(pointer, Alignment, flags);
  }
};

/// The policy that plain containers use.
using AllocPolicy = StdAllocPolicy;

/// A standard allocator over the host allocator, for the standard containers.
template <class T>
struct Allocator {
  using value_type = T;

  Allocator() noexcept = default;
  template <class U>
  Allocator(const Allocator<U>&) noexcept {}

  T* allocate(std::size_t count) {
    if (count > std::numeric_limits<std::size_t>::max() / sizeof(T)) throw std::bad_array_new_length();
    void* block = StdAllocPolicy::allocateBytes(count * sizeof(T), __FILE__, __LINE__, "base::Allocator::allocate");
    return static_cast<T*>(block);
  }
  void deallocate(T* pointer, std::size_t) noexcept { StdAllocPolicy::deallocateBytes(pointer); }

  template <class U>
  bool operator==(const Allocator<U>&) const noexcept {
    return true;
  }
};

/// Class-level operator new/delete over the host allocator, for reference-counted objects.
struct HostAllocated {
  static void* operator new(std::size_t size) {
    return StdAllocPolicy::allocateBytes(size, __FILE__, __LINE__, "base::HostAllocated::new");
  }
  static void operator delete(void* pointer) noexcept { StdAllocPolicy::deallocateBytes(pointer); }
};

}  // namespace base
