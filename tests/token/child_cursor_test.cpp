#include "token/child_cursor.h"

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/ref.h>
#include <tarnik/xml/character_nodes.h>

#include "support/fragment.h"
#include "support/namespaces.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"
#include "token/strict_rules.h"

namespace SsoClient::Testing {
namespace {

bool IsFirstChildVisible(const std::string& content) {
  const auto document = ParseXml("<r>" + content + "</r>");
  return SkipWsAndCommentsFilter().IsVisible(*document->RootElement()->FirstChild());
}

TEST(SkipWsAndCommentsFilterTest, HidesComments) {
  EXPECT_FALSE(IsFirstChildVisible("<!--text-->"));
  EXPECT_FALSE(IsFirstChildVisible("<!---->"));
}

TEST(SkipWsAndCommentsFilterTest, HidesTextOfWhiteSpaceOnly) {
  EXPECT_FALSE(IsFirstChildVisible(" "));
  EXPECT_FALSE(IsFirstChildVisible("\t"));
  EXPECT_FALSE(IsFirstChildVisible("\n"));
  EXPECT_FALSE(IsFirstChildVisible("&#13;"));
  EXPECT_FALSE(IsFirstChildVisible("\t\n &#13; \n"));
  EXPECT_FALSE(IsFirstChildVisible("<![CDATA[  ]]>"));
}

TEST(SkipWsAndCommentsFilterTest, HidesEmptyText) {
  Tarnik::Ref<Tarnik::Xml::TextNode> text;
  Tarnik::Xml::CreateTextNode(text);
  EXPECT_FALSE(SkipWsAndCommentsFilter().IsVisible(*text));
}

TEST(SkipWsAndCommentsFilterTest, ShowsOtherText) {
  EXPECT_TRUE(IsFirstChildVisible("x"));
  EXPECT_TRUE(IsFirstChildVisible("\n x"));
  EXPECT_TRUE(IsFirstChildVisible("\xC2\xA0"));  // a no-break space is not white space in XML
}

TEST(SkipWsAndCommentsFilterTest, ShowsElementsAndProcessingInstructions) {
  EXPECT_TRUE(IsFirstChildVisible("<e/>"));
  EXPECT_TRUE(IsFirstChildVisible("<?target?>"));
}

TEST(ChildCursorTest, WalksVisibleChildrenInOrder) {
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

TEST(ChildCursorTest, IsAtEndWhenNothingIsVisible) {
  EXPECT_TRUE(Fragment("").Cursor().IsAtEnd());
  EXPECT_TRUE(Fragment(" <!--c--> ").Cursor().IsAtEnd());
}

TEST(ChildCursorTest, GoesIntoAnElementWithTheSameFilter) {
  Fragment fragment("<a> <!--c--><b/></a>");
  const ChildCursor inner = fragment.Cursor().Into(fragment.Element());
  EXPECT_EQ(&inner.Parent(), &fragment.Element());
  EXPECT_TRUE(inner.IsAtElement("b"));
}

TEST(ChildCursorTest, TakesTheElementItIsAtAndAdvances) {
  Fragment fragment("<saml2:A/> <!--c--> <saml2:B/>");
  ChildCursor& cursor = fragment.Cursor();
  EXPECT_EQ(&cursor.TakeElement("A", kSamlNamespace), &fragment.Element());
  EXPECT_TRUE(cursor.IsAtElement("B"));
  EXPECT_EQ(cursor.TakeElement("B", kSamlNamespace).LocalName(), "B");
  EXPECT_TRUE(cursor.IsAtEnd());
}

TEST(ChildCursorTest, StaysBeforeAnElementThatItDoesNotTake) {
  Fragment fragment("<saml2:A/>");
  ChildCursor& cursor = fragment.Cursor();
  EXPECT_EQ(ThrownMessage<ParseException>([&] { cursor.TakeElement("B", kSamlNamespace); }),
            "Expected element 'B' not found.");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { cursor.TakeElement("A", kDsigNamespace); }),
            "Element 'saml2:A' has unexpected namespace");
  EXPECT_TRUE(cursor.IsAtElement("A"));
  cursor.Advance();
  EXPECT_EQ(ThrownMessage<ParseException>([&] { cursor.TakeElement("A", kSamlNamespace); }),
            "Expected element 'A' not found.");
}

TEST(ChildCursorTest, ExpectsItsEnd) {
  Fragment fragment("<saml2:A/> ");
  ChildCursor& cursor = fragment.Cursor();
  EXPECT_EQ(ThrownMessage<ParseException>([&] { cursor.ExpectEnd("There is more"); }),
            "There is more");
  cursor.Advance();
  EXPECT_NO_THROW(cursor.ExpectEnd("There is more"));
}

// Shows only elements, and counts its calls.
class ElementsOnly final : public NodeFilter {
 public:
  bool IsVisible(const Tarnik::Xml::Node& node) const override {
    ++asked;
    return node.Kind() == Tarnik::Xml::NodeKind::kElement;
  }

  mutable int asked = 0;
};

TEST(ChildCursorTest, SharesOneFilterOfAnyKind) {
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
}  // namespace SsoClient::Testing
