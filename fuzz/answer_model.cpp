#include "answer_model.h"

#include <initializer_list>

#include "value_model.h"
#include "xml_tree.h"

namespace Fuzz {
namespace {

const std::string kSoap = "http://schemas.xmlsoap.org/soap/envelope/";
const std::string kTrust = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
const std::string kSecurity =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
const std::string kSaml = "urn:oasis:names:tc:SAML:2.0:assertion";

const xmlNode* ElementAt(const xmlNode* element, std::initializer_list<const char*> path) {
  for (const char* name : path) {
    element = ChildElement(element, name);
  }
  return element;
}

// The text that an element begins with.
std::optional<std::string> FirstTextOf(const xmlNode* element) {
  if (element == nullptr) {
    return std::nullopt;
  }
  const std::vector<Item> children = ChildrenOf(element);
  return !children.empty() && children.front().isText ? std::optional(children.front().text)
                                                      : std::nullopt;
}

struct Code {
  std::optional<std::string> space;  ///< none for an undeclared prefix
  std::string name;
};

Code CodeOf(const xmlNode* element, const std::string& written) {
  const std::string text = Trimmed(written);
  const std::size_t colon = text.find(':');
  if (colon == std::string::npos) {
    return {kSoap, text};
  }
  return {NamespaceBoundTo(element, text.substr(0, colon)), text.substr(colon + 1)};
}

}  // namespace

ModelFault FaultOf(const xmlNode* envelope) {
  const xmlNode* fault = ElementAt(envelope, {"Body", "Fault"});
  if (fault == nullptr) {
    return ModelFault::kNone;
  }
  const xmlNode* codeElement = ChildElement(fault, "faultcode");
  const auto codeText = FirstTextOf(codeElement);
  if (!codeText) {
    return ModelFault::kOther;
  }
  const Code code = CodeOf(codeElement, *codeText);
  const bool isFailed = code.space == kTrust && code.name == "FailedAuthentication";
  const bool isInvalid =
      (code.space == kTrust || code.space == kSecurity) && code.name == "InvalidSecurityToken";
  const std::string reason = FirstTextOf(ChildElement(fault, "faultstring")).value_or("");
  if (isFailed && reason.starts_with("Password of the user logging on is expired")) {
    return ModelFault::kPasswordExpired;
  }
  return isFailed || isInvalid ? ModelFault::kCredentials : ModelFault::kOther;
}

bool HasIssuedToken(const xmlNode* envelope) {
  return ElementAt(envelope, {"Body", "RequestSecurityTokenResponseCollection",
                              "RequestSecurityTokenResponse", "RequestedSecurityToken",
                              "Assertion"}) != nullptr;
}

bool HasRenewedToken(const xmlNode* envelope) {
  return ElementAt(envelope, {"Body", "RequestSecurityTokenResponse", "RequestedSecurityToken",
                              "Assertion"}) != nullptr;
}

std::optional<bool> VerdictOf(const xmlNode* envelope) {
  const auto code =
      FirstTextOf(ElementAt(envelope, {"Body", "RequestSecurityTokenResponse", "Status", "Code"}));
  if (code == kTrust + "/status/valid") {
    return true;
  }
  return code == kTrust + "/status/invalid" ? std::optional(false) : std::nullopt;
}

std::optional<ModelNegotiation> NegotiationOf(const xmlNode* envelope) {
  const xmlNode* leg = ElementAt(envelope, {"Body", "RequestSecurityTokenResponse"});
  const xmlNode* last = ElementAt(
      envelope, {"Body", "RequestSecurityTokenResponseCollection", "RequestSecurityTokenResponse"});
  const xmlNode* response = leg == nullptr ? last : leg;
  const auto context = response == nullptr ? std::nullopt : AttributeOf(response, "Context");
  if (!context) {
    return std::nullopt;
  }
  const std::string text = FirstTextOf(ChildElement(response, "BinaryExchange")).value_or("");
  const auto bytes = BytesOf(text);
  if (!bytes || (text.empty() && leg != nullptr)) {
    return std::nullopt;
  }
  const bool hasToken = ElementAt(response, {"RequestedSecurityToken", "Assertion"}) != nullptr &&
                        FirstTextOf(ChildElement(response, "TokenType")) == kSaml;
  if (leg == nullptr && !hasToken) {
    return std::nullopt;
  }
  return ModelNegotiation{*context, *bytes, leg == nullptr};
}

}  // namespace Fuzz
