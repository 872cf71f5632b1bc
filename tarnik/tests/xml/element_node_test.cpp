#include <optional>
#include <ostream>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>

#include "support/thrown_message.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

Ref<ElementNode> NewElement(std::string_view prefix, std::string_view local) {
  Ref<ElementNode> element;
  CreateElementNode(prefix, local, element);
  return element;
}

TEST(ElementNodeTest, IsCreatedFromPrefixAndLocalName) {
  const Ref<ElementNode> element = NewElement("p", "local");
  EXPECT_EQ(element->Kind(), NodeKind::kElement);
  EXPECT_EQ(element->QualifiedNameText(), "p:local");
  EXPECT_EQ(element->Prefix(), "p");
  EXPECT_EQ(element->LocalName(), "local");
  EXPECT_EQ(element->AttributeCount(), 0U);
  EXPECT_EQ(element->FirstChild(), nullptr);
  EXPECT_EQ(element->LastChild(), nullptr);
  EXPECT_EQ(element->Parent(), nullptr);
  EXPECT_EQ(element->NextSibling(), nullptr);
  EXPECT_EQ(element->Line(), 0);
  EXPECT_EQ(element->Column(), 0);
  EXPECT_EQ(element->RefCount(), 1);
}

TEST(ElementNodeTest, HasNoPrefixWhenCreatedWithoutOne) {
  const Ref<ElementNode> element = NewElement("", "local");
  EXPECT_EQ(element->QualifiedNameText(), "local");
  EXPECT_EQ(element->Prefix(), "");
  EXPECT_EQ(element->LocalName(), "local");
}

TEST(ElementNodeTest, ReplacesTheElementThatTheReferenceHeld) {
  Ref<ElementNode> element = NewElement("", "first");
  CreateElementNode("", "second", element);
  EXPECT_EQ(element->LocalName(), "second");
}

TEST(ElementNodeTest, RefusesNamesThatAreNotNCNames) {
  Ref<ElementNode> element;
  for (const char* name : {"", "1a", "a b", "a:b", "-a", "a<", "\xC3", "a\xCC", "\xC3\x97"}) {
    EXPECT_THROW(CreateElementNode("", name, element), InvalidArgumentException) << name;
    if (*name != '\0') {
      EXPECT_THROW(CreateElementNode(name, "a", element), InvalidArgumentException) << name;
    }
    EXPECT_EQ(element, nullptr);
  }
  for (const char* name : {"a", "_", "A-1.b", "\xC3\xA9t\xC3\xA9", "\xE6\x97\xA5"}) {
    EXPECT_NO_THROW(CreateElementNode(name, name, element)) << name;
  }
}

TEST(ElementNodeTest, AddsNewAttributesLastAndReplacesInPlace) {
  const Ref<ElementNode> element = NewElement("", "e");
  for (const char* name : {"b", "xmlns:p", "a", "p:c", "d", "e"}) {
    element->SetAttribute(name, name);
  }
  element->SetAttribute("a", "changed");
  EXPECT_EQ(XmlText(element.get()),
            "<e b=\"b\" xmlns:p=\"xmlns:p\" a=\"changed\" p:c=\"p:c\" d=\"d\" e=\"e\"/>");
  EXPECT_EQ(element->AttributeCount(), 6U);
}

TEST(ElementNodeTest, MaySetAnAttributeToItsOwnValue) {
  const Ref<ElementNode> element = NewElement("", "e");
  element->SetAttribute("a", "value");
  element->SetAttribute("a", *element->FindAttribute("a"));
  element->SetAttribute("b", element->FindAttribute("a")->substr(1));
  EXPECT_EQ(XmlText(element.get()), "<e a=\"value\" b=\"alue\"/>");
}

TEST(ElementNodeTest, RemovesAttributes) {
  const Ref<ElementNode> element = NewElement("", "e");
  for (const char* name : {"a", "xmlns", "c"}) {
    element->SetAttribute(name, "urn:v");
  }
  EXPECT_FALSE(element->RemoveAttribute("d"));
  EXPECT_TRUE(element->RemoveAttribute("xmlns"));
  EXPECT_FALSE(element->RemoveAttribute("xmlns"));
  EXPECT_EQ(element->LookupNamespace(""), std::nullopt);
  EXPECT_EQ(XmlText(element.get()), "<e a=\"urn:v\" c=\"urn:v\"/>");
}

TEST(ElementNodeTest, FindsAttributesByQualifiedAndByExpandedName) {
  const Ref<Document> document = ParseXml(
      "<r xmlns='urn:d' xmlns:p='urn:p' xmlns:q='urn:p' x='plain' p:x='prefixed' q:y=''/>");
  const ElementNode* root = document->RootElement();
  EXPECT_EQ(root->FindAttribute("x"), "plain");
  EXPECT_EQ(root->FindAttribute("p:x"), "prefixed");
  EXPECT_EQ(root->FindAttribute("q:y"), "");
  EXPECT_EQ(root->FindAttribute("y"), std::nullopt);
  EXPECT_EQ(root->FindAttribute("", "x"), "plain");
  EXPECT_EQ(root->FindAttribute("urn:p", "x"), "prefixed");
  EXPECT_EQ(root->FindAttribute("urn:p", "y"), "");
  // The default namespace does not apply to attributes, and declarations cannot be found by a
  // namespace.
  EXPECT_EQ(root->FindAttribute("urn:d", "x"), std::nullopt);
  EXPECT_EQ(root->FindAttribute("", "y"), std::nullopt);
  EXPECT_EQ(root->FindAttribute("http://www.w3.org/2000/xmlns/", "p"), std::nullopt);
}

struct AttributeCase {
  const char* name;
  std::string attribute;
  std::string value;
  std::string message;
};

void PrintTo(const AttributeCase& attribute, std::ostream* stream) {
  *stream << attribute.name;
}

class BadAttributeTest : public testing::TestWithParam<AttributeCase> {};

TEST_P(BadAttributeTest, IsRefusedAndChangesNothing) {
  const Ref<ElementNode> element = NewElement("p", "e");
  element->SetAttribute("a", "before");
  EXPECT_EQ(ThrownMessage<InvalidArgumentException>(
                [&element] { element->SetAttribute(GetParam().attribute, GetParam().value); }),
            GetParam().message);
  EXPECT_EQ(XmlText(element.get()), "<p:e a=\"before\"/>");
}

constexpr const char* kValueMessage =
    "Attribute 'a' of element 'p:e' holds what XML cannot carry: a control character or bytes that "
    "are not UTF-8.";
constexpr const char* kNameMessage = "An attribute name of element 'p:e' is not a qualified name.";

INSTANTIATE_TEST_SUITE_P(
    Cases, BadAttributeTest,
    testing::Values(AttributeCase{"Nul", "a", std::string("x\0", 2), kValueMessage},
                    AttributeCase{"Control", "a", "\x1F", kValueMessage},
                    AttributeCase{"BrokenUtf8", "a", "\xC3(", kValueMessage},
                    AttributeCase{"CutUtf8", "a", "\xE2\x82", kValueMessage},
                    AttributeCase{"Overlong", "a", "\xC0\x80", kValueMessage},
                    AttributeCase{"Surrogate", "a", "\xED\xA0\x80", kValueMessage},
                    AttributeCase{"Fffe", "a", "\xEF\xBF\xBE", kValueMessage},
                    AttributeCase{"Ffff", "a", "\xEF\xBF\xBF", kValueMessage},
                    AttributeCase{"AboveUnicode", "a", "\xF4\x90\x80\x80", kValueMessage},
                    AttributeCase{"EmptyName", "", "v", kNameMessage},
                    AttributeCase{"BlankInName", "a b", "v", kNameMessage},
                    AttributeCase{"MarkupInName", "a='1'><x", "v", kNameMessage},
                    AttributeCase{"TwoColons", "a:b:c", "v", kNameMessage}),
    [](const auto& test) { return test.param.name; });

TEST(ElementNodeTest, AcceptsAllCharactersThatXmlAllows) {
  const Ref<ElementNode> element = NewElement("", "e");
  const std::string value =
      "\t\n\r ~\x7F\xC2\x80\xED\x9F\xBF\xEE\x80\x80\xEF\xBF\xBD\xF4\x8F\xBF\xBF";
  element->SetAttribute("a", value);
  EXPECT_EQ(element->FindAttribute("a"), value);
}

TEST(ElementNodeTest, LooksUpNamespacesInScope) {
  const Ref<Document> document = ParseXml(
      "<r xmlns='urn:d' xmlns:p='urn:outer'><a xmlns:p='urn:inner' xmlns=''><p:b/></a></r>");
  const ElementNode* root = document->RootElement();
  const ElementNode* a = root->FirstChildElement("a");
  const ElementNode* b = a->FirstChildElement("b");
  EXPECT_EQ(root->LookupNamespace("p"), "urn:outer");
  EXPECT_EQ(root->LookupNamespace(""), "urn:d");
  EXPECT_EQ(b->LookupNamespace("p"), "urn:inner");
  EXPECT_EQ(b->LookupNamespace(""), "");
  EXPECT_EQ(b->LookupNamespace("q"), std::nullopt);
  EXPECT_EQ(b->LookupNamespace("xml"), "http://www.w3.org/XML/1998/namespace");
  EXPECT_EQ(root->NamespaceUri(), "urn:d");
  EXPECT_EQ(a->NamespaceUri(), "");
  EXPECT_EQ(b->NamespaceUri(), "urn:inner");
  EXPECT_EQ(NewElement("p", "e")->NamespaceUri(), "");
}

std::string NamesFrom(const ElementNode* first, const ElementNode* top) {
  std::string names;
  for (const ElementNode* element = first; element != nullptr;
       element = element->NextElement(top)) {
    names += element->LocalName();
  }
  return names;
}

TEST(ElementNodeTest, WalksInDocumentOrderWithinTheTopElement) {
  const Ref<Document> document =
      ParseXml("<!--x--><a>text<b><c/><?p?>text<d/></b><!--x--><e/><f><g/></f>text</a><!--x-->");
  const ElementNode* a = document->RootElement();
  const ElementNode* b = a->FirstChildElement("b");
  const ElementNode* c = b->FirstChildElement("c");
  EXPECT_EQ(NamesFrom(a, nullptr), "abcdefg");
  EXPECT_EQ(NamesFrom(a, a), "abcdefg");
  EXPECT_EQ(NamesFrom(c, a), "cdefg");
  EXPECT_EQ(NamesFrom(b, b), "bcd");
  EXPECT_EQ(NamesFrom(c, b), "cd");
  EXPECT_EQ(NamesFrom(c, c), "c");
  EXPECT_EQ(NewElement("", "e")->NextElement(nullptr), nullptr);
}

TEST(ElementNodeTest, FindsChildElementsByName) {
  const Ref<Document> document =
      ParseXml("<r xmlns:p='urn:p'>text<!--x--><b/><p:a i='1'/><a i='2'/><p:a i='3'/></r>");
  const ElementNode* root = document->RootElement();
  EXPECT_EQ(root->FirstChildElement("a")->FindAttribute("i"), "1");
  EXPECT_EQ(root->FirstChildElement("", "a")->FindAttribute("i"), "2");
  EXPECT_EQ(root->FirstChildElement("urn:p", "a")->FindAttribute("i"), "1");
  EXPECT_EQ(root->FirstChildElement("urn:q", "a"), nullptr);
  EXPECT_EQ(root->FirstChildElement("c"), nullptr);
}

}  // namespace
}  // namespace Tarnik::Testing
