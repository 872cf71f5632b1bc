#include "xml/builders.h"

#include <gmock/gmock.h>
#include <tarnik/core/exception.h>

#include "support/thrown_message.h"
#include "xml/built_xml.h"
#include "xml/unsendable_texts.h"

namespace SsoClient {
namespace {

using TestSupport::ThrownMessage;

TEST(ElementBuilderImplTest, SetsAttributesInNameOrder) {
  const ElementBuilderImpl builder("wsu", "Timestamp", {{"xmlns:wsu", "U"}, {"wsu:Id", "I"}});
  const auto element = Testing::Built(builder);
  ASSERT_EQ(element->AttributeCount(), 2U);
  EXPECT_EQ(element->AttributeAt(0).Name(), "wsu:Id");
  EXPECT_EQ(element->AttributeAt(0).Value(), "I");
  EXPECT_EQ(element->AttributeAt(1).Name(), "xmlns:wsu");
  EXPECT_EQ(element->AttributeAt(1).Value(), "U");
  EXPECT_EQ(element->QualifiedNameText(), "wsu:Timestamp");
  EXPECT_EQ(element->FirstChild(), nullptr);
}

TEST(ElementBuilderImplTest, BuildsAnUnprefixedElement) {
  EXPECT_EQ(Testing::Built(ElementBuilderImpl("", "Plain", {}))->QualifiedNameText(), "Plain");
}

TEST(ElementBuilderImplTest, ReplacesWhatTheOutputHeld) {
  const ElementBuilderImpl builder("a", "New", {});
  Tarnik::Ref<Tarnik::Xml::ElementNode> out;
  Tarnik::Xml::CreateElementNode("a", "Old", out);
  const auto old = out;
  builder.Build(out);
  EXPECT_EQ(out->LocalName(), "New");
  EXPECT_EQ(old->LocalName(), "Old");
  EXPECT_EQ(old->FirstChild(), nullptr);
}

TEST(ElementBuilderImplTest, EachBuildMakesANewElement) {
  const ElementBuilderImpl builder("a", "E", {});
  EXPECT_NE(Testing::Built(builder), Testing::Built(builder));
}

TEST(ElementBuilderImplTest, PassesOnWhatAnAttributeRefuses) {
  for (const auto& text : Testing::UnsendableTexts()) {
    const ElementBuilderImpl builder("rsa-advice", "Advice", {{"AdviceSource", text}});
    EXPECT_EQ(
        ThrownMessage<Tarnik::InvalidArgumentException>([&] { Testing::Built(builder); }),
        "Attribute 'AdviceSource' of element 'rsa-advice:Advice' holds what XML cannot carry: "
        "a control character or bytes that are not UTF-8.")
        << testing::PrintToString(text);
  }
}

TEST(ElementBuilderImplTest, PassesOnWhatNamesAreRefused) {
  const auto failure = [](const char* prefix, const char* localName,
                          const AttributeList& attributes) {
    const ElementBuilderImpl builder(prefix, localName, attributes);
    return ThrownMessage<Tarnik::InvalidArgumentException>([&] { Testing::Built(builder); });
  };
  EXPECT_EQ(failure("a", "", {}), "The prefix and the local name of an element must be NCNames.");
  EXPECT_EQ(failure("a", "E", {{"b c", ""}}),
            "An attribute name of element 'a:E' is not a qualified name.");
}

TEST(ElementBuilderImplTest, EscapesWhatXmlCanCarry) {
  const std::string value = "<&>\"'\r\n\t]]>";
  const auto text = Testing::BuiltXml(ElementBuilderImpl("", "E", {{"a", value}}));
  EXPECT_EQ(Testing::ParseXml(text)->RootElement()->FindAttribute("a"), value);
}

}  // namespace
}  // namespace SsoClient
