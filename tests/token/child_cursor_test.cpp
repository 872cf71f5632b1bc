#include "token/child_cursor.h"

#include "support/parsed_xml.h"
#include "token/strict_rules.h"

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

// Shows elements only, and counts what it is asked.
class ElementsOnly final : public NodeFilter {
 public:
  bool IsVisible(const Tarnik::Xml::Node& node) const override {
    ++asked;
    return node.Kind() == Tarnik::Xml::NodeKind::kElement;
  }

  mutable int asked = 0;
};

TEST(ChildCursor, SharesOneFilterOfAnyKind) {
  Fragment fragment("text<a>text<b/></a>");
  const auto filter = std::make_shared<const ElementsOnly>();
  const ChildCursor outer(fragment.Root(), filter);
  EXPECT_TRUE(outer.IsAtElement("a"));
  EXPECT_EQ(filter->asked, 2);
  const ChildCursor inner = outer.Into(fragment.Element());
  EXPECT_TRUE(inner.IsAtElement("b"));
  EXPECT_EQ(filter->asked, 4);
  EXPECT_EQ(filter.use_count(), 3);
}

}  // namespace
}  // namespace SsoClient
