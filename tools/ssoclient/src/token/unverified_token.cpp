#include "token/unverified_token.h"

#include <array>
#include <limits>
#include <utility>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/text/display_text.h>

#include "failure.h"

namespace SsoClient::Tool {
namespace {

constexpr std::size_t kMaxMessageBytes = 500;

struct NamedAlgorithm {
  const char* uri;
  const char* name;
};

// XML Signature 1.1, section 6.4, and RFC 6931, section 2.3.10.
constexpr std::array<NamedAlgorithm, 9> kAlgorithms{{
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256", "RSA PKCS#1 with SHA-256"},
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha384", "RSA PKCS#1 with SHA-384"},
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha512", "RSA PKCS#1 with SHA-512"},
    {"http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1", "RSA-PSS with SHA-256"},
    {"http://www.w3.org/2007/05/xmldsig-more#sha384-rsa-MGF1", "RSA-PSS with SHA-384"},
    {"http://www.w3.org/2007/05/xmldsig-more#sha512-rsa-MGF1", "RSA-PSS with SHA-512"},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256", "ECDSA with SHA-256"},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha384", "ECDSA with SHA-384"},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512", "ECDSA with SHA-512"},
}};

}  // namespace

std::shared_ptr<const SamlToken> ReadUnverifiedToken(const std::string& text) {
  try {
    // The widest tolerance, so that tokens of every time are read.
    return CreateSamlToken(text, std::numeric_limits<long>::max());
  } catch (const Tarnik::Exception& exception) {
    throw ToolException(
        {ExitStatus::kLocal, "not-a-token",
         "This is not a token: " + Tarnik::ToDisplayText(exception.what(), kMaxMessageBytes),
         "pass a file that contains one SAML 2.0 assertion"});
  }
}

Tarnik::Ref<const Tarnik::Crypto::Certificate> ClaimedSigner(const SamlToken& token) {
  const auto signature = token.GetSignature();
  const std::vector<std::vector<unsigned char>>& certificates = signature->KeyInfo().certificates;
  if (certificates.empty()) {
    return nullptr;
  }
  try {
    return Tarnik::Crypto::CreateCertificateFromDer(certificates.front().data(),
                                                    certificates.front().size());
  } catch (const Tarnik::Crypto::CryptoException&) {
    return nullptr;
  }
}

std::string SignatureAlgorithmText(const std::string& uri) {
  for (const NamedAlgorithm& each : kAlgorithms) {
    if (uri == each.uri) {
      return each.name;
    }
  }
  return uri;
}

}  // namespace SsoClient::Tool
