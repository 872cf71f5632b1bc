#include "xml/own_ids.h"

#include <cstddef>
#include <string>
#include <string_view>

#include <tarnik/core/exception.h>

#include "xml/namespaces.h"

namespace SsoClient {

namespace {

using Tarnik::Xml::ElementNode;
using Tarnik::Xml::Node;
using Tarnik::Xml::NodeKind;

// Whatever its namespace: services differ in what they take for an id.
bool MayBeTakenForId(std::string_view localName) {
  return localName == "Id" || localName == "ID" || localName == "id";
}

bool Carries(const ElementNode& element, std::string_view id) {
  for (std::size_t i = 0; i < element.AttributeCount(); ++i) {
    const auto& attribute = element.AttributeAt(i);
    if (attribute.Value() == id && MayBeTakenForId(attribute.Qualified().Local())) {
      return true;
    }
  }
  return false;
}

// Without recursion: tokens may be deep.
const Node* NextInDocument(const Node* node) {
  if (node->Kind() == NodeKind::kElement) {
    if (const Node* child = static_cast<const ElementNode*>(node)->FirstChild()) {
      return child;
    }
  }
  while (node != nullptr && node->NextSibling() == nullptr) {
    node = node->Parent();
  }
  return node == nullptr ? nullptr : node->NextSibling();
}

[[noreturn]] void Refuse(const char* id) {
  throw Tarnik::InvalidArgumentException(std::string("A token in the request carries the id '") +
                                         id + "', which is the request's own");
}

}  // namespace

void RequireOwnIds(const ElementNode& envelope) {
  int certificates = 0;
  for (const Node* node = &envelope; node != nullptr; node = NextInDocument(node)) {
    if (node->Kind() != NodeKind::kElement) {
      continue;
    }
    const auto& element = static_cast<const ElementNode&>(*node);
    if (Carries(element, kProofSignatureId)) {
      Refuse(kProofSignatureId);
    }
    if (Carries(element, kCertificateId) && ++certificates > 1) {
      Refuse(kCertificateId);
    }
  }
}

}  // namespace SsoClient
