#include <tarnik/xml/xml_parser.h>

#include <gtest/gtest.h>

#include <tarnik/core/checked_cast.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/xml_parse_exception.h>

namespace Tarnik::Xml {
namespace {

Ref<Document> ParseText(std::string text) {
  const Ref<Reader> reader = CreateStringReader(std::move(text));
  const Ref<XMLHandler> handler = CreateXMLDocumentHandler();
  return Ref<Document>(
      CheckedCast<Document>(CreateXMLParser(reader.get(), handler.get())->Parse().get()));
}

TEST(XMLParserTest, BuildsTheTreeOfADocument) {
  const Ref<Document> document = ParseText("<a:r xmlns:a='urn:a' x='1'>t<b/></a:r>");
  const ElementNode* root = document->RootElement();
  EXPECT_EQ(root->QualifiedNameText(), "a:r");
  EXPECT_EQ(root->NamespaceUri(), "urn:a");
  EXPECT_EQ(root->FindAttribute("x"), "1");
}

}  // namespace
}  // namespace Tarnik::Xml
