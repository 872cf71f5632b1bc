#include "gate/confirmation_end.h"

#include <string_view>

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>

namespace SsoClient::Access {

namespace {

constexpr std::string_view kAssertionNamespace = "urn:oasis:names:tc:SAML:2.0:assertion";

}  // namespace

Tarnik::System::DateTime ConfirmationEndOf(const SamlToken& token) {
  const auto signature = token.GetSignature();
  const Tarnik::Xml::ElementNode* element = signature->Element()->ParentElement();
  for (const std::string_view name :
       {"Subject", "SubjectConfirmation", "SubjectConfirmationData"}) {
    element = element == nullptr ? nullptr : element->FirstChildElement(kAssertionNamespace, name);
  }
  const auto end = element == nullptr ? std::nullopt : element->FindAttribute("NotOnOrAfter");
  return end ? Tarnik::System::DateTime::Parse(*end) : Tarnik::System::DateTime();
}

}  // namespace SsoClient::Access
