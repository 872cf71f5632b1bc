#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/exception.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/node.h>

#include "support/thrown_message.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

Ref<ElementNode> NewElement(std::string_view name) {
  Ref<ElementNode> element;
  CreateElementNode("", name, element);
  return element;
}

Ref<TextNode> NewText(std::string_view value) {
  Ref<TextNode> text;
  CreateTextNode(text);
  text->SetText(value);
  return text;
}

std::string ArgumentFault(const std::function<void()>& action) {
  return ThrownMessage<InvalidArgumentException>(action, "");
}

TEST(NodeTest, StaysSmall) {
  // The memory of a token and its tree is limited to four times the text.
  EXPECT_LE(sizeof(ElementNode), 88U);
  EXPECT_LE(sizeof(TextNode), 56U);
  EXPECT_LE(sizeof(Attribute), 24U);
}

TEST(NodeTest, AppendsChildrenInOrder) {
  const Ref<ElementNode> parent = NewElement("p");
  const Ref<ElementNode> a = NewElement("a");
  const Ref<TextNode> text = NewText("t<");
  const Ref<ElementNode> b = NewElement("b");
  parent->AppendChild(a.get());
  parent->AppendChild(text.get());
  parent->AppendChild(b.get());
  EXPECT_EQ(XmlText(parent.get()), "<p><a/>t&lt;<b/></p>");
  EXPECT_EQ(a->NextSibling(), text.get());
  EXPECT_EQ(b->NextSibling(), nullptr);
  EXPECT_EQ(text->ParentElement(), parent.get());
}

TEST(NodeTest, MovesAChildThatHasAParent) {
  const Ref<ElementNode> from = NewElement("from");
  const Ref<ElementNode> to = NewElement("to");
  std::vector<Ref<ElementNode>> children;
  for (const char* name : {"a", "b", "c"}) {
    children.push_back(NewElement(name));
    from->AppendChild(children.back().get());
  }
  to->AppendChild(children[1].get());
  EXPECT_EQ(XmlText(from.get()), "<from><a/><c/></from>");
  to->AppendChild(children[2].get());
  to->AppendChild(children[0].get());
  EXPECT_EQ(XmlText(from.get()), "<from/>");
  EXPECT_EQ(XmlText(to.get()), "<to><b/><c/><a/></to>");
  to->AppendChild(children[1].get());
  EXPECT_EQ(XmlText(to.get()), "<to><c/><a/><b/></to>");
}

TEST(NodeTest, RemovesChildren) {
  const Ref<Document> document = ParseXml("<r><a/>t<b/></r>");
  ElementNode* root = document->RootElement();
  Node* a = root->FirstChild();
  Node* b = root->LastChild();
  root->RemoveChild(b);
  EXPECT_EQ(b->Parent(), nullptr);
  EXPECT_EQ(b->NextSibling(), nullptr);
  root->RemoveChild(a);
  EXPECT_EQ(XmlText(root), "<r>t</r>");
  EXPECT_EQ(ArgumentFault([&] { root->RemoveChild(a); }),
            "The node to remove is not a child of this node.");
  EXPECT_EQ(ArgumentFault([&] { root->RemoveChild(nullptr); }),
            "The node to remove is not a child of this node.");
  root->RemoveChild(root->FirstChild());
  EXPECT_EQ(root->FirstChild(), nullptr);
  root->AppendChild(a);
  EXPECT_EQ(XmlText(root), "<r><a/></r>");
}

TEST(NodeTest, RefusesChildrenInTheWrongPlace) {
  const Ref<Document> document = ParseXml("<r><a><b/></a></r>");
  ElementNode* root = document->RootElement();
  ElementNode* a = root->FirstChildElement("a");
  ElementNode* b = a->FirstChildElement("b");
  const Ref<Document> other = ParseXml("<o/>");
  const Ref<TextNode> text = NewText("t");
  EXPECT_EQ(ArgumentFault([&] { a->AppendChild(nullptr); }), "The child to append is null.");
  EXPECT_EQ(ArgumentFault([&] { a->AppendChild(other.get()); }), "A document cannot be a child.");
  EXPECT_EQ(ArgumentFault([&] { a->AppendChild(a); }),
            "Element 'a' cannot be placed inside itself.");
  EXPECT_EQ(ArgumentFault([&] { b->AppendChild(b); }),
            "Element 'b' cannot be placed inside itself.");
  EXPECT_EQ(ArgumentFault([&] { b->AppendChild(root); }),
            "Element 'r' cannot be placed inside itself.");
  EXPECT_EQ(ArgumentFault([&] { document->AppendChild(text.get()); }),
            "A text cannot be a child of a document.");
  EXPECT_EQ(ArgumentFault([&] { document->AppendChild(other->RootElement()); }),
            "The document has a root element already.");
  EXPECT_EQ(XmlText(document.get()), "<r><a><b/></a></r>");
  EXPECT_EQ(XmlText(other.get()), "<o/>");
}

TEST(NodeTest, DocumentAcceptsItsOwnRootAgain) {
  const Ref<Document> document = ParseXml("<!--c--><r/>");
  const Ref<ElementNode> root(document->RootElement());
  document->AppendChild(root.get());
  EXPECT_EQ(XmlText(document.get()), "<!--c--><r/>");
  document->RemoveChild(root.get());
  EXPECT_EQ(document->RootElement(), nullptr);
  document->AppendChild(NewElement("other").get());
  EXPECT_EQ(document->RootElement()->LocalName(), "other");
}

TEST(NodeTest, KeepsItsWholeTreeAlive) {
  Ref<Document> document = ParseXml("<r><a x='1'>text</a><b/></r>");
  const Ref<const Node> text(document->RootElement()->FirstChildElement("a")->FirstChild());
  document = nullptr;
  EXPECT_EQ(text->RefCount(), 1);
  const ElementNode* a = text->ParentElement();
  EXPECT_EQ(a->FindAttribute("x"), "1");
  EXPECT_EQ(XmlText(a->ParentElement()), "<r><a x=\"1\">text</a><b/></r>");
}

TEST(NodeTest, SharesOneCountAfterAppending) {
  Ref<ElementNode> parent = NewElement("p");
  Ref<ElementNode> child = NewElement("c");
  const Ref<ElementNode> second = child;
  parent->AppendChild(child.get());
  EXPECT_EQ(parent->RefCount(), 3);
  EXPECT_EQ(child->RefCount(), 3);
  parent = nullptr;
  child = nullptr;
  EXPECT_EQ(XmlText(second->Parent()), "<p><c/></p>");
  EXPECT_EQ(second->RefCount(), 1);
}

TEST(NodeTest, JoinsManyTreesInAnyOrder) {
  // Joins pairs, then pairs of pairs and so on, and changes every node afterwards.
  std::vector<Ref<ElementNode>> nodes;
  for (int index = 0; index < 64; ++index) {
    nodes.push_back(NewElement("n" + std::to_string(index)));
  }
  for (std::size_t step = 1; step < nodes.size(); step *= 2) {
    for (std::size_t index = 0; index + step < nodes.size(); index += 2 * step) {
      const std::size_t parent = (index / step) % 4 == 0 ? index : index + step;
      const std::size_t child = parent == index ? index + step : index;
      Node* top = nodes[child].get();
      while (top->Parent() != nullptr) {
        top = top->Parent();
      }
      nodes[parent]->AppendChild(top);
    }
  }
  EXPECT_EQ(nodes.front()->RefCount(), 64);
  for (std::size_t index = 0; index < nodes.size(); ++index) {
    nodes[index]->SetAttribute("i", std::string(100, 'v') + std::to_string(index));
  }
  const Ref<ElementNode> last = nodes[17];
  nodes.clear();
  EXPECT_EQ(last->RefCount(), 1);
  EXPECT_EQ(last->FindAttribute("i"), std::string(100, 'v') + "17");
}

TEST(NodeTest, IsDestroyedWithoutRecursionAtAnyDepth) {
  constexpr int kDepth = 100000;
  Ref<ElementNode> top = NewElement("e");
  for (int level = 1; level < kDepth; ++level) {
    const Ref<ElementNode> outer = NewElement("e");
    outer->AppendChild(top.get());
    top = outer;
  }
  EXPECT_EQ(XmlText(top.get()).size(), (kDepth - 1) * std::string("<e></e>").size() + 4);
  top = nullptr;
}

TEST(NodeTest, BuildsDeepTreesFromTheTopInLinearTime) {
  constexpr int kDepth = 100000;
  const Ref<ElementNode> top = NewElement("e");
  ElementNode* current = top.get();
  for (int level = 1; level < kDepth; ++level) {
    const Ref<ElementNode> inner = NewElement("e");
    current->AppendChild(inner.get());
    current = inner.get();
  }
  EXPECT_EQ(top->RefCount(), 1);
}

TEST(NodeTest, DescribesItselfWithoutContent) {
  const Ref<Document> document =
      ParseXml("<p:r xmlns:p='urn:s'>secret<!--secret--><?secret s?></p:r>");
  const Node* node = document->RootElement()->FirstChild();
  EXPECT_EQ(document->ToString(), "<Document>");
  EXPECT_EQ(document->RootElement()->ToString(), "<ElementNode p:r>");
  EXPECT_EQ(node->ToString(), "<TextNode>");
  EXPECT_EQ(node->NextSibling()->ToString(), "<CommentNode>");
  EXPECT_EQ(node->NextSibling()->NextSibling()->ToString(), "<ProcessingInstructionNode>");
}

TEST(NodeTest, IsCastToItsClassOnly) {
  const Ref<Document> document = ParseXml("<r>t</r>");
  Node* text = document->RootElement()->FirstChild();
  EXPECT_EQ(CheckedCast<TextNode>(text)->Text(), "t");
  EXPECT_THROW(CheckedCast<ElementNode>(text), TypeMismatchException);
  EXPECT_THROW(CheckedCast<Document>(static_cast<Object*>(text)), TypeMismatchException);
}

TEST(NodeTest, IsReadAndReferencedFromManyThreads) {
  std::string source = "<r xmlns:p='urn:p'>";
  for (int index = 0; index < 50; ++index) {
    source += "<p:e i='" + std::to_string(index) + "'>text</p:e>";
  }
  Ref<Document> document = ParseXml(source + "</r>");
  // Some references go through a node that had its own tree before.
  const Ref<ElementNode> added = NewElement("added");
  document->RootElement()->AppendChild(added.get());
  const std::string expected = XmlText(document.get());
  std::vector<std::thread> threads;
  std::vector<int> matches(4, 0);
  for (int& count : matches) {
    threads.emplace_back([&count, &expected, document, added] {
      for (int round = 0; round < 100; ++round) {
        const Ref<const Node> held(round % 2 == 0 ? added.get() : document->RootElement());
        const ElementNode* root = document->RootElement();
        const bool same = XmlText(root) == expected &&
                          root->FirstChildElement("urn:p", "e")->FindAttribute("i") == "0";
        count += same ? 1 : 0;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_THAT(matches, testing::Each(100));
  threads.clear();
  EXPECT_EQ(document->RefCount(), 2);
}

TEST(TextNodeTest, IsCreatedEmpty) {
  Ref<TextNode> text;
  CreateTextNode(text);
  EXPECT_EQ(text->Kind(), NodeKind::kText);
  EXPECT_EQ(text->Text(), "");
  EXPECT_EQ(text->Parent(), nullptr);
}

TEST(TextNodeTest, RefusesWhatXmlDoesNotAllowAndNamesTheElement) {
  constexpr const char* kRest =
      " holds what XML cannot carry: a control character or bytes that are not UTF-8.";
  const Ref<TextNode> text = NewText("before");
  EXPECT_EQ(ArgumentFault([&] { text->SetText("pass\x02word"); }), std::string("The text") + kRest);
  const Ref<ElementNode> element = NewElement("Password");
  element->AppendChild(text.get());
  for (const std::string& bad :
       {std::string("a\0b", 3), std::string("\xFF"), std::string("\xEF\xBF\xBF"),
        std::string("\xC3"), std::string("\x0B")}) {
    EXPECT_EQ(ArgumentFault([&] { text->SetText(bad); }),
              std::string("The text of element 'Password'") + kRest);
  }
  EXPECT_EQ(text->Text(), "before");
}

TEST(TextNodeTest, MayBeSetFromItsOwnText) {
  const Ref<TextNode> text = NewText("some text");
  text->SetText(text->Text().substr(5));
  EXPECT_EQ(text->Text(), "text");
}

}  // namespace
}  // namespace Tarnik::Testing
