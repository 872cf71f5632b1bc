#ifndef SSOCLIENT_TESTS_STS_REQUEST_OPERATIONS_H
#define SSOCLIENT_TESTS_STS_REQUEST_OPERATIONS_H

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <devsts/certificates.h>
#include <ssoclient/token_spec.h>
#include <tarnik/xml/element_node.h>

#include "sts/request_builder.h"
#include "support/fake_saml_token.h"
#include "support/holder_of_key.h"
#include "support/parse_xml.h"

namespace SsoClient::Testing {

inline constexpr char kIssueAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";
inline constexpr char kRenewAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Renew";
inline constexpr char kValidateAction[] =
    "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate";

inline constexpr char kNoKeyForRenewal[] = "No HolderOfKeyConfig provided. Unable to renew token";

/// The children of wsse:Security.
inline constexpr char kTimestamp[] = "wsu:Timestamp";
inline constexpr char kUsername[] = "wsse:UsernameToken";
inline constexpr char kCertificate[] = "wsse:BinarySecurityToken";
inline constexpr char kAssertion[] = "Assertion";
inline constexpr char kSignature[] = "ds:Signature";

/// The key and certificate of `BuilderWithKey()`.
inline const DevSts::Credential& Credential() {
  static const DevSts::Credential credential = KeyCredential();
  return credential;
}

inline RequestBuilderImpl BuilderWithKey() {
  return RequestBuilderImpl(ConfigOf(Credential()));
}

inline FakeSamlToken PresentedToken(TokenConfirmationType confirmation = HOLDER_OF_KEY) {
  FakeSamlToken token("<Assertion ID=\"_presented\"/>");
  token.id = "_presented";
  token.confirmationType = confirmation;
  return token;
}

inline TokenSpec SpecOf(std::int64_t seconds, ConfirmationType confirmation = CONFIRMATION_DEFAULT,
                        bool isActingAs = false) {
  TokenSpec spec;
  spec.tokenLifetimeSec = seconds;
  spec.confirmation = confirmation;
  if (isActingAs) {
    spec.actAsToken = std::make_shared<FakeSamlToken>("<ActsAs ID=\"_other\"/>");
  }
  return spec;
}

/// An operation of a builder. Each takes its lifetime and confirmation from the spec, if it has
/// any, and `PresentedToken()` where it needs a token.
using BuildOperation =
    std::function<void(const RequestBuilderImpl&, const TokenSpec&, SoapRequest&)>;

inline void ByPassword(const RequestBuilderImpl& builder, const TokenSpec& spec,
                       SoapRequest& request) {
  builder.BuildAcquireTokenRequest("alice", "pw", spec, request);
}

inline void InitialLeg(const RequestBuilderImpl& builder, const TokenSpec& spec,
                       SoapRequest& request) {
  builder.BuildInitialNegotiationRequest(spec, {1}, request);
}

inline void ContinuedLeg(const RequestBuilderImpl& builder, const TokenSpec&,
                         SoapRequest& request) {
  builder.BuildContinuedNegotiationRequest("c", {1}, request);
}

inline void ByCertificate(const RequestBuilderImpl& builder, const TokenSpec& spec,
                          SoapRequest& request) {
  builder.BuildAcquireTokenByCertificateRequest(spec, request);
}

inline void ByToken(const RequestBuilderImpl& builder, const TokenSpec& spec,
                    SoapRequest& request) {
  builder.BuildAcquireTokenByTokenRequest(PresentedToken(), spec, request);
}

inline void Validate(const RequestBuilderImpl& builder, const TokenSpec&, SoapRequest& request) {
  builder.BuildValidateRequest(PresentedToken(), request);
}

inline void Renew(const RequestBuilderImpl& builder, const TokenSpec& spec, SoapRequest& request) {
  builder.BuildRenewRequest(PresentedToken(), spec.tokenLifetimeSec, request);
}

/// The qualified names of the children of wsse:Security.
inline std::vector<std::string> HeaderOf(const std::string& envelope) {
  const auto document = ParseXml(envelope);
  const auto* security =
      document->RootElement()->FirstChildElement("Header")->FirstChildElement("Security");
  std::vector<std::string> names;
  for (auto* node = security->FirstChild(); node != nullptr; node = node->NextSibling()) {
    names.emplace_back(static_cast<const Tarnik::Xml::ElementNode*>(node)->QualifiedNameText());
  }
  return names;
}

inline const std::vector<BuildOperation>& AllOperations() {
  static const std::vector<BuildOperation> operations{
      ByPassword, InitialLeg, ContinuedLeg, ByCertificate, ByToken, Validate, Renew};
  return operations;
}

}  // namespace SsoClient::Testing

#endif
