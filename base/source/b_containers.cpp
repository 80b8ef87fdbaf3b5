#include "b_containers.h"

#include <limits>

namespace base {

std::size_t grownCapacity(std::size_t capacity, std::size_t elementSize, std::size_t needed) {
  constexpr std::size_t oneMiB = 0x100000;
  constexpr std::size_t halfGiB = 0x20000000;
  constexpr std::size_t thirdLimit = 0x41800000;
  std::size_t grown = 1;
  if (capacity > 0) {
    const std::size_t bytes = capacity * elementSize;
    std::size_t step = capacity / 4;
    if (bytes <= oneMiB) {
      step = capacity;
    } else if (bytes <= halfGiB) {
      step = capacity / 2;
    } else if (bytes <= thirdLimit) {
      step = capacity / 3;
    }
    grown = capacity > std::numeric_limits<std::size_t>::max() - step ? capacity : capacity + step;
  }
  return grown < needed ? needed : grown;
}

}  // namespace base
