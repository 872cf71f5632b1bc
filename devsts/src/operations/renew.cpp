#include <utility>

#include "operations/operations.h"
#include "operations/validate.h"
#include "signing/certificates.h"
#include "soap/fault.h"
#include "soap/presented_token.h"
#include "soap/token_request.h"

namespace DevSts {
namespace {

constexpr char kPlace[] = "The RenewTarget";

const KeyProof& RequireCertificateSignature(const CheckedRequest& request) {
  if (!request.proof || request.proof->form != RequestSignature::ByCertificate) {
    ThrowInvalidSecurity("A Renew request must be signed with a certificate");
  }
  if (request.header.userNameToken) {
    ThrowInvalidSecurity("A UsernameToken is not expected in a Renew request");
  }
  return *request.proof;
}

IssuedToken RequireRenewableState(TokenVerdict verdict, const PresentedToken& token) {
  if (verdict.state == TokenState::NotYetValid) {
    ThrowUnableToRenew(kPlace + verdict.problem);
  }
  if (verdict.state == TokenState::Expired && !(token.renewal && token.renewal->renewExpired)) {
    ThrowUnableToRenew(kPlace + verdict.problem + ", and it is not renewable after its end");
  }
  if (!verdict.issued) {
    ThrowInvalidSecurityToken(kPlace + verdict.problem);
  }
  return std::move(*verdict.issued);
}

// The renew restriction that remains after this renewal.
RenewRestriction TakeOneRenewal(const PresentedToken& token) {
  if (!token.renewal) {
    ThrowUnableToRenew(std::string(kPlace) + " is not renewable");
  }
  RenewRestriction left = *token.renewal;
  if (left.count == 0) {
    ThrowUnableToRenew(std::string(kPlace) + " may not be renewed any more");
  }
  --left.count;
  return left;
}

// WS-Trust 1.3, section 5: a renewed token that begins in the future is postdated.
Time StartOf(const RenewRequest& request, const RenewRestriction& restriction, Time now,
             std::chrono::seconds skew) {
  if (request.created <= now + skew) {
    return now;
  }
  if (!restriction.postdatable) {
    ThrowInvalidTimeRange(
        "The Lifetime begins in the future, and the RenewTarget is not postdatable");
  }
  return request.created;
}

}  // namespace

std::string Renew(const CheckedRequest& checked, ServiceParts& parts) {
  const KeyProof& proof = RequireCertificateSignature(checked);
  const RenewRequest request = ReadRenewRequest(checked.soap.bodyEntry);
  RequireSensibleLifetime(request.created, request.expires, checked.now - parts.clockSkew);
  const PresentedToken token = ReadPresentedToken(request.target, kPlace);
  const IssuedToken issued =
      RequireRenewableState(CheckToken(request.target, token, parts.identity.signing.certificatePem,
                                       parts.tokens, checked.now),
                            token);
  if (!token.holderCertificatePem) {
    ThrowInvalidRequest(std::string(kPlace) + " is not a holder-of-key token");
  }
  if (!parts.accounts.Has(token.subject)) {
    ThrowFailedAuthentication("There is no user " + token.subject);
  }
  if (!HasSameKey(*token.holderCertificatePem, proof.certificatePem)) {
    ThrowFailedAuthentication("The request is not signed by the key of the RenewTarget");
  }

  TokenContent content = issued.content;
  content.id = MakeId();
  content.renewal = TakeOneRenewal(token);
  const Time start = StartOf(request, *content.renewal, checked.now, parts.clockSkew);
  content.issued = checked.now;
  content.notBefore = start;
  content.notOnOrAfter = GrantedEnd(start, request.expires - request.created, checked.shape);
  return IssueAndRemember(std::move(content), checked, parts, TokenAnswer::Renewed);
}

}  // namespace DevSts
