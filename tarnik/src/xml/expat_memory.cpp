#include "xml/expat_memory.h"

#include <cstdlib>
#include <cstring>
#include <new>

namespace Tarnik::Xml {

namespace {

// A document of a few KB needs one block. Larger pieces are freed when Expat frees them, so that
// buffers which grow with the document do not accumulate.
constexpr std::size_t kBlockBytes = 16384;
constexpr std::size_t kLargestSmall = 2048;

// Precedes each piece.
struct alignas(std::max_align_t) Header {
  std::size_t size;  // of the piece, without the header
};

Header* HeaderOf(void* memory) noexcept {
  return static_cast<Header*>(memory) - 1;
}

std::size_t RoundUp(std::size_t size) noexcept {
  return (size + alignof(Header) - 1) / alignof(Header) * alignof(Header);
}

thread_local ExpatMemory* openMemory = nullptr;

}  // namespace

ExpatMemory::Scope::Scope(ExpatMemory& memory) noexcept : outer_(openMemory) {
  openMemory = &memory;
}

ExpatMemory::Scope::~Scope() {
  openMemory = outer_;
}

ExpatMemory::~ExpatMemory() {
  auto used = static_cast<std::size_t>(free_ - reinterpret_cast<char*>(blocks_));
  while (blocks_ != nullptr) {
    Block* next = blocks_->next;
    explicit_bzero(blocks_, used);
    std::free(blocks_);
    blocks_ = next;
    used = kBlockBytes;
  }
}

const XML_Memory_Handling_Suite& ExpatMemory::Suite() noexcept {
  static const XML_Memory_Handling_Suite suite{Allocate, Reallocate, Free};
  return suite;
}

void* ExpatMemory::Allocate(std::size_t size) noexcept {
  if (size <= kLargestSmall) {
    return openMemory->AllocateSmall(RoundUp(size));
  }
  if (size > static_cast<std::size_t>(-1) - sizeof(Header)) {
    return nullptr;
  }
  void* memory = std::malloc(sizeof(Header) + size);
  return memory == nullptr ? nullptr : new (memory) Header{size} + 1;
}

void* ExpatMemory::Reallocate(void* memory, std::size_t size) noexcept {
  if (memory == nullptr) {
    return Allocate(size);
  }
  const std::size_t oldSize = HeaderOf(memory)->size;
  if (size <= oldSize) {
    return memory;
  }
  void* larger = Allocate(size);
  if (larger != nullptr) {
    std::memcpy(larger, memory, oldSize);
    Free(memory);
  }
  return larger;
}

void ExpatMemory::Free(void* memory) noexcept {
  if (memory == nullptr || HeaderOf(memory)->size <= kLargestSmall) {
    return;
  }
  Header* header = HeaderOf(memory);
  explicit_bzero(header, sizeof(Header) + header->size);
  std::free(header);
}

void* ExpatMemory::AllocateSmall(std::size_t size) noexcept {
  const std::size_t needed = sizeof(Header) + size;
  if (static_cast<std::size_t>(freeEnd_ - free_) < needed) {
    void* memory = std::malloc(kBlockBytes);
    if (memory == nullptr) {
      return nullptr;
    }
    blocks_ = new (memory) Block{blocks_};
    free_ = reinterpret_cast<char*>(blocks_ + 1);
    freeEnd_ = reinterpret_cast<char*>(memory) + kBlockBytes;
  }
  auto* header = new (free_) Header{size};
  free_ += needed;
  return header + 1;
}

}  // namespace Tarnik::Xml
