#include "token_judge.h"

#include "fault.h"
#include "namespaces.h"
#include "xml_library.h"
#include "xml_verifier.h"

namespace DevSts {
namespace {

// What is wrong with the signature; empty if nothing is.
std::string ComplaintOfSignature(xmlNode* assertion, const std::string& signingPem) {
  xmlNode* signature = nullptr;
  for (xmlNode* child : ChildElements(assertion)) {
    if (IsElement(child, kDsigNamespace, "Signature")) {
      signature = child;
      break;
    }
  }
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

}  // namespace

TokenVerdict JudgeToken(xmlNode* assertion, const PresentedToken& token,
                        const std::string& signingPem, const TokenStore& store, Time now) {
  const std::string forged = ComplaintOfSignature(assertion, signingPem);
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
  return {TokenState::Good, {}, issued};
}

IssuedToken RequireGoodToken(xmlNode* assertion, const PresentedToken& token,
                             const std::string& place, const std::string& signingPem,
                             const TokenStore& store, Time now) {
  TokenVerdict verdict = JudgeToken(assertion, token, signingPem, store, now);
  if (verdict.state != TokenState::Good) {
    ThrowInvalidSecurityToken(place + verdict.complaint);
  }
  return std::move(*verdict.issued);
}

}  // namespace DevSts
