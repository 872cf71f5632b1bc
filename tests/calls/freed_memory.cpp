#include "calls/freed_memory.h"

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string>
#include <utility>

#include <malloc.h>

namespace SsoClient::Testing {

namespace {

std::atomic<FreedMemory*> current{nullptr};

void Release(void* memory) noexcept {
  if (auto* watch = current.load(); watch != nullptr && memory != nullptr) {
    watch->Search(memory);
  }
  std::free(memory);
}

}  // namespace

FreedMemory::FreedMemory(std::string text) : text_(std::move(text)), piece_(text_.size()) {
  current = this;
}

FreedMemory::FreedMemory(std::string text, std::size_t piece)
    : text_(std::move(text)), piece_(piece) {
  current = this;
}

FreedMemory::~FreedMemory() {
  current = nullptr;
}

void FreedMemory::Search(const void* memory) noexcept {
  const std::size_t size = ::malloc_usable_size(const_cast<void*>(memory));
  for (std::size_t at = 0; at + piece_ <= text_.size(); ++at) {
    if (::memmem(memory, size, text_.data() + at, piece_) != nullptr) {
      ++finds_;
      return;
    }
  }
}

}  // namespace SsoClient::Testing

void* operator new(std::size_t size) {
  // Zero-filled, so that it holds nothing from an earlier owner.
  void* memory = std::calloc(1, size != 0 ? size : 1);
  if (memory == nullptr) {
    throw std::bad_alloc();
  }
  return memory;
}

void operator delete(void* memory) noexcept {
  SsoClient::Testing::Release(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
  SsoClient::Testing::Release(memory);
}
