#include <cstddef>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_writer.h>

#include "support/random_xml.h"
#include "support/xml_text.h"
#include "xml/security/c14n.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

TEST(XmlWriterTest, WritesEveryKindOfNode) {
  const std::string text =
      "<!--before--><?p?><a:r xmlns:a=\"urn:a\" z=\"1\" b=\"2\">t<e/><!--c--><?p "
      "data?><f>x</f></a:r>"
      "<!--after-->";
  EXPECT_EQ(XmlText(ParseXml(text).get()), text);
}

TEST(XmlWriterTest, WritesASubtreeWithItsContent) {
  const Ref<Document> document = ParseXml("<r xmlns:p='urn:p'><p:a><b/>t</p:a><c/></r>");
  const ElementNode* a = document->RootElement()->FirstChildElement("a");
  EXPECT_EQ(XmlText(a), "<p:a><b/>t</p:a>");
  EXPECT_EQ(XmlText(a->FirstChild()), "<b/>");
  EXPECT_EQ(XmlText(a->LastChild()), "t");
}

TEST(XmlWriterTest, EscapesTextAndAttributes) {
  Ref<ElementNode> element;
  CreateElementNode("", "e", element);
  element->SetAttribute("a", "&<>\"'\t\n\r");
  Ref<TextNode> text;
  CreateTextNode(text);
  text->SetText("&<>\"'\t\n\r]]>");
  element->AppendChild(text.get());
  EXPECT_EQ(XmlText(element.get()),
            "<e a=\"&amp;&lt;>&quot;'&#x9;&#xA;&#xD;\">&amp;&lt;&gt;\"'\t\n&#xD;]]&gt;</e>");
}

// Markup at every offset, so that every part of the search for it is covered.
TEST(XmlWriterTest, EscapesAtEveryOffset) {
  for (std::size_t length = 0; length < 70; ++length) {
    for (std::size_t offset = 0; offset <= length; ++offset) {
      const std::string before(offset, 'x');
      const std::string after(length - offset, 'y');
      Ref<ElementNode> element;
      CreateElementNode("", "e", element);
      Ref<TextNode> text;
      CreateTextNode(text);
      text->SetText(before + "<" + after);
      element->AppendChild(text.get());
      element->SetAttribute("a", before + "\t" + after);
      ASSERT_EQ(XmlText(element.get()),
                "<e a=\"" + before + "&#x9;" + after + "\">" + before + "&lt;" + after + "</e>");
    }
  }
}

TEST(XmlWriterTest, WritesTextsLongerThanItsBuffer) {
  const std::string text =
      "<e>" + std::string(10000, 'a') + "&amp;" + std::string(4096, 'b') + "</e>";
  EXPECT_EQ(XmlText(ParseXml(text).get()), text);
}

TEST(XmlWriterTest, WritesWhatParsesToTheSameTree) {
  for (unsigned seed = 0; seed < 300; ++seed) {
    RandomXml random(seed);
    const Ref<Document> document = ParseXml(random.Document());
    const std::string written = XmlText(document.get());
    const Ref<Document> again = ParseXml(written);
    ASSERT_EQ(XmlText(again.get()), written) << "seed " << seed;
    Security::C14nOptions options;
    options.withComments = true;
    const Ref<StringWriter> first = CreateStringWriter();
    const Ref<StringWriter> second = CreateStringWriter();
    Security::WriteCanonical(document.get(), nullptr, options, *first);
    Security::WriteCanonical(again.get(), nullptr, options, *second);
    ASSERT_EQ(first->Text(), second->Text()) << "seed " << seed;
  }
}

TEST(XmlWriterTest, RefusesNull) {
  const Ref<StringWriter> writer = CreateStringWriter();
  EXPECT_THROW(WriteXml(nullptr, writer.get()), InvalidArgumentException);
  EXPECT_THROW(WriteXml(ParseXml("<a/>").get(), nullptr), InvalidArgumentException);
}

TEST(XmlWriterTest, PropagatesTheFailureOfTheWriter) {
  class FailingWriter final : public Writer, public ObjectImpl {
   public:
    void Write(std::string_view) override { throw IOException("full"); }
  };
  const auto writer = MakeRef<FailingWriter>();
  EXPECT_THROW(WriteXml(ParseXml("<a/>").get(), writer.get()), IOException);
}

}  // namespace
}  // namespace Tarnik::Testing
