#include "commands/bound_token.h"

#include <limits>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/text/display_text.h>

#include "failure.h"
#include "input/token_file.h"
#include "token/unverified_token.h"
#include "token_remedy.h"

namespace SsoClient::Tool {
namespace {

constexpr std::size_t kMaxMessageBytes = 500;

void Verify(const std::string& text, const Tarnik::Xml::Security::KeyInfoResolver& signers) {
  try {
    CreateSamlToken(text, &signers, std::numeric_limits<long>::max());
  } catch (const Tarnik::Exception& failure) {
    throw ToolException({ExitStatus::kRefused, "bad-token",
                         "the token is not from this service: " +
                             Tarnik::ToDisplayText(failure.what(), kMaxMessageBytes),
                         IsAlgorithmUnsupported(failure)
                             ? kAlgorithmRemedy
                             : "check the file, and the signing certificate (--sts-certificate)"});
  }
}

}  // namespace

std::shared_ptr<const SamlToken> ReadBoundToken(
    const std::string& path, bool mayBeOpen, const Tarnik::Xml::Security::KeyInfoResolver& signers,
    const HolderOfKeyConfig& key) {
  const SecretText text = ReadTokenFile(path, mayBeOpen);
  auto token = ReadUnverifiedToken(text.Text());
  Verify(text.Text(), signers);
  const auto holder = token->HolderOfKeyCertificate();
  if (holder == nullptr || !key.privateKey->Matches(*holder)) {
    throw ToolException({ExitStatus::kLocal, "not-bound",
                         holder == nullptr ? "the token is a bearer token, not bound to a key"
                                           : "the token is bound to another key",
                         "log in with the key (--certificate)"});
  }
  return token;
}

}  // namespace SsoClient::Tool
