#include "sts/response_handler.h"

#include <string_view>

#include <ssoclient/exceptions.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "sts/soap_fault.h"
#include "support/namespaces.h"
#include "support/xml_documents.h"
#include "xml/ws_trust_names.h"

namespace SsoClient {

namespace {

using Tarnik::Xml::ElementNode;

[[noreturn]] void ThrowUnexpectedFormat() {
  throw SsoException("Unexpected XML format");
}

Tarnik::Ref<Tarnik::Xml::Document> ParseResponse(Tarnik::Reader* response) {
  try {
    return ParseDocument(response);
  } catch (const Tarnik::Xml::XMLParseException& error) {
    throw SsoException("Response is not well-formed XML: " + error.Message());
  }
}

template <class BodyParser>
auto ParseSoapResponse(Tarnik::Reader* response, const BodyParser& parseBody) {
  const auto document = ParseResponse(response);
  const ElementNode& envelope = *document->RootElement();
  CheckSoapFault(envelope);
  const ElementNode* body = envelope.FirstChildElement("Body");
  if (body == nullptr) {
    throw SsoException("Unexpected response format: missing SAOP Body.");
  }
  return parseBody(*body);
}

std::string ParseIssueBody(const ElementNode& body) {
  const auto* assertion =
      FindDescendant(body, {"RequestSecurityTokenResponseCollection",
                            "RequestSecurityTokenResponse", "RequestedSecurityToken", "Assertion"});
  if (assertion == nullptr) {
    ThrowUnexpectedFormat();
  }
  return CanonicalizeElement(assertion);
}

std::string ParseRenewBody(const ElementNode& body) {
  const auto* assertion =
      FindDescendant(body, {"RequestSecurityTokenResponse", "RequestedSecurityToken", "Assertion"});
  if (assertion == nullptr) {
    ThrowUnexpectedFormat();
  }
  return CanonicalizeElement(assertion);
}

bool ParseValidateBody(const ElementNode& body) {
  const auto* code =
      FirstTextChild(FindDescendant(body, {"RequestSecurityTokenResponse", "Status", "Code"}));
  if (code == nullptr) {
    ThrowUnexpectedFormat();
  }
  if (code->Text() == kWsTrust13.validStatus) {
    return true;
  }
  if (code->Text() == kWsTrust13.invalidStatus) {
    return false;
  }
  ThrowUnexpectedFormat();
}

struct NegotiationAnswer {
  const ElementNode* response;
  bool isFinal;
};

NegotiationAnswer FindNegotiationAnswer(const ElementNode& body) {
  if (const auto* intermediate = body.FirstChildElement("RequestSecurityTokenResponse")) {
    return {intermediate, false};
  }
  const auto* last = FindDescendant(
      body, {"RequestSecurityTokenResponseCollection", "RequestSecurityTokenResponse"});
  if (last == nullptr) {
    ThrowUnexpectedFormat();
  }
  return {last, true};
}

void DecodeLeg(std::string_view text, std::vector<unsigned char>& leg) {
  try {
    Tarnik::StringUtil::Base64Decode(text, leg);
  } catch (const Tarnik::Base64FormatException&) {
    throw SsoException("Base64 format exception");
  }
}

std::string ReadNegotiatedToken(const ElementNode& response) {
  const auto* assertion = FindDescendant(response, {"RequestedSecurityToken", "Assertion"});
  if (assertion == nullptr) {
    ThrowUnexpectedFormat();
  }
  const auto tokenType = ElementText(response.FirstChildElement("TokenType"));
  if (tokenType != kSamlNamespace) {
    throw SsoException("Invalid token type: " + std::string(tokenType) +
                       " (expected: " + std::string(kSamlNamespace));
  }
  return CanonicalizeElement(assertion);
}

NegotiationResponse ParseNegotiationBody(const ElementNode& body) {
  const auto [response, isFinal] = FindNegotiationAnswer(body);
  const auto contextId = response->FindAttribute("Context");
  if (!contextId) {
    ThrowUnexpectedFormat();
  }
  NegotiationResponse negotiation;
  negotiation.contextId = *contextId;
  const auto leg = ElementText(response->FirstChildElement("BinaryExchange"));
  if (!leg.empty()) {
    DecodeLeg(leg, negotiation.leg);
  } else if (!isFinal) {
    ThrowUnexpectedFormat();
  }
  if (isFinal) {
    negotiation.token = ReadNegotiatedToken(*response);
  }
  return negotiation;
}

}  // namespace

void ResponseHandlerImpl::ParseIssueResponse(Tarnik::Reader* response,
                                             std::string& assertion) const {
  assertion = ParseSoapResponse(response, ParseIssueBody);
}

bool ResponseHandlerImpl::ParseValidateResponse(Tarnik::Reader* response) const {
  return ParseSoapResponse(response, ParseValidateBody);
}

void ResponseHandlerImpl::ParseRenewResponse(Tarnik::Reader* response,
                                             std::string& assertion) const {
  assertion = ParseSoapResponse(response, ParseRenewBody);
}

void ResponseHandlerImpl::ParseNegotiationResponse(Tarnik::Reader* response,
                                                   NegotiationResponse& negotiation) const {
  negotiation = ParseSoapResponse(response, ParseNegotiationBody);
}

}  // namespace SsoClient
