#include "b_alloc.h"

#include "b_platform_system.h"

#include <cstdio>
#include <cstdlib>

namespace base {
namespace {

[[noreturn]] void outOfMemory(std::size_t size) {
  std::fprintf(stderr, "Unable to allocate %zu bytes!\n", size);
  throw std::bad_alloc();
}

}  // namespace

void* StdAllocPolicy::allocateBytes(std::size_t size, const char*, int, const char*, std::uint32_t) {
  // malloc(0) may answer null; a zero-byte request still gets a unique block.
  void* block = platform::allocateBytes(size ? size : 1);
  if (!block) outOfMemory(size);
  return block;
}

void StdAllocPolicy::deallocateBytes(void* pointer, std::uint32_t) { std::free(pointer); }

void* AlignedAllocPolicy::allocateBytes(std::size_t size, std::size_t alignment, const char*, int, const char*,
                                        std::uint32_t) {
  void* block = ::operator new(size ? size : 1, std::align_val_t(alignment), std::nothrow);
  if (!block) outOfMemory(size);
  return block;
}

void AlignedAllocPolicy::deallocateBytes(void* pointer, std::size_t alignment, std::uint32_t) {
  ::operator delete(pointer, std::align_val_t(alignment));
}

}  // namespace base
