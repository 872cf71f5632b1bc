#ifndef TARNIK_XML_TREE_H
#define TARNIK_XML_TREE_H

#include <atomic>
#include <cstddef>
#include <string_view>

#include <boost/smart_ptr/intrusive_ptr.hpp>

#include "xml/interned_name.h"

namespace Tarnik::Xml {

/// The memory of a tree's nodes, names, attributes and texts, with one reference count for all of
/// them.
///
/// All memory is freed together and no destructors of nodes run, so deleting a tree needs no
/// recursion, however deep it is. The object itself is in its first block.
class Tree {
 public:
  using Holder = boost::intrusive_ptr<Tree>;

  /// Sizes of the first block: for a single node created by a caller, and for a document.
  static constexpr std::size_t kNodeBlockBytes = 512;
  static constexpr std::size_t kDocumentBlockBytes = 4096;

  static Holder Create(std::size_t firstBlockBytes);

  Tree(const Tree&) = delete;
  Tree& operator=(const Tree&) = delete;

  /// The tree that now owns the nodes of this one: this tree unless it was joined to another.
  Tree& Current() noexcept {
    Tree* tree = this;
    while (tree->joinedTo_ != nullptr) {
      tree = tree->joinedTo_;
    }
    return *tree;
  }

  void IncRef() noexcept { Current().count_.fetch_add(1, std::memory_order_relaxed); }
  void DecRef() noexcept;
  long RefCount() noexcept { return Current().count_.load(std::memory_order_relaxed); }

  /// Joins two trees; references to either keep both alive from then on.
  static void Join(Tree& first, Tree& second) noexcept;

  /// Memory for `count` objects of `T`, whose destructors never run.
  template <class T>
  T* Allocate(std::size_t count = 1) {
    return static_cast<T*>(Current().AllocateBytes(count * sizeof(T), alignof(T)));
  }
  /// A copy of `text`.
  std::string_view Store(std::string_view text);
  /// A copy of `name`, which must be a qualified name.
  const InternedName* StoreName(std::string_view name);

 private:
  struct Block {
    Block* next;
    std::size_t size;  // with this header
  };

  Tree(Block* block, std::size_t blockBytes) noexcept;

  static Block* CreateBlock(std::size_t size);
  void* AllocateBytes(std::size_t bytes, std::size_t alignment);
  void* AllocateFromNewBlock(std::size_t bytes);
  void Destroy() noexcept;

  std::atomic<long> count_{0};
  Tree* joinedTo_ = nullptr;
  Block* firstBlock_;
  Block* lastBlock_;
  char* free_;
  char* freeEnd_;
  std::size_t totalBytes_;
};

inline void intrusive_ptr_add_ref(Tree* tree) noexcept {
  tree->IncRef();
}
inline void intrusive_ptr_release(Tree* tree) noexcept {
  tree->DecRef();
}

}  // namespace Tarnik::Xml

#endif
