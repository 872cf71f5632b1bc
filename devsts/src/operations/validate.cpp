#include "operations/validate.h"

#include "signing/xml_signature.h"
#include "soap/fault.h"
#include "soap/soap_answer.h"
#include "soap/token_request.h"
#include "xml/document.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

// What is wrong with the signature; empty if it is valid.
std::string SignatureProblem(xmlNode* assertion, const std::string& signingPem) {
  xmlNode* signature = FirstChild(assertion, kDsigNamespace, "Signature");
  if (signature == nullptr) {
    return " has no signature";
  }
  const VerifyResult result = VerifySignature(signature, signingPem);
  if (!result) {
    return "'s signature does not verify: " + result.reason;
  }
  const std::string own = "#" + AttributeOf(assertion, "ID");
  if (result.referenceUris != std::vector<std::string>{own}) {
    return "'s signature does not cover it";
  }
  return {};
}

void RequireTimestampOnly(const CheckedRequest& request) {
  if (request.proof) {
    ThrowInvalidSecurity("A Signature is not expected in a Validate request");
  }
  if (request.header.userNameToken) {
    ThrowInvalidSecurity("A UsernameToken is not expected in a Validate request");
  }
}

// Why the token is not valid; empty if it is.
std::string ReasonAgainst(xmlNode* assertion, const CheckedRequest& request,
                          const ServiceParts& parts) {
  const std::string place = "The token";
  try {
    const PresentedToken token = ReadPresentedToken(assertion, place);
    const TokenVerdict verdict = CheckToken(assertion, token, parts.identity.signing.certificatePem,
                                            parts.tokens, request.now);
    return verdict.state == TokenState::Valid ? std::string() : place + verdict.problem;
  } catch (const Fault& unreadable) {
    return unreadable.what();
  }
}

}  // namespace

TokenVerdict CheckToken(xmlNode* assertion, const PresentedToken& token,
                        const std::string& signingPem, const TokenStore& store, Time now) {
  const std::string forged = SignatureProblem(assertion, signingPem);
  if (!forged.empty()) {
    return {TokenState::Forged, forged, {}};
  }
  std::optional<IssuedToken> issued = store.Find(token.id);
  if (!issued) {
    return {TokenState::Unknown, " is unknown", {}};
  }
  if (issued->revoked) {
    return {TokenState::Revoked, " was revoked", {}};
  }
  if (token.notBefore > now) {
    return {TokenState::NotYetValid, " is not yet valid", issued};
  }
  if (token.notOnOrAfter <= now) {
    return {TokenState::Expired, " has expired", issued};
  }
  return {TokenState::Valid, {}, issued};
}

IssuedToken RequireValidToken(xmlNode* assertion, const PresentedToken& token,
                              const std::string& place, const std::string& signingPem,
                              const TokenStore& store, Time now) {
  TokenVerdict verdict = CheckToken(assertion, token, signingPem, store, now);
  if (verdict.state != TokenState::Valid) {
    ThrowInvalidSecurityToken(place + verdict.problem);
  }
  return std::move(*verdict.issued);
}

std::string Validate(const CheckedRequest& request, const ServiceParts& parts) {
  RequireTimestampOnly(request);
  const std::string reason =
      ReasonAgainst(ReadValidateRequest(request.soap.bodyEntry), request, parts);
  return WriteStatusEnvelope(reason.empty(), reason);
}

}  // namespace DevSts
