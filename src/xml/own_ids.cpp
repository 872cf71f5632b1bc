#include "xml/own_ids.h"

#include <cstddef>
#include <string>
#include <string_view>

#include <tarnik/core/exception.h>

#include "xml/namespaces.h"

namespace SsoClient {

namespace {

using Tarnik::Xml::ElementNode;

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

[[noreturn]] void Refuse(const char* id) {
  throw Tarnik::InvalidArgumentException(std::string("A token in the request carries the id '") +
                                         id + "', which is the request's own");
}

}  // namespace

void RequireOwnIds(const ElementNode& envelope) {
  int certificates = 0;
  for (const ElementNode* element = &envelope; element != nullptr;
       element = element->NextElement(&envelope)) {
    if (Carries(*element, kProofSignatureId)) {
      Refuse(kProofSignatureId);
    }
    if (Carries(*element, kCertificateId) && ++certificates > 1) {
      Refuse(kCertificateId);
    }
  }
}

}  // namespace SsoClient
