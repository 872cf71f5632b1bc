#include "soap/token_request.h"

#include <string>
#include <tuple>

#include "soap/element_reader.h"
#include "soap/fault.h"
#include "soap/request_signature.h"
#include "xml/document.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

constexpr char kIssueType[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Issue";
constexpr char kBearerKey[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Bearer";
constexpr char kPublicKey[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/PublicKey";

bool ReadKeyType(const xmlNode* element) {
  const std::string text = PlainText(element);
  if (text != kBearerKey && text != kPublicKey) {
    ThrowInvalidRequest("Unsupported KeyType: " + text);
  }
  return text == kPublicKey;
}

bool ReadRenewing(const xmlNode* element) {
  RequireAttributes(element, {{"Allow"}, {"OK"}});
  if (!TextOf(element).empty()) {
    ThrowInvalidRequest("Unexpected text in Renewing");
  }
  BooleanOf(AttributeOf(element, "OK"), "Renewing/@OK");
  return BooleanOf(AttributeOf(element, "Allow"), "Renewing/@Allow");
}

std::string ReadDelegateTo(xmlNode* element) {
  RequireAttributes(element, {});
  ElementReader reader(element);
  xmlNode* token = reader.Expect(kWsseNamespace, "UsernameToken");
  reader.End();
  RequireAttributes(token, {});
  ElementReader tokenReader(token);
  std::string name = PlainText(tokenReader.Expect(kWsseNamespace, "Username"));
  tokenReader.End();
  return name;
}

xmlNode* OnlyAssertionIn(xmlNode* target) {
  RequireAttributes(target, {});
  ElementReader reader(target);
  xmlNode* assertion = reader.Expect(kSamlNamespace, "Assertion");
  reader.End();
  return assertion;
}

std::string ReadParticipant(xmlNode* element) {
  RequireAttributes(element, {});
  ElementReader reader(element);
  xmlNode* reference = reader.Expect(kAddressingNamespace, "EndpointReference");
  reader.End();
  RequireAttributes(reference, {});
  ElementReader referenceReader(reference);
  std::string address = PlainText(referenceReader.Expect(kAddressingNamespace, "Address"));
  referenceReader.End();
  return address;
}

std::vector<std::string> ReadParticipants(xmlNode* element) {
  RequireAttributes(element, {});
  ElementReader reader(element);
  std::vector<std::string> audiences;
  do {
    audiences.push_back(ReadParticipant(reader.Expect(kTrustNamespace, "Participant")));
  } while (!reader.AtEnd());
  return audiences;
}

void RequireStringType(xmlNode* value) {
  RequireAttributes(value, {{"type", kSchemaInstanceNamespace}});
  const std::string type = AttributeOf(value, "type", kSchemaInstanceNamespace);
  const std::size_t colon = type.find(':');
  const std::string prefix = colon == std::string::npos ? "" : type.substr(0, colon);
  const std::string name = colon == std::string::npos ? type : type.substr(colon + 1);
  const xmlNs* binding =
      xmlSearchNs(value->doc, value, prefix.empty() ? nullptr : AsXml(prefix.c_str()));
  if (binding == nullptr || AsText(binding->href) != kSchemaNamespace || name != "string") {
    ThrowInvalidRequest("AttributeValue/@type is not the schema's string: " + type);
  }
}

std::vector<std::string> ReadAdviceValues(xmlNode* element, const char* adviceNamespace) {
  ElementReader reader(element);
  std::vector<std::string> values;
  while (!reader.AtEnd()) {
    xmlNode* value = reader.Expect(adviceNamespace, "AttributeValue");
    RequireStringType(value);
    values.push_back(TextOf(value));
  }
  return values;
}

AdviceRequest ReadAdvice(xmlNode* element, const char* adviceNamespace) {
  RequireAttributes(element, {{"AdviceSource"}});
  AdviceRequest advice{AttributeOf(element, "AdviceSource"), {}};
  ElementReader reader(element);
  while (!reader.AtEnd()) {
    xmlNode* attribute = reader.Expect(adviceNamespace, "Attribute");
    RequireAttributes(attribute, {{"Name"}});
    advice.attributes.emplace_back(AttributeOf(attribute, "Name"),
                                   ReadAdviceValues(attribute, adviceNamespace));
  }
  return advice;
}

std::vector<AdviceRequest> ReadAdviceSet(xmlNode* element, const char* adviceNamespace) {
  RequireAttributes(element, {});
  ElementReader reader(element);
  std::vector<AdviceRequest> advice;
  do {
    advice.push_back(ReadAdvice(reader.Expect(adviceNamespace, "Advice"), adviceNamespace));
  } while (!reader.AtEnd());
  return advice;
}

void ReadUseKey(xmlNode* element) {
  RequireAttributes(element, {{"Sig"}});
  ElementReader(element).End();
  const std::string signature = AttributeOf(element, "Sig");
  if (signature != kProofSignatureId) {
    ThrowInvalidRequest("UseKey/@Sig does not name the request's signature: " + signature);
  }
}

void ReadOptionalParts(ElementReader& reader, const std::string& vendorHost,
                       IssueRequest& request) {
  if (xmlNode* delegateTo = reader.Optional(kTrustNamespace, "DelegateTo")) {
    request.delegateTo = ReadDelegateTo(delegateTo);
  }
  if (xmlNode* actAs = reader.Optional(kTrust14Namespace, "ActAs")) {
    request.actAs = OnlyAssertionIn(actAs);
  }
  if (xmlNode* participants = reader.Optional(kTrustNamespace, "Participants")) {
    request.audiences = ReadParticipants(participants);
  }
  const std::string adviceNamespace =
      "http://" + vendorHost + "/names/2009/12/std-ext/WS-Trust1.4/advice";
  if (xmlNode* adviceSet = reader.Optional(adviceNamespace.c_str(), "AdviceSet")) {
    request.advice = ReadAdviceSet(adviceSet, adviceNamespace.c_str());
  }
  if (xmlNode* useKey = reader.Optional(kTrustNamespace, "UseKey")) {
    ReadUseKey(useKey);
    request.usesKey = true;
  }
}

}  // namespace

IssueRequest ReadIssueRequest(xmlNode* requestSecurityToken, const std::string& vendorHost) {
  ElementReader reader(requestSecurityToken);
  IssueRequest request;
  RequireText(reader.Expect(kTrustNamespace, "TokenType"), kSamlNamespace);
  RequireRequestType(reader.Expect(kTrustNamespace, "RequestType"), kIssueType);
  request.publicKey = ReadKeyType(reader.Expect(kTrustNamespace, "KeyType"));
  xmlNode* lifetime = reader.Expect(kTrustNamespace, "Lifetime");
  RequireAttributes(lifetime, {});
  std::tie(request.created, request.expires) = ReadPeriod(lifetime);
  request.renewable = ReadRenewing(reader.Expect(kTrustNamespace, "Renewing"));
  request.delegable =
      BooleanOf(PlainText(reader.Expect(kTrustNamespace, "Delegatable")), "Delegatable");
  ReadOptionalParts(reader, vendorHost, request);
  if (xmlNode* exchange = reader.Optional(kTrustNamespace, "BinaryExchange")) {
    request.leg = ReadLeg(requestSecurityToken, exchange);
  } else {
    RequireAttributes(requestSecurityToken, {});
  }
  reader.End();
  return request;
}

RenewRequest ReadRenewRequest(xmlNode* requestSecurityToken) {
  RequireAttributes(requestSecurityToken, {});
  ElementReader reader(requestSecurityToken);
  RenewRequest request;
  RequireText(reader.Expect(kTrustNamespace, "TokenType"), kSamlNamespace);
  RequireRequestType(reader.Expect(kTrustNamespace, "RequestType"),
                     std::string(kTrustNamespace) + "/Renew");
  xmlNode* lifetime = reader.Expect(kTrustNamespace, "Lifetime");
  RequireAttributes(lifetime, {});
  std::tie(request.created, request.expires) = ReadPeriod(lifetime);
  request.target = OnlyAssertionIn(reader.Expect(kTrustNamespace, "RenewTarget"));
  reader.End();
  return request;
}

xmlNode* ReadValidateRequest(xmlNode* requestSecurityToken) {
  RequireAttributes(requestSecurityToken, {});
  ElementReader reader(requestSecurityToken);
  RequireText(reader.Expect(kTrustNamespace, "TokenType"),
              std::string(kTrustNamespace) + "/RSTR/Status");
  RequireRequestType(reader.Expect(kTrustNamespace, "RequestType"),
                     std::string(kTrustNamespace) + "/Validate");
  xmlNode* assertion = OnlyAssertionIn(reader.Expect(kTrustNamespace, "ValidateTarget"));
  reader.End();
  return assertion;
}

}  // namespace DevSts
