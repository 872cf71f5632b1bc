#include "support/xml_documents.h"

#include <gtest/gtest.h>

#include <tarnik/core/reader.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/parse_xml.h"

namespace SsoClient::Testing {
namespace {

TEST(XmlDocumentsTest, ParsesATextOrAReader) {
  EXPECT_EQ(ParseDocument("<a b='1'/>")->RootElement()->FindAttribute("b"), "1");
  EXPECT_EQ(ParseDocument(Tarnik::CreateStringReader("<c/>").get())->RootElement()->LocalName(),
            "c");
  EXPECT_THROW(ParseDocument("<a>"), Tarnik::Xml::XMLParseException);
}

TEST(XmlDocumentsTest, ElementTextIsTheTextOfAFirstTextChild) {
  const struct {
    const char* xml;
    const char* text;
  } kCases[] = {
      {"<a>text</a>", "text"},
      {"<a> text\n</a>", " text\n"},
      {"<a>text<b/>more</a>", "text"},
      {"<a>te<![CDATA[x]]>t</a>", "text"},
      {"<a>&lt;&#65;</a>", "<A"},
      {"<a/>", ""},
      {"<a><b>text</b></a>", ""},
      {"<a><b/>text</a>", ""},
      {"<a><!-- comment -->text</a>", ""},
      {"<a><?pi?>text</a>", ""},
  };
  for (const auto& test : kCases) {
    const auto document = ParseXml(test.xml);
    EXPECT_EQ(ElementText(document->RootElement()), test.text) << test.xml;
    EXPECT_EQ(FirstTextChild(document->RootElement()) != nullptr, test.text[0] != '\0') << test.xml;
  }
  EXPECT_EQ(ElementText(nullptr), "");
  EXPECT_EQ(FirstTextChild(nullptr), nullptr);
}

TEST(XmlDocumentsTest, FindDescendantTakesTheFirstOfEachName) {
  const auto document =
      ParseXml(R"(<r xmlns:p="urn:p">text<x/><p:a><b n="1"/><b n="2"/></p:a><a><c/></a></r>)");
  const auto& root = *document->RootElement();
  const auto* found = FindDescendant(root, {"a", "b"});
  ASSERT_NE(found, nullptr);
  EXPECT_EQ(found->FindAttribute("n"), "1");
  EXPECT_EQ(FindDescendant(root, {}), &root);
  EXPECT_EQ(FindDescendant(root, {"a", "c"}), nullptr);
  EXPECT_EQ(FindDescendant(root, {"b"}), nullptr);
  EXPECT_EQ(FindDescendant(root, {"missing", "b"}), nullptr);
}

TEST(XmlDocumentsTest, CanonicalTextHasInheritedNamespacesAndNoComments) {
  const auto document = ParseXml(
      R"(<r xmlns="urn:d" xmlns:q="urn:q" xml:lang="en"><a z="1" b='2'><!--c-->t</a></r>)");
  EXPECT_EQ(CanonicalizeElement(document->RootElement()->FirstChildElement("a")),
            R"(<a xmlns="urn:d" xmlns:q="urn:q" b="2" z="1" xml:lang="en">t</a>)");
  EXPECT_EQ(CanonicalizeElement(nullptr), "");
}

}  // namespace
}  // namespace SsoClient::Testing
