#include <cstddef>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_parser.h>

#include "support/libxml2_oracle.h"
#include "support/xml_text.h"
#include "xml/parse_fault.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

TEST(DocumentHandlerTest, BuildsNodesInDocumentOrder) {
  const Ref<Document> document =
      ParseXml("<!--before--><r>text<e/><!--c--><?p  data ?>more</r><?after?>");
  const Node* node = document->FirstChild();
  ASSERT_EQ(node->Kind(), NodeKind::kComment);
  EXPECT_EQ(static_cast<const CommentNode*>(node)->Text(), "before");
  const ElementNode* root = document->RootElement();
  ASSERT_EQ(node->NextSibling(), root);
  EXPECT_EQ(root->Parent(), document.get());
  EXPECT_EQ(root->ParentElement(), nullptr);

  node = root->FirstChild();
  ASSERT_EQ(node->Kind(), NodeKind::kText);
  EXPECT_EQ(static_cast<const TextNode*>(node)->Text(), "text");
  node = node->NextSibling();
  ASSERT_EQ(node->Kind(), NodeKind::kElement);
  EXPECT_EQ(node->ParentElement(), root);
  node = node->NextSibling();
  ASSERT_EQ(node->Kind(), NodeKind::kComment);
  node = node->NextSibling();
  ASSERT_EQ(node->Kind(), NodeKind::kProcessingInstruction);
  EXPECT_EQ(static_cast<const ProcessingInstructionNode*>(node)->Target(), "p");
  EXPECT_EQ(static_cast<const ProcessingInstructionNode*>(node)->Text(), "data ");
  node = node->NextSibling();
  ASSERT_EQ(node->Kind(), NodeKind::kText);
  EXPECT_EQ(node->NextSibling(), nullptr);
  EXPECT_EQ(root->LastChild(), node);

  node = root->NextSibling();
  ASSERT_EQ(node->Kind(), NodeKind::kProcessingInstruction);
  EXPECT_EQ(static_cast<const ProcessingInstructionNode*>(node)->Text(), "");
  EXPECT_EQ(node->NextSibling(), nullptr);
}

TEST(DocumentHandlerTest, JoinsAdjacentCharacterDataAndCDataIntoOneText) {
  const Ref<Document> document = ParseXml("<r>a&amp;b\r\n<![CDATA[<c>]]>&#x20AC;<![CDATA[]]>d</r>");
  const Node* text = document->RootElement()->FirstChild();
  ASSERT_EQ(text->Kind(), NodeKind::kText);
  EXPECT_EQ(static_cast<const TextNode*>(text)->Text(),
            "a&b\n<c>\xE2\x82\xAC"
            "d");
  EXPECT_EQ(text->NextSibling(), nullptr);
}

bool FirstTextHasCDataSection(const std::string& xml) {
  const Ref<Document> document = ParseXml(xml);
  const Node* text = document->RootElement()->FirstChild();
  while (text->Kind() != NodeKind::kText) {
    text = text->NextSibling();
  }
  return static_cast<const TextNode*>(text)->HasCDataSection();
}

TEST(DocumentHandlerTest, MarksTextsThatHaveACDataSection) {
  for (const char* xml : {"<r><![CDATA[a]]></r>", "<r>a<![CDATA[b]]></r>", "<r><![CDATA[a]]>b</r>",
                          "<r>a<![CDATA[]]></r>", "<r><![CDATA[]]>a</r>"}) {
    EXPECT_TRUE(FirstTextHasCDataSection(xml)) << xml;
  }
  for (const char* xml : {"<r>a</r>", "<r><![CDATA[]]><b/>a</r>", "<r>a<b><![CDATA[b]]></b></r>",
                          "<r><![CDATA[]]><!---->a</r>", "<r>a&lt;![CDATA[b]]&gt;</r>"}) {
    EXPECT_FALSE(FirstTextHasCDataSection(xml)) << xml;
  }
}

TEST(DocumentHandlerTest, ForgetsTheCDataSectionWhenATextIsSetAgain) {
  const Ref<Document> document = ParseXml("<r><![CDATA[a]]></r>");
  auto* text = static_cast<TextNode*>(document->RootElement()->FirstChild());
  text->SetText("b");
  EXPECT_FALSE(text->HasCDataSection());
}

TEST(DocumentHandlerTest, KeepsCommentsBetweenTexts) {
  const Ref<Document> document = ParseXml("<r>admin<!---->.evil</r>");
  const Node* first = document->RootElement()->FirstChild();
  EXPECT_EQ(static_cast<const TextNode*>(first)->Text(), "admin");
  ASSERT_EQ(first->NextSibling()->Kind(), NodeKind::kComment);
  EXPECT_EQ(static_cast<const TextNode*>(first->NextSibling()->NextSibling())->Text(), ".evil");
}

TEST(DocumentHandlerTest, KeepsInstructionsBetweenTexts) {
  const Ref<Document> document = ParseXml("<r>admin<?p d?>.evil</r>");
  const Node* first = document->RootElement()->FirstChild();
  ASSERT_EQ(first->Kind(), NodeKind::kText);
  EXPECT_EQ(static_cast<const TextNode*>(first)->Text(), "admin");
  ASSERT_EQ(first->NextSibling()->Kind(), NodeKind::kProcessingInstruction);
  EXPECT_EQ(static_cast<const TextNode*>(first->NextSibling()->NextSibling())->Text(), ".evil");
}

TEST(DocumentHandlerTest, KeepsAttributesAndDeclarationsInTheirOrder) {
  const Ref<Document> document = ParseXml("<r z='1' xmlns:b='urn:b' b:y='2' xmlns='urn:d' a='3'/>");
  const ElementNode* root = document->RootElement();
  std::vector<std::string> names;
  for (std::size_t index = 0; index < root->AttributeCount(); ++index) {
    names.emplace_back(root->AttributeAt(index).Name());
  }
  EXPECT_THAT(names, testing::ElementsAre("z", "xmlns:b", "b:y", "xmlns", "a"));
  EXPECT_FALSE(root->AttributeAt(0).IsNamespaceDeclaration());
  EXPECT_TRUE(root->AttributeAt(1).IsNamespaceDeclaration());
  EXPECT_TRUE(root->AttributeAt(3).IsNamespaceDeclaration());
  EXPECT_EQ(root->AttributeAt(2).Qualified().Prefix(), "b");
  EXPECT_EQ(root->AttributeAt(2).Qualified().Local(), "y");
}

TEST(DocumentHandlerTest, NormalisesAttributeValuesAsXmlDoes) {
  const Ref<Document> document = ParseXml("<r a='x\t\r\ny' b='&#9;&#10;&#13;'/>");
  EXPECT_EQ(document->RootElement()->FindAttribute("a"), "x  y");
  EXPECT_EQ(document->RootElement()->FindAttribute("b"), "\t\n\r");
}

TEST(DocumentHandlerTest, RecordsThePositionOfEachNode) {
  const Ref<Document> document = ParseXml("<r>\n  <e/>tail<!--c-->\n</r>");
  const Node* node = document->RootElement()->FirstChild();
  EXPECT_EQ(node->Line(), 1);
  EXPECT_EQ(node->Column(), 4);
  node = node->NextSibling();
  EXPECT_EQ(node->Line(), 2);
  EXPECT_EQ(node->Column(), 3);
  node = node->NextSibling();
  EXPECT_EQ(node->Column(), 7);
  node = node->NextSibling();
  EXPECT_EQ(node->Column(), 11);
}

TEST(DocumentHandlerTest, DistinguishesNamesThatShareASlot) {
  std::string text = "<r>";
  for (int index = 0; index < 5000; ++index) {
    text += "<name" + std::to_string(index) + "/>";
  }
  const Ref<Document> document = ParseXml(text + "</r>");
  int index = 0;
  for (const Node* node = document->RootElement()->FirstChild(); node != nullptr;
       node = node->NextSibling()) {
    ASSERT_EQ(static_cast<const ElementNode*>(node)->QualifiedNameText(),
              "name" + std::to_string(index));
    ++index;
  }
  EXPECT_EQ(index, 5000);
}

class NamespaceFaultTest : public testing::TestWithParam<FaultCase> {};

TEST_P(NamespaceFaultTest, IsRefusedWithItsMessage) {
  EXPECT_EQ(Fault(GetParam().text), GetParam().message);
}

constexpr const char* kXmlnsMessage =
    "Neither the prefix 'xmlns' nor its namespace can be declared at line 1, column 1";
constexpr const char* kXmlMessage =
    "The prefix 'xml' and its namespace belong only to each other at line 1, column 1";

INSTANTIATE_TEST_SUITE_P(
    Names, NamespaceFaultTest,
    testing::Values(
        FaultCase{"UnboundElementPrefix", "<a>\n<p:e/></a>",
                  "The prefix 'p' is not bound to a namespace at line 2, column 1"},
        FaultCase{"UnboundAttributePrefix", "<a p:x='1'/>",
                  "The prefix 'p' is not bound to a namespace at line 1, column 1"},
        FaultCase{"PrefixOutOfScope", "<a><b xmlns:p='urn:p'/><p:c/></a>",
                  "The prefix 'p' is not bound to a namespace at line 1, column 24"},
        FaultCase{"SameExpandedName", "<a xmlns:p='urn:1' xmlns:q='urn:1' p:x='1' q:x='2'/>",
                  "Two attributes of element 'a' have the same name in one namespace at line "
                  "1, column 1"},
        FaultCase{"EmptyPrefixedDeclaration", "<a xmlns:p=''/>",
                  "The prefix 'p' is declared as no namespace at line 1, column 1"},
        FaultCase{"XmlnsDeclared", "<a xmlns:xmlns='urn:x'/>", kXmlnsMessage},
        FaultCase{"XmlnsNamespaceDeclared", "<a xmlns:p='http://www.w3.org/2000/xmlns/'/>",
                  kXmlnsMessage},
        FaultCase{"XmlnsNamespaceAsDefault", "<a xmlns='http://www.w3.org/2000/xmlns/'/>",
                  kXmlnsMessage},
        FaultCase{"XmlDeclaredAsAnother", "<a xmlns:xml='urn:x'/>", kXmlMessage},
        FaultCase{"XmlNamespaceForAnotherPrefix",
                  "<a xmlns:p='http://www.w3.org/XML/1998/namespace'/>", kXmlMessage},
        FaultCase{"XmlNamespaceAsDefault", "<a xmlns='http://www.w3.org/XML/1998/namespace'/>",
                  kXmlMessage},
        FaultCase{"XmlnsElement", "<xmlns:a/>",
                  "The prefix 'xmlns' is not for elements at line 1, column 1"},
        FaultCase{"TwoColons", "<a:b:c xmlns:a='urn:a'/>",
                  "The name 'a:b:c' is not a qualified name at line 1, column 1"},
        FaultCase{"LeadingColon", "<:a/>",
                  "The name ':a' is not a qualified name at line 1, column 1"},
        FaultCase{"TrailingColon", "<a: xmlns:a='urn:a'/>",
                  "The name 'a:' is not a qualified name at line 1, column 1"},
        FaultCase{"LocalStartsWithDigit", "<a:1 xmlns:a='urn:a'/>",
                  "The name 'a:1' is not a qualified name at line 1, column 1"},
        FaultCase{"ColonAttribute", "<a xmlns:='urn:a'/>",
                  "The name 'xmlns:' is not a qualified name at line 1, column 1"},
        FaultCase{"ColonInInstruction", "<a><?x:y z?></a>",
                  "The processing instruction target 'x:y' holds a colon at line 1, column "
                  "4"}),
    [](const auto& test) { return test.param.name; });

// Each would be rejected if one of the rules above were too strict.
TEST(DocumentHandlerTest, AcceptsWhatNamespacesAllow) {
  for (const char* text :
       {"<a xmlns:p='urn:1' xmlns:q='urn:2' p:x='1' q:x='2' x='3'/>",
        "<p:a xmlns:p='urn:1' xmlns='urn:1' p:x='1' x='2'/>",
        "<a xmlns:xml='http://www.w3.org/XML/1998/namespace' xml:lang='en'/>", "<a xml:lang='en'/>",
        "<a xmlns='urn:a'><b xmlns=''/></a>", "<xmlns/>", "<a xmlns:xmlfoo='urn:x'/>",
        "<a xmlns:p='urn:1'><p:b xmlns:p='urn:2' p:x=''/><p:c/></a>"}) {
    EXPECT_EQ(Fault(text), "") << text;
    EXPECT_TRUE(IsWellFormedForLibXml2(text)) << text;
  }
}

TEST(DocumentHandlerTest, FindsOneDuplicateAmongManyAttributes) {
  std::string text = "<a xmlns:p='urn:1' xmlns:q='urn:1'";
  for (int index = 0; index < 1000; ++index) {
    text += " p:x" + std::to_string(index) + "=''";
  }
  EXPECT_EQ(Fault(text + " q:y=''/>"), "");
  EXPECT_NE(Fault(text + " q:x500=''/>"), "");
}

std::string Attributes(std::size_t count) {
  std::string text;
  for (std::size_t index = 0; index < count; ++index) {
    text += (index % 2 == 0 ? " xmlns:p" : " p") + std::to_string(index) + "='urn:x'";
  }
  return text;
}

TEST(DocumentHandlerTest, EnforcesTheLimitOfOpenAttributes) {
  const std::string half = Attributes(kMaxOpenAttributes / 2);
  EXPECT_EQ(Fault("<a" + half + "><b" + half + "/>\n<b" + half + "/></a>"), "");
  constexpr const char* kMessage = "An element and those around it have more than 1024 attributes ";
  EXPECT_EQ(Fault("<a" + half + ">\n<b" + half + "><c x=''/></b></a>"),
            kMessage + ("at line 2, column " +
                        std::to_string(std::string("<b>").size() + half.size() + 1)));
  EXPECT_EQ(Fault("<a" + Attributes(100000) + "/>"), std::string(kMessage) + "at line 1, column 1");
}

TEST(DocumentHandlerTest, CanBeUsedOnlyOnce) {
  const Ref<XMLHandler> handler = CreateXMLDocumentHandler();
  handler->StartElement({1, 1}, "a", nullptr, 0);
  handler->EndElement({1, 1});
  handler->EndDocument();
  EXPECT_THROW(handler->StartElement({1, 1}, "a", nullptr, 0), InvalidStateException);
  EXPECT_THROW(handler->EndDocument(), InvalidStateException);
}

TEST(DocumentHandlerTest, RefusesEventsOutOfOrder) {
  const Ref<XMLHandler> handler = CreateXMLDocumentHandler();
  EXPECT_THROW(handler->EndElement({1, 1}), InvalidStateException);
  EXPECT_THROW(handler->Characters({1, 1}, "x"), InvalidStateException);
  EXPECT_THROW(handler->EndDocument(), InvalidStateException);
  handler->StartElement({1, 1}, "a", nullptr, 0);
  EXPECT_THROW(handler->EndDocument(), InvalidStateException);
}

}  // namespace
}  // namespace Tarnik::Testing
