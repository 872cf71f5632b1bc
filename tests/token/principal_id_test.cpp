#include <cstddef>
#include <new>
#include <string>

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <ssoclient/principal_id.h>

namespace SsoClient::Testing {
namespace {

TEST(PrincipalIdTest, IgnoresLetterCase) {
  EXPECT_TRUE((PrincipalId{"Alice", "Example.COM"} == PrincipalId{"alice", "example.com"}));
  EXPECT_TRUE((PrincipalId{"", ""} == PrincipalId{"", ""}));
  EXPECT_TRUE((PrincipalId{"ABCDEFGHIJKLMNOPQRSTUVWXYZ", "abcdefghijklmnopqrstuvwxyz"} ==
               PrincipalId{"abcdefghijklmnopqrstuvwxyz", "ABCDEFGHIJKLMNOPQRSTUVWXYZ"}));
}

TEST(PrincipalIdTest, DiffersByNameOrDomain) {
  EXPECT_FALSE((PrincipalId{"alice", "a"} == PrincipalId{"alice", "b"}));
  EXPECT_FALSE((PrincipalId{"alice", "a"} == PrincipalId{"bob", "a"}));
  EXPECT_FALSE((PrincipalId{"alice", "a"} == PrincipalId{"alic", "a"}));
  EXPECT_FALSE((PrincipalId{"alic", "a"} == PrincipalId{"alice", "a"}));
  EXPECT_FALSE((PrincipalId{"alice", "a"} == PrincipalId{"a", "alice"}));
}

TEST(PrincipalIdTest, EqualsItself) {
  const PrincipalId principal{"alice", "a"};
  const PrincipalId& same = principal;
  EXPECT_TRUE(principal == same);
}

// The object is on a page that is not readable during the comparison.
TEST(PrincipalIdTest, EqualsItselfWithoutReadingItsStrings) {
  const auto pageSize = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
  void* page = mmap(nullptr, pageSize, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  ASSERT_NE(page, MAP_FAILED);
  auto* principal = new (page) PrincipalId{"alice", "a"};
  ASSERT_EQ(mprotect(page, pageSize, PROT_NONE), 0);
  const PrincipalId& same = *principal;
  EXPECT_TRUE(*principal == same);
  ASSERT_EQ(mprotect(page, pageSize, PROT_READ | PROT_WRITE), 0);
  principal->~PrincipalId();
  munmap(page, pageSize);
}

// The domain is on a page that is not readable during the comparison.
TEST(PrincipalIdTest, ComparesTheDomainsOnlyWhenTheNamesMatch) {
  const auto pageSize = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
  void* pages =
      mmap(nullptr, 2 * pageSize, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  ASSERT_NE(pages, MAP_FAILED);
  char* second = static_cast<char*>(pages) + pageSize;
  auto* principal = new (second - offsetof(PrincipalId, domain)) PrincipalId{"alice", "a"};
  ASSERT_EQ(mprotect(second, pageSize, PROT_NONE), 0);
  EXPECT_FALSE((*principal == PrincipalId{"bob", "a"}));
  ASSERT_EQ(mprotect(second, pageSize, PROT_READ | PROT_WRITE), 0);
  principal->~PrincipalId();
  munmap(pages, 2 * pageSize);
}

TEST(PrincipalIdTest, StopsAtTheFirstNul) {
  const PrincipalId a{std::string("alice\0x", 7), "d"};
  const PrincipalId b{std::string("ALICE\0y", 7), std::string("D\0z", 3)};
  EXPECT_TRUE(a == b);
}

TEST(PrincipalIdTest, StopsAtTheFirstNulWhateverFollowsIt) {
  const PrincipalId plain{"alice", "d"};
  const PrincipalId longer{std::string("alice\0more", 10), std::string("d\0", 2)};
  EXPECT_TRUE(plain == longer);
  EXPECT_TRUE(longer == plain);
  const PrincipalId empty{std::string("\0alice", 6), ""};
  EXPECT_TRUE((PrincipalId{"", std::string("\0d", 2)} == empty));
  EXPECT_FALSE((PrincipalId{std::string("alic\0e", 6), "d"} == plain));
}

TEST(PrincipalIdTest, FoldsAsciiLettersOnly) {
  EXPECT_FALSE((PrincipalId{"\xC3\x84", "d"} == PrincipalId{"\xC3\xA4", "d"}));
  EXPECT_FALSE((PrincipalId{"a[", "d"} == PrincipalId{"a{", "d"}));
  EXPECT_FALSE((PrincipalId{"a@", "d"} == PrincipalId{"a`", "d"}));
}

}  // namespace
}  // namespace SsoClient::Testing
