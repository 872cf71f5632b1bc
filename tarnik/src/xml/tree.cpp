#include "xml/tree.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <new>

namespace Tarnik::Xml {

namespace {

// The size of a block is a small fraction of its tree, since the free rest of the last block is
// wasted memory.
constexpr std::size_t kMinBlockBytes = 512;
constexpr std::size_t kMaxBlockBytes = 16384;
constexpr std::size_t kBlocksPerTree = 32;

}  // namespace

Tree::Holder Tree::Create(std::size_t firstBlockBytes) {
  Block* block = CreateBlock(firstBlockBytes);
  return Holder(new (block + 1) Tree(block, firstBlockBytes));
}

Tree::Tree(Block* block, std::size_t blockBytes) noexcept
    : firstBlock_(block),
      lastBlock_(block),
      free_(reinterpret_cast<char*>(this + 1)),
      freeEnd_(reinterpret_cast<char*>(block) + blockBytes),
      totalBytes_(blockBytes) {}

void Tree::DecRef() noexcept {
  Tree& current = Current();
  if (current.count_.fetch_sub(1, std::memory_order_acq_rel) == 1) {
    current.Destroy();
  }
}

void Tree::Join(Tree& first, Tree& second) noexcept {
  Tree* kept = &first.Current();
  Tree* joined = &second.Current();
  if (kept == joined) {
    return;
  }
  // The smaller tree points to the larger one, which limits the length of these chains to the
  // logarithm of the size.
  if (kept->totalBytes_ < joined->totalBytes_) {
    std::swap(kept, joined);
  }
  kept->lastBlock_->next = joined->firstBlock_;
  kept->lastBlock_ = joined->lastBlock_;
  kept->totalBytes_ += joined->totalBytes_;
  kept->count_.fetch_add(joined->count_.load(std::memory_order_relaxed), std::memory_order_relaxed);
  if (joined->freeEnd_ - joined->free_ > kept->freeEnd_ - kept->free_) {
    kept->free_ = joined->free_;
    kept->freeEnd_ = joined->freeEnd_;
  }
  joined->joinedTo_ = kept;
}

std::string_view Tree::Store(std::string_view text) {
  if (text.empty()) {
    return "";
  }
  char* copy = Allocate<char>(text.size());
  std::memcpy(copy, text.data(), text.size());
  return {copy, text.size()};
}

const InternedName* Tree::StoreName(std::string_view name) {
  const std::size_t colon = name.find(':');
  const bool prefixed = colon != std::string_view::npos;
  const std::size_t bytes = sizeof(InternedName) + name.size();
  auto* stored = static_cast<InternedName*>(Current().AllocateBytes(bytes, alignof(InternedName)));
  stored->length = static_cast<unsigned>(name.size());
  stored->prefixLength = prefixed ? static_cast<unsigned>(colon) & 0x7FFFFFFFU : 0;
  stored->isDeclaration = prefixed ? name.substr(0, colon) == "xmlns" : name == "xmlns";
  std::memcpy(static_cast<void*>(stored + 1), name.data(), name.size());
  return stored;
}

Tree::Block* Tree::CreateBlock(std::size_t size) {
  void* memory = std::malloc(size);
  if (memory == nullptr) {
    throw std::bad_alloc();
  }
  return new (memory) Block{nullptr, size};
}

void* Tree::AllocateBytes(std::size_t bytes, std::size_t alignment) {
  // An alignment is a power of two.
  const std::size_t padding = -reinterpret_cast<std::uintptr_t>(free_) & (alignment - 1);
  const auto room = static_cast<std::size_t>(freeEnd_ - free_);
  if (room < padding || room - padding < bytes) {
    return AllocateFromNewBlock(bytes);
  }
  // Characters fill a block from its end, so that they leave no gaps between nodes.
  if (alignment == 1) {
    freeEnd_ -= bytes;
    return freeEnd_;
  }
  char* result = free_ + padding;
  free_ = result + bytes;
  return result;
}

void* Tree::AllocateFromNewBlock(std::size_t bytes) {
  const std::size_t usual =
      std::clamp(totalBytes_ / kBlocksPerTree, kMinBlockBytes, kMaxBlockBytes);
  // Large pieces get a separate block, so that the rest of the current block stays usable.
  const bool large = bytes > usual / 4;
  const std::size_t size = large ? sizeof(Block) + bytes : usual;
  Block* block = CreateBlock(size);
  lastBlock_->next = block;
  lastBlock_ = block;
  totalBytes_ += size;
  char* result = reinterpret_cast<char*>(block + 1);
  if (!large) {
    free_ = result + bytes;
    freeEnd_ = reinterpret_cast<char*>(block) + size;
  }
  return result;
}

void Tree::Destroy() noexcept {
  // This object is in one of the blocks, so the loop must not use it.
  Block* block = firstBlock_;
  while (block != nullptr) {
    Block* next = block->next;
    explicit_bzero(block, block->size);
    std::free(block);
    block = next;
  }
}

}  // namespace Tarnik::Xml
