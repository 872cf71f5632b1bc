#include "xml/builders.h"

#include <gmock/gmock.h>
#include <tarnik/core/exception.h>

#include <algorithm>
#include <array>
#include <new>
#include <string>

#include "support/thrown_message.h"
#include "xml/built_xml.h"
#include "xml/unsendable_texts.h"

namespace SsoClient {
namespace {

using Tarnik::Xml::TextNode;

TEST(TextElementBuilderImplTest, BuildsAttributesAndOneText) {
  const TextElementBuilderImpl builder("wsse", "Password", "pw", {{"Type", "T"}});
  EXPECT_EQ(Testing::BuiltXml(builder), R"(<wsse:Password Type="T">pw</wsse:Password>)");
}

TEST(TextElementBuilderImplTest, AnEmptyTextIsStillATextNode) {
  const auto element = Testing::Built(TextElementBuilderImpl("a", "E", "", {}));
  const auto* text = dynamic_cast<const TextNode*>(element->FirstChild());
  ASSERT_NE(text, nullptr);
  EXPECT_EQ(text->Text(), "");
  EXPECT_EQ(element->LastChild(), text);
}

TEST(TextElementBuilderImplTest, PassesOnWhatATextRefuses) {
  for (const auto& unsendable : Testing::UnsendableTexts()) {
    const TextElementBuilderImpl builder("wsse", "Password", unsendable, {});
    EXPECT_EQ(
        TestSupport::ThrownMessage<Tarnik::InvalidArgumentException>(
            [&] { Testing::Built(builder); }),
        "The text of element 'wsse:Password' holds what XML cannot carry: a control character "
        "or bytes that are not UTF-8.")
        << testing::PrintToString(unsendable);
  }
}

TEST(TextElementBuilderImplTest, ReplacesWhatTheOutputHeld) {
  Tarnik::Ref<Tarnik::Xml::ElementNode> out;
  Tarnik::Xml::CreateElementNode("a", "Old", out);
  const auto old = out;
  TextElementBuilderImpl("a", "New", "text", {}).Build(out);
  EXPECT_EQ(Testing::XmlText(out.get()), "<a:New>text</a:New>");
  EXPECT_EQ(Testing::XmlText(old.get()), "<a:Old/>");
}

TEST(TextElementBuilderImplTest, WhatIsReadBackIsTheTextThatWasGiven) {
  for (const std::string text :
       {"a]]>b", "<b/>&amp;", "line\r\nfeed\rtab\t", " blank ", "\xf0\x9f\x94\x91", "quote\"'"}) {
    const auto xml = Testing::BuiltXml(TextElementBuilderImpl("", "E", text, {}));
    const auto document = Testing::ParseXml(xml);
    const auto* read = dynamic_cast<const TextNode*>(document->RootElement()->FirstChild());
    ASSERT_NE(read, nullptr);
    EXPECT_EQ(read->Text(), text);
  }
}

TEST(TextElementBuilderImplTest, CleansesItsTextWhenItDies) {
  const std::string secret = "hunter2-secret";  // short enough to stand in the string object itself
  alignas(TextElementBuilderImpl) std::array<unsigned char, sizeof(TextElementBuilderImpl)>
      storage{};
  auto* builder = new (storage.data()) TextElementBuilderImpl("a", "E", secret, {});
  const auto holdsSecret = [&] {
    return std::search(storage.begin(), storage.end(), secret.begin(), secret.end()) !=
           storage.end();
  };
  EXPECT_TRUE(holdsSecret());
  builder->~TextElementBuilderImpl();
  EXPECT_FALSE(holdsSecret());
}

}  // namespace
}  // namespace SsoClient
