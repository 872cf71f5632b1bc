#include "xml_tree.h"

#include <algorithm>

#include <libxml/parser.h>

namespace Fuzz {
namespace {

struct FreeContext {
  void operator()(xmlParserCtxt* context) const noexcept { xmlFreeParserCtxt(context); }
};

bool IsText(const xmlNode& node) {
  return node.type == XML_TEXT_NODE || node.type == XML_CDATA_SECTION_NODE;
}

bool IsBlank(const Item& item) {
  return item.isText && item.text.find_first_not_of(" \t\r\n") == std::string::npos;
}

}  // namespace

XmlTree ParseByLibXml2(const std::string& text) {
  const std::unique_ptr<xmlParserCtxt, FreeContext> context(xmlNewParserCtxt());
  constexpr int kOptions =
      XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING | XML_PARSE_HUGE;
  XmlTree tree(xmlCtxtReadMemory(context.get(), text.data(), static_cast<int>(text.size()), nullptr,
                                 nullptr, kOptions));
  const bool isWellFormed =
      tree != nullptr && context->wellFormed != 0 && context->nsWellFormed != 0;
  return isWellFormed ? std::move(tree) : nullptr;
}

std::string TextOf(const xmlChar* text) {
  return text == nullptr ? std::string() : reinterpret_cast<const char*>(text);
}

std::vector<Item> ChildrenOf(const xmlNode* element) {
  std::vector<Item> items;
  bool followsText = false;
  for (xmlNode* node = element->children; node != nullptr; node = node->next) {
    if (!IsText(*node)) {
      items.push_back({node, node->type == XML_ELEMENT_NODE, false, ""});
      followsText = false;
      continue;
    }
    const std::string text = TextOf(node->content);
    if (text.empty()) {
      continue;
    }
    if (followsText) {
      items.back().text += text;
    } else {
      items.push_back({node, false, true, text});
    }
    followsText = true;
  }
  return items;
}

std::vector<Item> ContentOf(const xmlNode* element) {
  std::vector<Item> items = ChildrenOf(element);
  std::erase_if(
      items, [](const Item& item) { return item.node->type == XML_COMMENT_NODE || IsBlank(item); });
  return items;
}

std::string LocalNameOf(const xmlNode* element) {
  return TextOf(element->name);
}

std::string NamespaceOf(const xmlNode* element) {
  return element->ns == nullptr ? std::string() : TextOf(element->ns->href);
}

std::vector<XmlAttribute> AttributesOf(const xmlNode* element) {
  std::vector<XmlAttribute> attributes;
  for (const xmlAttr* at = element->properties; at != nullptr; at = at->next) {
    const bool hasPrefix = at->ns != nullptr && at->ns->prefix != nullptr;
    xmlChar* const value = xmlNodeListGetString(element->doc, at->children, 1);
    attributes.push_back({(hasPrefix ? TextOf(at->ns->prefix) + ":" : "") + TextOf(at->name),
                          TextOf(at->name), at->ns == nullptr ? "" : TextOf(at->ns->href),
                          TextOf(value)});
    xmlFree(value);
  }
  return attributes;
}

std::optional<std::string> AttributeOf(const xmlNode* element, const std::string& name) {
  for (const XmlAttribute& attribute : AttributesOf(element)) {
    if (attribute.name == name) {
      return attribute.value;
    }
  }
  return std::nullopt;
}

const xmlNode* ChildElement(const xmlNode* element, const std::string& localName) {
  const xmlNode* child = element == nullptr ? nullptr : element->children;
  while (child != nullptr && (child->type != XML_ELEMENT_NODE || LocalNameOf(child) != localName)) {
    child = child->next;
  }
  return child;
}

std::optional<std::string> NamespaceBoundTo(const xmlNode* element, const std::string& prefix) {
  if (prefix == "xml") {
    return "http://www.w3.org/XML/1998/namespace";
  }
  for (const xmlNode* at = element; at != nullptr && at->type == XML_ELEMENT_NODE;
       at = at->parent) {
    for (const xmlNs* ns = at->nsDef; ns != nullptr; ns = ns->next) {
      if (TextOf(ns->prefix) == prefix) {
        return TextOf(ns->href);
      }
    }
  }
  return std::nullopt;
}

}  // namespace Fuzz
