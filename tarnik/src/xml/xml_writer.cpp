#include <tarnik/core/exception.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_writer.h>

#include "xml/output_buffer.h"
#include "xml/tree_builder.h"

namespace Tarnik::Xml {

namespace {

void WriteStartTag(const ElementNode& element, OutputBuffer& output) {
  output.Append('<');
  output.Append(element.QualifiedNameText());
  for (std::size_t index = 0; index < element.AttributeCount(); ++index) {
    const Attribute& attribute = element.AttributeAt(index);
    output.Append(' ');
    output.Append(attribute.Name());
    output.Append("=\"");
    output.AppendAttributeValue(attribute.Value());
    output.Append('"');
  }
  output.Append(element.FirstChild() == nullptr ? "/>" : ">");
}

void WriteEndTag(const ElementNode& element, OutputBuffer& output) {
  output.Append("</");
  output.Append(element.QualifiedNameText());
  output.Append('>');
}

void WriteStart(const Node& node, OutputBuffer& output) {
  switch (node.Kind()) {
    case NodeKind::kElement:
      WriteStartTag(static_cast<const ElementNode&>(node), output);
      break;
    case NodeKind::kText:
      output.AppendText(static_cast<const TextNode&>(node).Text());
      break;
    case NodeKind::kComment:
      output.AppendComment(static_cast<const CommentNode&>(node).Text());
      break;
    case NodeKind::kProcessingInstruction: {
      const auto& instruction = static_cast<const ProcessingInstructionNode&>(node);
      output.AppendProcessingInstruction(instruction.Target(), instruction.Text());
      break;
    }
    case NodeKind::kDocument:
      break;
  }
}

const Node* FirstChildOf(const Node& node) noexcept {
  const bool isParent = node.Kind() == NodeKind::kElement || node.Kind() == NodeKind::kDocument;
  return isParent ? static_cast<const ParentNode&>(node).FirstChild() : nullptr;
}

}  // namespace

void WriteXml(const Node* node, Writer* writer) {
  if (node == nullptr || writer == nullptr) {
    throw InvalidArgumentException("Writing XML needs a node and a writer.");
  }
  OutputBuffer output(*writer);
  const Node* current = node;
  WriteStart(*current, output);
  // Iterative, since trees that callers build may be as deep as memory allows.
  while (true) {
    if (const Node* child = FirstChildOf(*current)) {
      current = child;
      WriteStart(*current, output);
      continue;
    }
    while (current != node && current->NextSibling() == nullptr) {
      current = current->Parent();
      if (current->Kind() == NodeKind::kElement) {
        WriteEndTag(static_cast<const ElementNode&>(*current), output);
      }
    }
    if (current == node) {
      break;
    }
    current = current->NextSibling();
    WriteStart(*current, output);
  }
  output.Flush();
}

}  // namespace Tarnik::Xml
