#include "doctor/login_parts.h"

#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/text/display_text.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/security/signature.h>

#include "service/secret_search.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr std::size_t kShownSigner = 256;
// A token whose times are refused still names its signer.
constexpr long kAnyTime = 1000L * 365 * 24 * 3600;

}  // namespace

KeepingFactory::KeepingFactory(std::shared_ptr<SamlTokenFactory> inner)
    : inner_(std::move(inner)) {}

KeepingFactory::~KeepingFactory() {
  Tarnik::StringUtil::Cleanse(text_);
}

std::shared_ptr<const SamlToken> KeepingFactory::CreateToken(const std::string& xml) const {
  text_ = xml;
  return inner_->CreateToken(xml);
}

std::shared_ptr<const SamlToken> KeepingFactory::CreateToken(const std::string& xml,
                                                             long clockToleranceSec) const {
  text_ = xml;
  return inner_->CreateToken(xml, clockToleranceSec);
}

std::shared_ptr<const SamlToken> KeepingFactory::CreateToken(
    Tarnik::Xml::ElementNode* assertion) const {
  return inner_->CreateToken(assertion);
}

std::shared_ptr<const SamlToken> KeepingFactory::CreateToken(Tarnik::Xml::ElementNode* assertion,
                                                             long clockToleranceSec) const {
  return inner_->CreateToken(assertion, clockToleranceSec);
}

NotingHandler::NotingHandler(std::shared_ptr<NegotiationHandler> inner)
    : inner_(std::move(inner)) {}

std::shared_ptr<const std::vector<unsigned char>> NotingHandler::Negotiate(
    const std::vector<unsigned char>& serverLeg) {
  hasFailed_ = true;
  auto leg = inner_->Negotiate(serverLeg);
  hasFailed_ = false;
  return leg;
}

std::vector<ClaimedSigner> ReadClaimedSigners(const std::string& text, std::string_view secret) {
  std::vector<ClaimedSigner> signers;
  try {
    const auto token = CreateSamlToken(text, kAnyTime);
    for (const auto& der : token->GetSignature()->KeyInfo().certificates) {
      const auto certificate = Tarnik::Crypto::CreateCertificateFromDer(der.data(), der.size());
      const std::string subject = certificate->SubjectName();
      signers.push_back({ContainsSecret(subject, secret)
                             ? "a name that contains the password"
                             : Tarnik::ToDisplayText(subject, kShownSigner),
                         Tarnik::Crypto::FingerprintText(*certificate)});
    }
  } catch (const Tarnik::Exception&) {
    signers.clear();  // a text that is not a token names nobody
  }
  return signers;
}

}  // namespace SsoClient::Tool::Doctor
