#include "xml/security/reference_targets.h"

#include <algorithm>
#include <string_view>

#include <tarnik/xml/document.h>
#include <tarnik/xml/security/ids.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/ascii.h"
#include "support/quote.h"
#include "xml/tree_builder.h"

namespace Tarnik::Xml::Security {
namespace {

constexpr std::string_view kWsuNamespace =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";

/// The search for the element with one id.
struct IdLookup {
  std::string_view id;
  const ElementNode* element = nullptr;  // the element found so far
  bool isTrueId = false;                 // an attribute of it is an id with exactly this value
};

constexpr bool IsIdCharacter(char c) noexcept {
  return IsLetter(c) || IsDigit(c) || c == '_' || c == '-' || c == '.';
}

// True for an NCName that needs no escapes in a URI fragment (RFC 3986, section 3.5).
bool IsPlainId(std::string_view text) noexcept {
  return !text.empty() && (IsLetter(text[0]) || text[0] == '_') &&
         std::all_of(text.begin(), text.end(), IsIdCharacter);
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

// `attribute` may be taken for an id with the value of `lookup`, even where `IsTrueId` says no.
void Count(const ElementNode* element, const Attribute& attribute, IdLookup& lookup) {
  if (lookup.element != nullptr && lookup.element != element) {
    throw XmlSecurityException("More than one element has the id " + Quote(lookup.id) +
                               " of a reference.");
  }
  lookup.element = element;
  if (attribute.Value() == lookup.id && IsTrueId(element, attribute.Qualified())) {
    lookup.isTrueId = true;
  }
}

void CollectIdsOf(const ElementNode* element, std::vector<IdLookup>& lookups) {
  const Attribute* const attributes = TreeBuilder::AttributesOf(*element);
  for (std::size_t i = 0; i < TreeBuilder::AttributeCountOf(*element); ++i) {
    const Attribute& attribute = attributes[i];
    const auto id = PossibleId(attribute);
    if (!id) {
      continue;
    }
    for (IdLookup& lookup : lookups) {
      if (*id == lookup.id) {
        Count(element, attribute, lookup);
      }
    }
  }
}

// `root` is an element or a document, since it is the topmost node above an element.
const ElementNode* RootElementOf(const Node* root) noexcept {
  return root->Kind() == NodeKind::kDocument ? static_cast<const Document*>(root)->RootElement()
                                             : static_cast<const ElementNode*>(root);
}

void CollectIds(const Node* root, std::vector<IdLookup>& lookups) {
  for (const ElementNode* element = RootElementOf(root); element != nullptr;
       element = element->NextElement(nullptr)) {
    CollectIdsOf(element, lookups);
  }
}

std::vector<IdLookup> LookupsFor(const std::vector<Reference>& references) {
  std::vector<IdLookup> lookups;
  for (const Reference& reference : references) {
    const std::string_view uri = reference.uri;
    if (uri.empty()) {
      continue;
    }
    if (uri.front() != '#' || !IsPlainId(uri.substr(1))) {
      throw XmlSecurityException("The reference " + Quote(uri) +
                                 " is not of the form '#id' within the document.");
    }
    lookups.push_back({uri.substr(1)});
  }
  return lookups;
}

const ElementNode* RequireElement(const IdLookup& lookup) {
  if (!lookup.isTrueId) {
    throw XmlSecurityException("No element has the id " + Quote(lookup.id) + " of a reference.");
  }
  return lookup.element;
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
  std::vector<IdLookup> lookups = LookupsFor(references);
  if (!lookups.empty()) {
    CollectIds(root, lookups);
    if (!IsWithin(signature, root)) {
      CollectIds(RootOf(signature), lookups);
    }
  }
  std::vector<const Node*> targets;
  targets.reserve(references.size());
  std::size_t next = 0;
  for (const Reference& reference : references) {
    targets.push_back(reference.uri.empty() ? root : RequireElement(lookups[next++]));
  }
  return targets;
}

}  // namespace Tarnik::Xml::Security
