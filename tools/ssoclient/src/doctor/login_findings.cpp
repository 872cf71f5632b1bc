#include "doctor/login_findings.h"

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>

#include "failure.h"
#include "service/secret_search.h"
#include "token_remedy.h"

namespace SsoClient::Tool::Doctor {
namespace {

// A service may repeat what it was sent.
std::string TextWithout(std::string_view secret, const std::string& text) {
  return ContainsSecret(text, secret)
             ? "the service's text is not shown, since it contains the password"
             : text;
}

std::string Names(const std::vector<ClaimedSigner>& signers) {
  std::string names;
  for (const ClaimedSigner& signer : signers) {
    names += (names.empty() ? "" : "; ") + signer.subject + " (SHA-256 " + signer.fingerprint + ")";
  }
  return names.empty() ? "a key that it does not name by a certificate" : names;
}

Finding OtherSigner(const LoginFacts& facts) {
  return Failure(ExitStatus::kUnreachable, "signer-mismatch",
                 "the token was not accepted: it is signed with " + Names(facts.signers) +
                     ", and --sts-certificate has " + facts.trusted,
                 "get the current signing certificate of the service from a trusted source, and "
                 "give it as --sts-certificate");
}

Finding UnacceptedToken(const InvalidTokenException& failure, const std::string& message,
                        const LoginFacts& facts) {
  const bool isSignature = dynamic_cast<const InvalidSignatureException*>(&failure) != nullptr;
  if (isSignature && !IsAlgorithmUnsupported(failure)) {
    return OtherSigner(facts);
  }
  return Failure(ExitStatus::kUnreachable, "token-rejected",
                 "the service issued a token that is not accepted: " + message,
                 TokenRemedy(failure));
}

}  // namespace

Finding FindingOfLoginFailure(const std::exception& failure, const LoginFacts& facts) {
  const std::string message = TextWithout(facts.secret, failure.what());
  if (facts.isKerberos) {
    return Failure(
        ExitStatus::kLocal, "kerberos-failed", "no Kerberos login: " + message,
        "get tickets with kinit, or give --keytab; check the name of --service, and whether "
        "the KDC answers");
  }
  if (dynamic_cast<const PasswordExpiredException*>(&failure) != nullptr) {
    return Failure(ExitStatus::kRefused, "password-expired", message,
                   "set a new password at the service");
  }
  if (dynamic_cast<const InvalidCredentialsException*>(&failure) != nullptr) {
    return Failure(ExitStatus::kRefused, "login-refused", message,
                   "check the user name, the password or the certificate, and whether the account "
                   "is locked");
  }
  if (const auto* token = dynamic_cast<const InvalidTokenException*>(&failure)) {
    return UnacceptedToken(*token, message, facts);
  }
  if (dynamic_cast<const CommunicationException*>(&failure) != nullptr) {
    return Failure(ExitStatus::kUnreachable, "login-unanswered",
                   "the exchange of the login failed: " + message,
                   "allow more time with --timeout, and look into the log of the service");
  }
  if (dynamic_cast<const SsoException*>(&failure) != nullptr) {
    return Failure(ExitStatus::kRefused, "login-fault",
                   "the service refuses the request: " + message,
                   "look into the log of the service");
  }
  const Tool::Failure other = FailureOf(failure);
  return Failure(
      other.status, FindingName::FindOr(other.kind, "login-failed"), message,
      other.remedy.empty() ? "check the user name and the files of the login" : other.remedy);
}

}  // namespace SsoClient::Tool::Doctor
