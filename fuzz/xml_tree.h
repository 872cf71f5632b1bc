#ifndef FUZZ_XML_TREE_H
#define FUZZ_XML_TREE_H

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <libxml/tree.h>

namespace Fuzz {

struct FreeDocument {
  void operator()(xmlDoc* document) const noexcept { xmlFreeDoc(document); }
};
using XmlTree = std::unique_ptr<xmlDoc, FreeDocument>;

/// The tree that libxml2 builds, or null if it finds the text not to be well-formed. It fetches
/// nothing and has no limits of size.
XmlTree ParseByLibXml2(const std::string& text);

/// A text of libxml2; empty for null.
std::string TextOf(const xmlChar* text);

/// An element, a text or another node inside an element. Texts that follow each other directly,
/// CDATA sections too, are one text.
struct Item {
  xmlNode* node = nullptr;
  bool isElement = false;
  bool isText = false;
  std::string text;
};

/// The children of an element; empty texts are no children.
std::vector<Item> ChildrenOf(const xmlNode* element);
/// Those that are neither comments nor only white space (the four characters of XML 1.0, section
/// 2.3).
std::vector<Item> ContentOf(const xmlNode* element);

std::string LocalNameOf(const xmlNode* element);
/// Empty for none.
std::string NamespaceOf(const xmlNode* element);

/// An attribute that is no namespace declaration.
struct XmlAttribute {
  std::string name;  ///< with the prefix, as written
  std::string localName;
  std::string space;  ///< empty for none
  std::string value;
};
std::vector<XmlAttribute> AttributesOf(const xmlNode* element);
/// The value of the attribute with this name, as written; none if it is absent.
std::optional<std::string> AttributeOf(const xmlNode* element, const std::string& name);

/// The first child element with this local name; null if there is none, or no element.
const xmlNode* ChildElement(const xmlNode* element, const std::string& localName);

/// The namespace to which a prefix, "" for none, is bound at the element; none if it is unbound.
std::optional<std::string> NamespaceBoundTo(const xmlNode* element, const std::string& prefix);

}  // namespace Fuzz

#endif
