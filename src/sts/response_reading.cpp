#include "sts/response_reading.h"

#include <algorithm>
#include <array>

#include <ssoclient/exceptions.h>
#include <tarnik/core/checked_cast.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/security/canonicalizer.h>

#include "support/namespaces.h"
#include "support/qname.h"

namespace SsoClient {

using Tarnik::Xml::ElementNode;
using Tarnik::Xml::TextNode;

const TextNode* FirstTextChild(const ElementNode* element) {
  if (element == nullptr) {
    return nullptr;
  }
  const auto* child = element->FirstChild();
  if (child == nullptr || child->Kind() != Tarnik::Xml::NodeKind::kText) {
    return nullptr;
  }
  return Tarnik::CheckedCast<const TextNode>(child);
}

std::string_view ElementText(const ElementNode* element) {
  const auto* text = FirstTextChild(element);
  return text == nullptr ? std::string_view() : text->Text();
}

const ElementNode* FindDescendant(const ElementNode& element,
                                  std::initializer_list<std::string_view> path) {
  const ElementNode* current = &element;
  for (const auto localName : path) {
    current = current->FirstChildElement(localName);
    if (current == nullptr) {
      return nullptr;
    }
  }
  return current;
}

std::string CanonicalizeElement(const ElementNode* element) {
  if (element == nullptr) {
    return {};
  }
  const auto writer = Tarnik::CreateStringWriter();
  Tarnik::Xml::Security::CreateCanonicalizer("http://www.w3.org/TR/2001/REC-xml-c14n-20010315#")
      ->Canonicalize(element, writer.get());
  return writer->TakeText();
}

namespace {

struct FaultCode {
  std::string_view namespaceUri;
  std::string_view localName;

  bool Matches(const QName& name) const {
    return name.namespaceUri == namespaceUri && name.localName == localName;
  }
};

constexpr FaultCode kFailedAuthentication = {kWstNamespace, "FailedAuthentication"};
constexpr std::array kRejectedCredentials = {
    kFailedAuthentication,
    FaultCode{kWstNamespace, "InvalidSecurityToken"},
    FaultCode{kWsseNamespace, "InvalidSecurityToken"},
};

constexpr std::string_view kPasswordExpired = "Password of the user logging on is expired";
constexpr char kAuthenticationFailed[] = "Authentication failed";

bool MeansRejectedCredentials(const QName& code) {
  return std::any_of(kRejectedCredentials.begin(), kRejectedCredentials.end(),
                     [&code](const FaultCode& known) { return known.Matches(code); });
}

[[noreturn]] void ThrowFault(const QName& code, std::string_view codeText,
                             std::string_view faultString) {
  if (!MeansRejectedCredentials(code)) {
    throw SsoException("Unexpected SOAP fault: " + std::string(codeText) + "; request failed.");
  }
  if (kFailedAuthentication.Matches(code) && faultString.starts_with(kPasswordExpired)) {
    throw PasswordExpiredException(std::string(kAuthenticationFailed) + ": " +
                                   std::string(faultString));
  }
  if (faultString.empty()) {
    throw InvalidCredentialsException(kAuthenticationFailed);
  }
  throw InvalidCredentialsException(std::string(kAuthenticationFailed) + ": " +
                                    std::string(faultString));
}

}  // namespace

void CheckSoapFault(const Tarnik::Xml::ElementNode& envelope) {
  const auto* fault = FindDescendant(envelope, {"Body", "Fault"});
  if (fault == nullptr) {
    return;
  }
  const auto* faultCode = fault->FirstChildElement("faultcode");
  const auto* codeText = FirstTextChild(faultCode);
  if (codeText == nullptr) {
    throw SsoException("Invalid SOAP response: missing faultcode.");
  }
  const QName code = ResolveQName(*faultCode, codeText->Text(), kSoapNamespace);
  ThrowFault(code, codeText->Text(), ElementText(fault->FirstChildElement("faultstring")));
}

}  // namespace SsoClient
