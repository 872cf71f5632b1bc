#include "token/child_cursor.h"

#include "support/parsed_xml.h"
#include "token/element_rules.h"

namespace SsoClient {
namespace {

using TestSupport::Fragment;

TEST(ChildCursor, WalksVisibleChildrenInOrder) {
  Fragment fragment(" <!--c--> <a/>\n<b/>text<c/> <!--d-->");
  ChildCursor& cursor = fragment.Cursor();
  EXPECT_TRUE(cursor.IsAtElement("a"));
  cursor.Advance();
  EXPECT_TRUE(cursor.IsAtElement("b"));
  cursor.Advance();
  ASSERT_FALSE(cursor.IsAtEnd());
  EXPECT_EQ(cursor.Current()->Kind(), Tarnik::Xml::NodeKind::kText);
  EXPECT_FALSE(cursor.IsAtElement("text"));
  cursor.Advance();
  EXPECT_TRUE(cursor.IsAtElement("c"));
  cursor.Advance();
  EXPECT_TRUE(cursor.IsAtEnd());
  EXPECT_EQ(cursor.Current(), nullptr);
  EXPECT_FALSE(cursor.IsAtElement("c"));
}

TEST(ChildCursor, IsAtEndWhenNothingIsVisible) {
  EXPECT_TRUE(Fragment("").Cursor().IsAtEnd());
  EXPECT_TRUE(Fragment(" <!--c--> ").Cursor().IsAtEnd());
}

TEST(ChildCursor, GoesIntoAnElementWithTheSameFilter) {
  Fragment fragment("<a> <!--c--><b/></a>");
  const ChildCursor inner = fragment.Cursor().Into(fragment.Element());
  EXPECT_EQ(&inner.Parent(), &fragment.Element());
  EXPECT_TRUE(inner.IsAtElement("b"));
}

}  // namespace
}  // namespace SsoClient
