#include "xml_elements.h"

#include <libxml/parserInternals.h>
#include <libxml/tree.h>

#include "xml_tree.h"

namespace Fuzz {
namespace {

std::string NameOf(const xmlAttr& attribute) {
  const std::string name = TextOf(attribute.name);
  return attribute.ns == nullptr ? name : "{" + TextOf(attribute.ns->href) + "}" + name;
}

Element Read(const xmlNode& node) {
  Element element{node.ns == nullptr ? "" : TextOf(node.ns->href), TextOf(node.name)};
  for (const xmlAttr* attribute = node.properties; attribute != nullptr;
       attribute = attribute->next) {
    xmlChar* const value = xmlNodeListGetString(node.doc, attribute->children, 1);
    element.attributes[NameOf(*attribute)] = TextOf(value);
    xmlFree(value);
  }
  for (const xmlNode* child = node.children; child != nullptr; child = child->next) {
    if (child->type == XML_TEXT_NODE || child->type == XML_CDATA_SECTION_NODE) {
      element.text += TextOf(child->content);
    } else if (child->type == XML_ELEMENT_NODE) {
      element.children.push_back(Read(*child));
    }
  }
  return element;
}

// libxml2 also decodes characters that are longer than they need be, and stray octets.
int ShortestLength(int character) {
  return character < 0x80 ? 1 : character < 0x800 ? 2 : character < 0x10000 ? 3 : 4;
}

}  // namespace

std::optional<Element> ReadWithLibXml2(const std::string& xml) {
  const XmlTree tree = ParseByLibXml2(xml);
  return tree == nullptr ? std::nullopt : std::optional(Read(*xmlDocGetRootElement(tree.get())));
}

bool IsXmlText(const std::string& text) {
  const auto* bytes = reinterpret_cast<const unsigned char*>(text.data());
  int left = static_cast<int>(text.size());
  while (left > 0) {
    int size = left;
    const int character = xmlGetUTF8Char(bytes, &size);
    const bool isStray = *bytes >= 0x80 && *bytes < 0xC2;
    if (isStray || character < 0 || !xmlIsCharQ(static_cast<unsigned>(character)) ||
        size != ShortestLength(character)) {
      return false;
    }
    bytes += size;
    left -= size;
  }
  return true;
}

}  // namespace Fuzz
