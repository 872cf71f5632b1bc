#include "fault.h"
#include "operations.h"
#include "presented_token.h"
#include "soap_answer.h"
#include "target_request.h"
#include "token_judge.h"

namespace DevSts {
namespace {

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
    const TokenVerdict verdict = JudgeToken(assertion, token, parts.identity.signing.certificatePem,
                                            parts.tokens, request.now);
    return verdict.state == TokenState::Good ? std::string() : place + verdict.complaint;
  } catch (const Fault& unreadable) {
    return unreadable.what();
  }
}

}  // namespace

std::string Validate(const CheckedRequest& request, const ServiceParts& parts) {
  RequireTimestampOnly(request);
  const std::string reason =
      ReasonAgainst(ReadValidateRequest(request.soap.bodyEntry), request, parts);
  return WriteStatusEnvelope(reason.empty(), reason);
}

}  // namespace DevSts
