#include <ssoclient/principal_id.h>

namespace SsoClient {
namespace {

TEST(PrincipalId, EqualsWithoutRegardToLetterCase) {
  EXPECT_TRUE((PrincipalId{"Alice", "Example.COM"} == PrincipalId{"alice", "example.com"}));
  EXPECT_TRUE((PrincipalId{"", ""} == PrincipalId{"", ""}));
}

TEST(PrincipalId, DiffersByNameOrDomain) {
  EXPECT_FALSE((PrincipalId{"alice", "a"} == PrincipalId{"alice", "b"}));
  EXPECT_FALSE((PrincipalId{"alice", "a"} == PrincipalId{"bob", "a"}));
  EXPECT_FALSE((PrincipalId{"alice", "a"} == PrincipalId{"alic", "a"}));
  EXPECT_FALSE((PrincipalId{"alic", "a"} == PrincipalId{"alice", "a"}));
  EXPECT_FALSE((PrincipalId{"alice", "a"} == PrincipalId{"a", "alice"}));
}

TEST(PrincipalId, EqualsItself) {
  const PrincipalId principal{"alice", "a"};
  const PrincipalId& same = principal;
  EXPECT_TRUE(principal == same);
}

TEST(PrincipalId, StopsAtTheFirstNul) {
  const PrincipalId a{std::string("alice\0x", 7), "d"};
  const PrincipalId b{std::string("ALICE\0y", 7), std::string("D\0z", 3)};
  EXPECT_TRUE(a == b);
}

TEST(PrincipalId, FoldsAsciiLettersOnly) {
  EXPECT_FALSE((PrincipalId{"\xC3\x84", "d"} == PrincipalId{"\xC3\xA4", "d"}));
  EXPECT_FALSE((PrincipalId{"a[", "d"} == PrincipalId{"a{", "d"}));
  EXPECT_FALSE((PrincipalId{"a@", "d"} == PrincipalId{"a`", "d"}));
}

}  // namespace
}  // namespace SsoClient
