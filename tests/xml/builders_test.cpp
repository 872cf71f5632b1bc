#include "xml/builders.h"

#include <array>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/fake_saml_token.h"
#include "support/holds_text.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"
#include "xml/built_xml.h"
#include "xml/unsendable_texts.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Xml::TextNode;
using testing::ElementsAre;
using testing::Pair;

TEST(AttributeMapTest, OrdersNamesByTheirBytes) {
  EXPECT_THAT(ToAttributeMap({{"xmlns:wsu", "U"}, {"wsu:Id", "I"}}),
              ElementsAre(Pair("wsu:Id", "I"), Pair("xmlns:wsu", "U")));
  EXPECT_THAT(ToAttributeMap({{"xmlns:wst14", "b"}, {"xmlns:wst", "a"}, {"Z", "c"}, {"a", "d"}}),
              ElementsAre(Pair("Z", "c"), Pair("a", "d"), Pair("xmlns:wst", "a"),
                          Pair("xmlns:wst14", "b")));
}

TEST(AttributeMapTest, KeepsTheFirstValueOfANameGivenTwice) {
  EXPECT_THAT(ToAttributeMap({{"a", "first"}, {"b", "other"}, {"a", "second"}}),
              ElementsAre(Pair("a", "first"), Pair("b", "other")));
}

TEST(AttributeMapTest, IsEmptyForAnEmptyList) {
  EXPECT_TRUE(ToAttributeMap({}).empty());
}

TEST(ElementBuilderImplTest, SetsAttributesInNameOrder) {
  const ElementBuilderImpl builder("wsu", "Timestamp", {{"xmlns:wsu", "U"}, {"wsu:Id", "I"}});
  const auto element = Built(builder);
  ASSERT_EQ(element->AttributeCount(), 2U);
  EXPECT_EQ(element->AttributeAt(0).Name(), "wsu:Id");
  EXPECT_EQ(element->AttributeAt(0).Value(), "I");
  EXPECT_EQ(element->AttributeAt(1).Name(), "xmlns:wsu");
  EXPECT_EQ(element->AttributeAt(1).Value(), "U");
  EXPECT_EQ(element->QualifiedNameText(), "wsu:Timestamp");
  EXPECT_EQ(element->FirstChild(), nullptr);
}

TEST(ElementBuilderImplTest, BuildsAnUnprefixedElement) {
  EXPECT_EQ(Built(ElementBuilderImpl("", "Plain", {}))->QualifiedNameText(), "Plain");
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
  EXPECT_NE(Built(builder), Built(builder));
}

TEST(ElementBuilderImplTest, PassesOnErrorsOfAttributes) {
  for (const auto& text : UnsendableTexts()) {
    const ElementBuilderImpl builder("rsa-advice", "Advice", {{"AdviceSource", text}});
    EXPECT_EQ(
        ThrownMessage<Tarnik::InvalidArgumentException>([&] { Built(builder); }),
        "Attribute 'AdviceSource' of element 'rsa-advice:Advice' holds what XML cannot carry: "
        "a control character or bytes that are not UTF-8.")
        << testing::PrintToString(text);
  }
}

TEST(ElementBuilderImplTest, PassesOnErrorsOfNames) {
  const auto failure = [](const char* prefix, const char* localName,
                          const AttributeList& attributes) {
    const ElementBuilderImpl builder(prefix, localName, attributes);
    return ThrownMessage<Tarnik::InvalidArgumentException>([&] { Built(builder); });
  };
  EXPECT_EQ(failure("a", "", {}), "The prefix and the local name of an element must be NCNames.");
  EXPECT_EQ(failure("a", "E", {{"b c", ""}}),
            "An attribute name of element 'a:E' is not a qualified name.");
}

TEST(ElementBuilderImplTest, EscapesMarkupAndWhiteSpace) {
  const std::string value = "<&>\"'\r\n\t]]>";
  const auto text = BuiltXml(ElementBuilderImpl("", "E", {{"a", value}}));
  EXPECT_EQ(ParseXml(text)->RootElement()->FindAttribute("a"), value);
}

TEST(TextElementBuilderImplTest, BuildsAttributesAndOneText) {
  const TextElementBuilderImpl builder("wsse", "Password", "pw", {{"Type", "T"}});
  EXPECT_EQ(BuiltXml(builder), R"(<wsse:Password Type="T">pw</wsse:Password>)");
}

TEST(TextElementBuilderImplTest, AnEmptyTextIsStillATextNode) {
  const auto element = Built(TextElementBuilderImpl("a", "E", "", {}));
  const auto* text = dynamic_cast<const TextNode*>(element->FirstChild());
  ASSERT_NE(text, nullptr);
  EXPECT_EQ(text->Text(), "");
  EXPECT_EQ(element->LastChild(), text);
}

TEST(TextElementBuilderImplTest, PassesOnErrorsOfTexts) {
  for (const auto& unsendable : UnsendableTexts()) {
    const TextElementBuilderImpl builder("wsse", "Password", unsendable, {});
    EXPECT_EQ(
        ThrownMessage<Tarnik::InvalidArgumentException>([&] { Built(builder); }),
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
  EXPECT_EQ(XmlText(out.get()), "<a:New>text</a:New>");
  EXPECT_EQ(XmlText(old.get()), "<a:Old/>");
}

TEST(TextElementBuilderImplTest, TheTextIsReadBackUnchanged) {
  for (const std::string text :
       {"a]]>b", "<b/>&amp;", "line\r\nfeed\rtab\t", " blank ", "\xf0\x9f\x94\x91", "quote\"'"}) {
    const auto xml = BuiltXml(TextElementBuilderImpl("", "E", text, {}));
    const auto document = ParseXml(xml);
    const auto* read = dynamic_cast<const TextNode*>(document->RootElement()->FirstChild());
    ASSERT_NE(read, nullptr);
    EXPECT_EQ(read->Text(), text);
  }
}

TEST(TextElementBuilderImplTest, CleansesItsTextWhenItIsDestroyed) {
  const std::string secret =
      "hunter2-secret";  // short enough to be stored in the string object itself
  alignas(TextElementBuilderImpl) std::array<unsigned char, sizeof(TextElementBuilderImpl)>
      storage{};
  auto* builder = new (storage.data()) TextElementBuilderImpl("a", "E", secret, {});
  EXPECT_TRUE(HoldsText(storage, secret));
  builder->~TextElementBuilderImpl();
  EXPECT_FALSE(HoldsText(storage, secret));
}

TEST(PreBuiltElementImplTest, EveryBuildReturnsTheSameElement) {
  Tarnik::Ref<Tarnik::Xml::ElementNode> element;
  Tarnik::Xml::CreateElementNode("a", "E", element);
  const PreBuiltElementImpl builder(element);
  EXPECT_EQ(Built(builder), element);
  EXPECT_EQ(Built(builder), element);
}

TEST(PreBuiltElementImplTest, KeepsTheElementAlive) {
  Tarnik::Ref<Tarnik::Xml::ElementNode> element;
  Tarnik::Xml::CreateElementNode("a", "E", element);
  const PreBuiltElementImpl builder(element);
  element = nullptr;
  EXPECT_EQ(Built(builder)->QualifiedNameText(), "a:E");
}

TEST(BuilderFactoriesTest, MakeElements) {
  EXPECT_EQ(BuiltXml(*MakeElementBuilder("a", "E")), "<a:E/>");
  EXPECT_EQ(BuiltXml(*MakeElementBuilder("a", "E", {{"z", "1"}, {"b", "2"}})),
            R"(<a:E b="2" z="1"/>)");
}

TEST(BuilderFactoriesTest, MakeTextElements) {
  EXPECT_EQ(BuiltXml(*MakeTextElementBuilder("a", "E", "text")), "<a:E>text</a:E>");
  EXPECT_EQ(BuiltXml(*MakeTextElementBuilder("a", "E", "text", {{"z", "1"}, {"b", "2"}})),
            R"(<a:E b="2" z="1">text</a:E>)");
}

TEST(BuilderFactoriesTest, AnAttributeGivenTwiceKeepsItsFirstValue) {
  EXPECT_EQ(BuiltXml(*MakeElementBuilder("a", "E", {{"n", "first"}, {"n", "second"}})),
            R"(<a:E n="first"/>)");
}

TEST(BuilderFactoriesTest, ATokenIsInsertedFromItsText) {
  const std::string assertion =
      R"(<saml2:Assertion xmlns:saml2="urn:s" ID="_1"><ds:Signature xmlns:ds="urn:d">QUJD)"
      "\n"
      R"(REVG</ds:Signature>  <!--kept--><saml2:Issuer b="2" a="1">i</saml2:Issuer>)"
      R"(</saml2:Assertion>)";
  const FakeSamlToken token("<?xml version=\"1.0\"?>\n" + assertion + "\n");
  auto parent = MakeCompositeBuilder("", "Parent");
  parent->Add(MakeTokenElementBuilder(token));
  EXPECT_EQ(BuiltXml(*parent), "<Parent>" + assertion + "</Parent>");
}

TEST(BuilderFactoriesTest, EveryBuildOfATokenReturnsTheSameElement) {
  const auto builder = MakeTokenElementBuilder(FakeSamlToken("<A/>"));
  EXPECT_EQ(Built(*builder), Built(*builder));
  EXPECT_NE(Built(*builder), Built(*MakeTokenElementBuilder(FakeSamlToken("<A/>"))));
}

TEST(BuilderFactoriesTest, ATokenWithAMalformedTextIsRefused) {
  EXPECT_THROW(MakeTokenElementBuilder(FakeSamlToken("<A>")), Tarnik::Xml::XMLParseException);
  EXPECT_THROW(MakeTokenElementBuilder(FakeSamlToken("")), Tarnik::Xml::XMLParseException);
}

TEST(XMLCompositeBuilderTest, WithoutChildrenItBuildsExactlyItsRoot) {
  const XMLCompositeBuilder builder(MakeTextElementBuilder("a", "E", "text", {{"b", "c"}}));
  EXPECT_EQ(BuiltXml(builder), R"(<a:E b="c">text</a:E>)");
}

TEST(XMLCompositeBuilderTest, ChildrenFollowTheRootsOwnInTheOrderTheyWereAdded) {
  XMLCompositeBuilder builder(MakeTextElementBuilder("", "Root", "text"));
  builder.Add(MakeTextElementBuilder("", "Second", "2"))
      .Add(MakeTextElementBuilder("", "First", "1"));
  EXPECT_EQ(BuiltXml(builder), "<Root>text<Second>2</Second><First>1</First></Root>");
}

TEST(XMLCompositeBuilderTest, AddingNothingLeavesTheChildrenAndReturnsTheComposite) {
  XMLCompositeBuilder builder(MakeElementBuilder("", "Root"));
  builder.Add(MakeTextElementBuilder("", "A", "1"));
  const auto before = BuiltXml(builder);
  EXPECT_EQ(&builder.Add(nullptr), &builder);
  EXPECT_EQ(BuiltXml(builder), before);
  EXPECT_EQ(&builder.Add(MakeTextElementBuilder("", "B", "2")), &builder);
  EXPECT_EQ(BuiltXml(builder), "<Root><A>1</A><B>2</B></Root>");
}

TEST(XMLCompositeBuilderTest, SharesItsRootAndChildrenWithOtherParents) {
  const auto shared = MakeCompositeBuilder("", "Shared");
  XMLCompositeBuilder first(shared);
  first.Add(MakeTextElementBuilder("", "A", "1"));
  XMLCompositeBuilder second(MakeElementBuilder("", "Parent"));
  second.Add(shared).Add(shared);
  shared->Add(MakeTextElementBuilder("", "B", "2"));
  EXPECT_EQ(BuiltXml(first), "<Shared><B>2</B><A>1</A></Shared>");
  EXPECT_EQ(BuiltXml(second),
            "<Parent><Shared><B>2</B></Shared><Shared><B>2</B></Shared></Parent>");
}

TEST(XMLCompositeBuilderTest, MayBeBuiltAnyNumberOfTimes) {
  XMLCompositeBuilder builder(MakeElementBuilder("", "Root"));
  builder.Add(MakeTextElementBuilder("", "A", "1"));
  const auto first = Built(builder);
  const auto second = Built(builder);
  EXPECT_NE(first, second);
  EXPECT_EQ(XmlText(first.get()), XmlText(second.get()));
}

class FailingBuilder final : public XMLBaseBuilder {
 public:
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>&) const override {
    throw std::runtime_error("no element today");
  }
};

TEST(XMLCompositeBuilderTest, FailuresOfAChildPassUnchangedAndLeaveAPartialElement) {
  XMLCompositeBuilder builder(MakeElementBuilder("", "Root"));
  builder.Add(MakeElementBuilder("", "First"))
      .Add(std::make_shared<FailingBuilder>())
      .Add(MakeElementBuilder("", "Last"));
  Tarnik::Ref<Tarnik::Xml::ElementNode> out;
  try {
    builder.Build(out);
    FAIL();
  } catch (const std::runtime_error& error) {
    EXPECT_STREQ(error.what(), "no element today");
  }
  EXPECT_EQ(XmlText(out.get()), "<Root><First/></Root>");
}

/// Records the content of the output before each build.
class WatchingBuilder final : public XMLBaseBuilder {
 public:
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override {
    before.push_back(out);
    Tarnik::Xml::CreateElementNode("", "E", out);
  }

  mutable std::vector<Tarnik::Ref<Tarnik::Xml::ElementNode>> before;
};

TEST(XMLCompositeBuilderTest, BuildsItsRootIntoTheOutputAndEachChildIntoAFreshReference) {
  const auto watching = std::make_shared<WatchingBuilder>();
  XMLCompositeBuilder builder(watching);
  builder.Add(watching).Add(watching);
  Tarnik::Ref<Tarnik::Xml::ElementNode> out;
  Tarnik::Xml::CreateElementNode("", "Old", out);
  const auto old = out;
  builder.Build(out);
  EXPECT_THAT(watching->before, testing::ElementsAre(old, nullptr, nullptr));
  EXPECT_EQ(XmlText(out.get()), "<E><E/><E/></E>");
}

TEST(XMLCompositeBuilderTest, ManyThreadsMayBuildOneTree) {
  XMLCompositeBuilder builder(MakeElementBuilder("a", "Root", {{"b", "c"}}));
  builder.Add(MakeTextElementBuilder("a", "E", "text"));
  constexpr int kBuilds = 100;
  std::vector<std::vector<std::string>> built(4);
  std::vector<std::thread> threads;
  for (auto& texts : built) {
    threads.emplace_back([&builder, &texts] {
      for (int i = 0; i < kBuilds; ++i) {
        texts.push_back(BuiltXml(builder));
      }
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  const std::vector<std::string> expected(kBuilds, R"(<a:Root b="c"><a:E>text</a:E></a:Root>)");
  EXPECT_THAT(built, testing::Each(expected));
}

TEST(XMLBaseBuilderTest, BuildIsTheFirstSlotAndTheDestructorFollows) {
  const auto builder = MakeTextElementBuilder("a", "E", "text");
  using BuildFunction = void(const void*, Tarnik::Ref<Tarnik::Xml::ElementNode>&);
  Tarnik::Ref<Tarnik::Xml::ElementNode> out;
  VtableSlot<BuildFunction>(builder.get(), 0)(builder.get(), out);
  EXPECT_EQ(XmlText(out.get()), "<a:E>text</a:E>");

  class Counting final : public XMLBaseBuilder {
   public:
    explicit Counting(int& deaths) : deaths_(deaths) {}
    ~Counting() override { ++deaths_; }
    void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>&) const override {}

   private:
    int& deaths_;
  };
  int deaths = 0;
  auto* counting = new Counting(deaths);
  VtableSlot<void(const void*)>(counting, 2)(counting);  // 1: complete, 2: deleting
  EXPECT_EQ(deaths, 1);
}

}  // namespace
}  // namespace SsoClient::Testing
