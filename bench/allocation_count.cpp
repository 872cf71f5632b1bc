#include "allocation_count.h"

#include <algorithm>
#include <cstdlib>
#include <new>

namespace {

thread_local std::size_t allocations = 0;

}  // namespace

namespace Bench {

std::size_t CountAllocations() noexcept {
  return allocations;
}

}  // namespace Bench

void* operator new(std::size_t size) {
  ++allocations;
  if (void* const memory = std::malloc(std::max<std::size_t>(size, 1))) {
    return memory;
  }
  throw std::bad_alloc();
}

void operator delete(void* memory) noexcept {
  std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
  std::free(memory);
}
