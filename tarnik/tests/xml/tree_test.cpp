#include "xml/tree.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

TEST(TreeTest, AllocatesAlignedMemory) {
  const Tree::Holder tree = Tree::Create(Tree::kNodeBlockBytes);
  for (int round = 0; round < 500; ++round) {
    tree->Allocate<char>(static_cast<std::size_t>(round % 7 + 1));
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(tree->Allocate<void*>()) % alignof(void*), 0U);
  }
}

TEST(TreeTest, KeepsTextsOfEverySize) {
  const Tree::Holder tree = Tree::Create(Tree::kNodeBlockBytes);
  std::vector<std::string_view> stored;
  for (std::size_t size = 0; size < 5000; size += 37) {
    stored.push_back(tree->Store(std::string(size, static_cast<char>('a' + size % 26))));
  }
  stored.push_back(tree->Store(std::string(1 << 20, 'z')));
  for (const std::string_view text : stored) {
    EXPECT_EQ(text.find_first_not_of(text.empty() ? ' ' : text.front()), std::string_view::npos);
  }
  EXPECT_EQ(stored.back().size(), std::size_t{1} << 20);
}

}  // namespace
}  // namespace Tarnik::Testing
