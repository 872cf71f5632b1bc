#include "xml/expat_memory.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

const XML_Memory_Handling_Suite& Suite() {
  return ExpatMemory::Suite();
}

class ExpatMemoryTest : public testing::TestWithParam<std::size_t> {};

TEST_P(ExpatMemoryTest, AllocatesAlignedPiecesThatDoNotOverlap) {
  ExpatMemory memory;
  const ExpatMemory::Scope scope(memory);
  std::vector<unsigned char*> pieces;
  for (unsigned char i = 0; i < 40; ++i) {
    auto* piece = static_cast<unsigned char*>(Suite().malloc_fcn(GetParam()));
    ASSERT_NE(piece, nullptr);
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(piece) % alignof(std::max_align_t), 0U);
    std::memset(piece, i, GetParam());
    pieces.push_back(piece);
  }
  for (unsigned char i = 0; i < 40; ++i) {
    const std::vector<unsigned char> expected(GetParam(), i);
    EXPECT_EQ(std::vector<unsigned char>(pieces[i], pieces[i] + GetParam()), expected);
    Suite().free_fcn(pieces[i]);
  }
}

TEST_P(ExpatMemoryTest, KeepsTheContentOfAPieceThatGrows) {
  ExpatMemory memory;
  const ExpatMemory::Scope scope(memory);
  void* piece = Suite().realloc_fcn(nullptr, GetParam());
  ASSERT_NE(piece, nullptr);
  std::memset(piece, 'x', GetParam());
  for (const std::size_t factor : {2U, 50U}) {
    piece = Suite().realloc_fcn(piece, GetParam() * factor);
    ASSERT_NE(piece, nullptr);
    EXPECT_EQ(std::string(static_cast<char*>(piece), GetParam()), std::string(GetParam(), 'x'));
  }
  Suite().free_fcn(piece);
}

INSTANTIATE_TEST_SUITE_P(Sizes, ExpatMemoryTest, testing::Values(1, 24, 2047, 2048, 2049, 40000));

TEST(ExpatMemoryScopeTest, FreesNothingForNull) {
  Suite().free_fcn(nullptr);
}

TEST(ExpatMemoryScopeTest, AllocatesFromTheInnermostScope) {
  ExpatMemory outer;
  const ExpatMemory::Scope outerScope(outer);
  auto* first = static_cast<char*>(Suite().malloc_fcn(16));
  {
    ExpatMemory inner;
    const ExpatMemory::Scope innerScope(inner);
    ASSERT_NE(Suite().malloc_fcn(16), nullptr);
  }
  // The next piece of the outer memory directly follows its first one.
  auto* second = static_cast<char*>(Suite().malloc_fcn(16));
  EXPECT_EQ(second - first, 32);
}

}  // namespace
}  // namespace Tarnik::Testing
