#include "xml/security/reference_targets.h"

#include <tarnik/xml/document.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <algorithm>
#include <string_view>

#include "support/quote.h"
#include "xml/security/content_reader.h"

namespace Tarnik::Xml::Security {
namespace {

constexpr std::string_view kWsuNamespace =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";

/// What the document holds of one id.
struct Search {
  std::string_view id;
  const ElementNode* carrier = nullptr;
  bool isUsable = false;  // an attribute of the carrier is a true id with exactly this value
};

constexpr bool IsAsciiLetter(char c) noexcept {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}

constexpr bool IsIdCharacter(char c) noexcept {
  return IsAsciiLetter(c) || (c >= '0' && c <= '9') || c == '_' || c == '-' || c == '.';
}

// The NCNames that stand in a URI without escapes (RFC 3986, section 3.5).
bool IsPlainId(std::string_view text) noexcept {
  return !text.empty() && (IsAsciiLetter(text[0]) || text[0] == '_') &&
         std::all_of(text.begin(), text.end(), IsIdCharacter);
}

bool MayBeTakenForId(std::string_view localName) noexcept {
  return localName.size() == 2 && (localName[0] | 0x20) == 'i' && (localName[1] | 0x20) == 'd';
}

bool IsTrueId(const ElementNode* element, const QualifiedName& name) noexcept {
  if (name.Prefix().empty()) {
    return name.Local() == "ID" || name.Local() == "Id" || name.Local() == "id";
  }
  if (name.Prefix() == "xml") {
    return name.Local() == "id";
  }
  return name.Local() == "Id" && element->LookupNamespace(name.Prefix()) == kWsuNamespace;
}

void Note(const ElementNode* element, const Attribute& attribute, Search& search) {
  // An xml:id is compared without the blanks around it (xml:id 1.0, section 4), and some processors
  // do so with every id; a value that only they would find is a second carrier, too.
  if (Trim(attribute.Value()) != search.id) {
    return;
  }
  if (search.carrier != nullptr && search.carrier != element) {
    throw XmlSecurityException("The id " + Quote(search.id) +
                               " of a reference stands on more than one element.");
  }
  search.carrier = element;
  if (attribute.Value() == search.id && IsTrueId(element, attribute.Qualified())) {
    search.isUsable = true;
  }
}

void NoteIds(const ElementNode* element, std::vector<Search>& searches) {
  for (std::size_t i = 0; i < element->AttributeCount(); ++i) {
    const Attribute& attribute = element->AttributeAt(i);
    if (!MayBeTakenForId(attribute.Qualified().Local())) {
      continue;
    }
    for (Search& search : searches) {
      Note(element, attribute, search);
    }
  }
}

// The topmost node above an element is an element or a document.
const ElementNode* RootElementOf(const Node* root) noexcept {
  return root->Kind() == NodeKind::kDocument ? static_cast<const Document*>(root)->RootElement()
                                             : static_cast<const ElementNode*>(root);
}

void NoteAllIds(const Node* root, std::vector<Search>& searches) {
  for (const ElementNode* element = RootElementOf(root); element != nullptr;
       element = element->NextElement(nullptr)) {
    NoteIds(element, searches);
  }
}

std::vector<Search> SearchesFor(const std::vector<Reference>& references) {
  std::vector<Search> searches;
  for (const Reference& reference : references) {
    const std::string_view uri = reference.uri;
    if (uri.empty()) {
      continue;
    }
    if (uri.front() != '#' || !IsPlainId(uri.substr(1))) {
      throw XmlSecurityException("The reference " + Quote(uri) +
                                 " is not of the form '#id' within the document.");
    }
    searches.push_back({uri.substr(1)});
  }
  return searches;
}

const ElementNode* CarrierOf(const Search& search) {
  if (!search.isUsable) {
    throw XmlSecurityException("No element carries the id " + Quote(search.id) +
                               " of a reference.");
  }
  return search.carrier;
}

}  // namespace

const Node* RootOf(const Node* node) noexcept {
  while (node->Parent() != nullptr) {
    node = node->Parent();
  }
  return node;
}

bool IsWithin(const Node* inner, const Node* outer) noexcept {
  while (inner != nullptr && inner != outer) {
    inner = inner->Parent();
  }
  return inner != nullptr;
}

std::vector<const Node*> FindReferenceTargets(const Node* root, const ElementNode* signature,
                                              const std::vector<Reference>& references) {
  std::vector<Search> searches = SearchesFor(references);
  if (!searches.empty()) {
    NoteAllIds(root, searches);
    if (!IsWithin(signature, root)) {
      NoteAllIds(RootOf(signature), searches);
    }
  }
  std::vector<const Node*> targets;
  targets.reserve(references.size());
  std::size_t next = 0;
  for (const Reference& reference : references) {
    targets.push_back(reference.uri.empty() ? root : CarrierOf(searches[next++]));
  }
  return targets;
}

}  // namespace Tarnik::Xml::Security
