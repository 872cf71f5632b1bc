#include "integration/wire_request.h"

#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <tarnik/core/checked_cast.h>
#include <tarnik/xml/character_nodes.h>

#include "support/parse_xml.h"

namespace SsoClient::Testing {

namespace {

using Tarnik::Xml::ElementNode;

constexpr std::string_view kStart = "<saml2:Assertion";
constexpr std::string_view kEnd = "</saml2:Assertion>";

const ElementNode* Descend(const ElementNode* element,
                           const std::vector<std::string_view>& localNames) {
  for (const auto name : localNames) {
    if (element == nullptr) {
      return nullptr;
    }
    element = element->FirstChildElement(name);
  }
  return element;
}

std::vector<const ElementNode*> ChildrenOf(const ElementNode* element) {
  std::vector<const ElementNode*> children;
  if (element == nullptr) {
    return children;
  }
  for (const auto* node = element->FirstChild(); node != nullptr; node = node->NextSibling()) {
    if (node->Kind() == Tarnik::Xml::NodeKind::kElement) {
      children.push_back(static_cast<const ElementNode*>(node));
    }
  }
  return children;
}

std::string KeyTypeOf(const ElementNode& request) {
  const ElementNode* element = request.FirstChildElement("KeyType");
  if (element == nullptr) {
    return {};
  }
  const auto* text = Tarnik::CheckedCast<const Tarnik::Xml::TextNode>(element->FirstChild());
  return std::string(text->Text().substr(text->Text().rfind('/') + 1));
}

}  // namespace

WireRequest ReadWireRequest(const std::string& body) {
  const auto document = ParseXml(body);
  const ElementNode* envelope = document->RootElement();
  const ElementNode* security = Descend(envelope, {"Header", "Security"});
  const ElementNode* request = Descend(envelope, {"Body", "RequestSecurityToken"});
  if (security == nullptr || request == nullptr) {
    throw std::runtime_error("no Security or no RequestSecurityToken");
  }
  WireRequest found;
  for (const ElementNode* entry : ChildrenOf(security)) {
    found.securityEntries.emplace_back(entry->LocalName());
  }
  const auto references =
      ChildrenOf(Descend(security, {"Signature", "KeyInfo", "SecurityTokenReference"}));
  if (references.size() == 1) {
    found.keyReference = references.front()->LocalName();
  }
  found.keyType = KeyTypeOf(*request);
  if (const ElementNode* useKey = request->FirstChildElement("UseKey")) {
    found.useKey = useKey->FindAttribute("Sig").value_or("");
  }
  return found;
}

std::string AssertionIn(const std::string& text) {
  const auto from = text.find(kStart);
  const auto end = text.find(kEnd, from);
  if (from == std::string::npos || end == std::string::npos) {
    throw std::runtime_error("no assertion");
  }
  return text.substr(from, end + kEnd.size() - from);
}

}  // namespace SsoClient::Testing
