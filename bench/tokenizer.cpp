#include "tokenizer.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <memory>
#include <new>
#include <stdexcept>
#include <string_view>
#include <type_traits>
#include <vector>

#include <expat.h>

namespace Bench {
namespace {

using Parser = std::unique_ptr<std::remove_pointer_t<XML_Parser>, decltype(&XML_ParserFree)>;

// Expat otherwise requests a salt from the system for each parser.
constexpr unsigned long kSalt = 0x5EED;
constexpr std::size_t kBlockSize = 16384;

/// Memory that is freed as a whole.
class Arena {
 public:
  void* Allocate(std::size_t size) {
    size = (size + alignof(void*) - 1) / alignof(void*) * alignof(void*);
    if (size > free_) {
      free_ = std::max(size, kBlockSize);
      blocks_.emplace_back(new char[free_]);
      next_ = blocks_.back().get();
    }
    void* result = next_;
    next_ += size;
    free_ -= size;
    return result;
  }

  std::string_view Copy(const char* text, std::size_t size) {
    char* copy = static_cast<char*>(Allocate(size));
    std::memcpy(copy, text, size);
    return {copy, size};
  }

 private:
  std::vector<std::unique_ptr<char[]>> blocks_;
  char* next_ = nullptr;
  std::size_t free_ = 0;
};

/// An element, or a text without attributes.
struct Node {
  Node* parent = nullptr;
  Node* lastChild = nullptr;
  Node* previous = nullptr;
  std::string_view text;
  /// Names and values by turns.
  std::string_view* attributes = nullptr;
  std::size_t attributeCount = 0;
};

/// The tree of one document, while it is read.
struct Tree {
  Arena arena;
  Node root;
  Node* current = &root;

  Node* Add(const char* text, std::size_t size) {
    Node* node = new (arena.Allocate(sizeof(Node))) Node;
    node->parent = current;
    node->previous = current->lastChild;
    node->text = arena.Copy(text, size);
    current->lastChild = node;
    return node;
  }
};

void OnStart(void* data, const char* name, const char** attributes) {
  Tree& tree = *static_cast<Tree*>(data);
  Node* node = tree.Add(name, std::strlen(name));
  std::size_t strings = 0;
  while (attributes[strings] != nullptr) {
    ++strings;
  }
  node->attributeCount = strings / 2;
  node->attributes =
      static_cast<std::string_view*>(tree.arena.Allocate(strings * sizeof(std::string_view)));
  for (std::size_t i = 0; i < strings; ++i) {
    new (node->attributes + i)
        std::string_view(tree.arena.Copy(attributes[i], std::strlen(attributes[i])));
  }
  tree.current = node;
}

void OnEnd(void* data, const char* /*name*/) {
  Tree& tree = *static_cast<Tree*>(data);
  tree.current = tree.current->parent;
}

void OnText(void* data, const char* text, int size) {
  static_cast<Tree*>(data)->Add(text, static_cast<std::size_t>(size));
}

}  // namespace

bool Tokenize(const std::string& xml) {
  Tree tree;
  const Parser parser(XML_ParserCreate("UTF-8"), XML_ParserFree);
  if (parser == nullptr) {
    throw std::runtime_error("Expat failed");
  }
  XML_SetHashSalt(parser.get(), kSalt);
  XML_SetUserData(parser.get(), &tree);
  XML_SetElementHandler(parser.get(), OnStart, OnEnd);
  XML_SetCharacterDataHandler(parser.get(), OnText);
  return XML_Parse(parser.get(), xml.data(), static_cast<int>(xml.size()), XML_TRUE) ==
             XML_STATUS_OK &&
         tree.root.lastChild != nullptr;
}

}  // namespace Bench
