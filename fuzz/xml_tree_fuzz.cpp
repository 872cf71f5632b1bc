// The input determines how a tree is built and changed. After every step the tree is the same as a
// model of it, and libxml2 reads the written tree back as the model. Changes that no document can
// have are refused and change nothing.
#include <algorithm>
#include <string>
#include <vector>

#include <fuzzer/FuzzedDataProvider.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_writer.h>

#include "input.h"
#include "xml_elements.h"
#include "xml_input.h"

namespace {

using namespace Tarnik;

/// An element of the tree and of the model.
struct Twin {
  Ref<Xml::ElementNode> element;
  Fuzz::Element model;
  int parent = -1;
  std::vector<int> children = {};
};

class Tree {
 public:
  explicit Tree(FuzzedDataProvider& input) : input_(input) { Create(); }

  void Step() {
    switch (input_.ConsumeIntegralInRange(0, 4)) {
      case 0:
        Create();
        break;
      case 1:
        Append(Any(), Any());
        break;
      case 2:
        Remove(Any(), Any());
        break;
      case 3:
        SetAttribute(twins_[static_cast<std::size_t>(Any())]);
        break;
      default:
        AddText(twins_[static_cast<std::size_t>(Any())]);
    }
  }

  void Check() {
    for (std::size_t i = 0; i < twins_.size(); ++i) {
      const Twin& twin = twins_[i];
      Fuzz::Require(twin.element->ParentElement() ==
                    (twin.parent < 0 ? nullptr : At(twin.parent).element.get()));
      Fuzz::Require(twin.element->ToString().find(twin.model.name) != std::string::npos);
      if (twin.parent < 0) {
        const auto writer = CreateStringWriter();
        Xml::WriteXml(twin.element.get(), writer.get());
        Fuzz::Require(Fuzz::ReadWithLibXml2(writer->Text()) == ModelOf(static_cast<int>(i)));
      }
    }
  }

 private:
  Twin& At(int index) { return twins_[static_cast<std::size_t>(index)]; }
  int Any() { return input_.ConsumeIntegralInRange(0, static_cast<int>(twins_.size()) - 1); }

  void Create() {
    const std::string name = input_.ConsumeBool() ? "a" : input_.ConsumeRandomLengthString(6);
    Twin twin;
    try {
      Xml::CreateElementNode("", name, twin.element);
    } catch (const InvalidArgumentException&) {
      return Create("b");
    }
    Keep(std::move(twin), name);
  }
  void Create(const std::string& name) {
    Twin twin;
    Xml::CreateElementNode("", name, twin.element);
    Keep(std::move(twin), name);
  }
  void Keep(Twin twin, const std::string& name) {
    twin.model.name = name;
    twins_.push_back(std::move(twin));
  }

  bool IsWithin(int inner, int outer) {
    for (; inner >= 0; inner = At(inner).parent) {
      if (inner == outer) {
        return true;
      }
    }
    return false;
  }

  void Detach(int child) {
    if (At(child).parent >= 0) {
      std::erase(At(At(child).parent).children, child);
      At(child).parent = -1;
    }
  }

  void Append(int parent, int child) {
    const bool isAllowed = !IsWithin(parent, child);
    try {
      At(parent).element->AppendChild(At(child).element.get());
      Fuzz::Require(isAllowed);
    } catch (const InvalidArgumentException&) {
      Fuzz::Require(!isAllowed);
      return;
    }
    Detach(child);
    At(child).parent = parent;
    At(parent).children.push_back(child);
  }

  void Remove(int parent, int child) {
    const bool isAllowed = At(child).parent == parent;
    try {
      At(parent).element->RemoveChild(At(child).element.get());
      Fuzz::Require(isAllowed);
      Detach(child);
    } catch (const InvalidArgumentException&) {
      Fuzz::Require(!isAllowed);
    }
  }

  void SetAttribute(Twin& twin) {
    const std::string name = input_.ConsumeBool() ? "b" : input_.ConsumeRandomLengthString(6);
    const std::string value = input_.ConsumeRandomLengthString(12);
    // Namespaces would change the names of the elements below.
    if (name.starts_with("xml") || name.find(':') != std::string::npos) {
      return;
    }
    try {
      twin.element->SetAttribute(name, value);
      twin.model.attributes[name] = value;
    } catch (const InvalidArgumentException&) {
      Fuzz::Require(name != "b" || !Fuzz::IsXmlText(value));
    }
  }

  // An element has at most one text here, before its children.
  void AddText(Twin& twin) {
    const std::string text = input_.ConsumeRandomLengthString(12);
    Ref<Xml::TextNode> node;
    Xml::CreateTextNode(node);
    try {
      node->SetText(text);
    } catch (const InvalidArgumentException&) {
      Fuzz::Require(!Fuzz::IsXmlText(text));
      return;
    }
    twin.element->AppendChild(node.get());
    twin.model.text += text;
  }

  Fuzz::Element ModelOf(int index) {
    Fuzz::Element model = At(index).model;
    for (const int child : At(index).children) {
      model.children.push_back(ModelOf(child));
    }
    return model;
  }

  FuzzedDataProvider& input_;
  std::vector<Twin> twins_;
};

/// A document has one root element and no text.
void CheckDocument(FuzzedDataProvider& input) {
  const auto document = Fuzz::ParseXml(input.ConsumeRandomLengthString(40));
  if (document == nullptr) {
    return;
  }
  Ref<Xml::TextNode> text;
  Xml::CreateTextNode(text);
  Ref<Xml::ElementNode> second;
  Xml::CreateElementNode("", "second", second);
  Xml::Node* const refused[] = {text.get(), second.get(), document.get(), nullptr};
  for (Xml::Node* node : refused) {
    bool isRefused = false;
    try {
      document->AppendChild(node);
    } catch (const InvalidArgumentException&) {
      isRefused = true;
    }
    Fuzz::Require(isRefused);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider input(data, size);
  CheckDocument(input);
  Tree tree(input);
  for (int steps = 0; steps < 20 && input.remaining_bytes() > 0; ++steps) {
    tree.Step();
    tree.Check();
  }
  return 0;
}
