#include "token/child_cursor.h"

#include <tarnik/xml/character_nodes.h>

#include "support/parsed_xml.h"

namespace SsoClient {
namespace {

bool IsFirstChildVisible(const std::string& content) {
  const auto document = TestSupport::ParseXml("<r>" + content + "</r>");
  return SkipWsAndCommentsFilter().IsVisible(*document->RootElement()->FirstChild());
}

TEST(SkipWsAndCommentsFilter, HidesComments) {
  EXPECT_FALSE(IsFirstChildVisible("<!--text-->"));
  EXPECT_FALSE(IsFirstChildVisible("<!---->"));
}

TEST(SkipWsAndCommentsFilter, HidesTextOfWhiteSpaceAlone) {
  EXPECT_FALSE(IsFirstChildVisible(" "));
  EXPECT_FALSE(IsFirstChildVisible("\t"));
  EXPECT_FALSE(IsFirstChildVisible("\n"));
  EXPECT_FALSE(IsFirstChildVisible("&#13;"));
  EXPECT_FALSE(IsFirstChildVisible("\t\n &#13; \n"));
  EXPECT_FALSE(IsFirstChildVisible("<![CDATA[  ]]>"));
}

TEST(SkipWsAndCommentsFilter, HidesEmptyText) {
  Tarnik::Ref<Tarnik::Xml::TextNode> text;
  Tarnik::Xml::CreateTextNode(text);
  EXPECT_FALSE(SkipWsAndCommentsFilter().IsVisible(*text));
}

TEST(SkipWsAndCommentsFilter, ShowsOtherText) {
  EXPECT_TRUE(IsFirstChildVisible("x"));
  EXPECT_TRUE(IsFirstChildVisible("\n x"));
  EXPECT_TRUE(IsFirstChildVisible("\xC2\xA0"));  // no-break space is not XML's white space
}

TEST(SkipWsAndCommentsFilter, ShowsElementsAndProcessingInstructions) {
  EXPECT_TRUE(IsFirstChildVisible("<e/>"));
  EXPECT_TRUE(IsFirstChildVisible("<?target?>"));
}

}  // namespace
}  // namespace SsoClient
