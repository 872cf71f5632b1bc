#include "faults/failing_allocation.h"

#include <atomic>
#include <cstdlib>
#include <new>

namespace SsoClient::Access::Testing {
namespace {

std::atomic<bool> isArmed{false};
std::atomic<std::size_t> callsToGo{0};
std::atomic<bool> hasHappened{false};

bool Fails() noexcept {
  if (!isArmed || hasHappened || callsToGo-- != 0) {
    return false;
  }
  hasHappened = true;
  return true;
}

}  // namespace

FailingAllocation::FailingAllocation(std::size_t index) noexcept {
  callsToGo = index;
  hasHappened = false;
  isArmed = true;
}

FailingAllocation::~FailingAllocation() {
  isArmed = false;
}

bool FailingAllocation::HasHappened() const noexcept {
  return hasHappened;
}

}  // namespace SsoClient::Access::Testing

void* operator new(std::size_t size) {
  void* const memory = SsoClient::Access::Testing::Fails() ? nullptr : std::malloc(size);
  if (memory == nullptr) {
    throw std::bad_alloc();
  }
  return memory;
}

void operator delete(void* memory) noexcept {
  std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
  std::free(memory);
}
