#include <utility>

#include <openssl/pem.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/revocation_list.h>

#include "crypto/decoded_certificate.h"
#include "crypto/key_rules.h"
#include "crypto/load_file.h"
#include "crypto/pem.h"
#include "crypto/public_key_impl.h"
#include "crypto/revocation_list_reader.h"
#include "crypto/signature_check.h"
#include "support/openssl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

OpenSsl::OwnedCertificate OpenSslCertificateOf(const CertificateImpl& certificate) {
  const OpenSsl::ErrorScope errors;
  const unsigned char* position = certificate.DerBytes();
  OpenSsl::OwnedCertificate decoded(
      d2i_X509(nullptr, &position, static_cast<long>(certificate.DerLength())));
  if (decoded == nullptr) {
    throw CryptoException(errors.Describe("The certificate of an issuer cannot be decoded"));
  }
  return decoded;
}

// RFC 5280, sections 4.2.1.3, 5.2.1 and 6.3.3 (f).
bool MaySign(const CertificateImpl& issuer, const AUTHORITY_KEYID* authorityKey) {
  const OpenSsl::OwnedCertificate decoded = OpenSslCertificateOf(issuer);
  const OpenSsl::ErrorScope errors;
  // All bits when the certificate has no keyUsage. Reads all extensions.
  const bool isForLists = (X509_get_key_usage(decoded.get()) & KU_CRL_SIGN) != 0;
  const bool isBroken = (X509_get_extension_flags(decoded.get()) & EXFLAG_INVALID) != 0;
  return isForLists && !isBroken &&
         (authorityKey == nullptr || X509_check_akid(decoded.get(), authorityKey) == X509_V_OK);
}

class RevocationListImpl final : public RevocationList, public ObjectImpl {
 public:
  explicit RevocationListImpl(RevocationListContent content) : content_(std::move(content)) {}

  const std::string& IssuerName() const override { return content_.issuerName; }
  System::DateTime ThisUpdate() const override { return content_.thisUpdate; }
  System::DateTime NextUpdate() const override { return content_.nextUpdate; }

  bool IsFrom(const Certificate& issuer) const override {
    const Ref<const CertificateImpl> decoded = DecodedCertificate(issuer);
    return content_.signature && content_.issuer.Equals(decoded->Subject()) &&
           MaySign(*decoded, content_.authorityKey.get()) && IsSignedBy(*decoded);
  }

  bool Covers(const Certificate& certificate) const override {
    return HasIssuerOf(*DecodedCertificate(certificate));
  }

  boost::optional<System::DateTime> RevokedSince(const Certificate& certificate) const override {
    const Ref<const CertificateImpl> decoded = DecodedCertificate(certificate);
    if (!HasIssuerOf(*decoded)) {
      return boost::none;
    }
    const auto since = content_.revoked.Since(SerialKeyOf(decoded->SerialNumber()));
    return since ? boost::make_optional(*since) : boost::none;
  }

  std::string ToString() const override { return "Revocation list of " + content_.issuerName; }

 private:
  bool HasIssuerOf(const CertificateImpl& certificate) const {
    return content_.issuer.Equals(certificate.Issuer());
  }

  bool IsSignedBy(const CertificateImpl& issuer) const {
    const ListSignature& signature = *content_.signature;
    const Ref<const PublicKey> key = issuer.GetPublicKey();
    const auto& implementation = dynamic_cast<const PublicKeyImpl&>(*key);
    return IsUsableKey(implementation, signature.scheme) &&
           IsSignatureOf(implementation, signature.scheme, signature.hash, signature.digest.data(),
                         signature.value);
  }

  RevocationListContent content_;
};

}  // namespace

Ref<const RevocationList> CreateRevocationListFromDer(const unsigned char* bytes,
                                                      std::size_t length) {
  if (bytes == nullptr) {
    throw CryptoException("A revocation list cannot be empty.");
  }
  const std::vector<unsigned char> der(bytes, bytes + length);
  return MakeRef<const RevocationListImpl>(ReadRevocationList(der));
}

std::vector<Ref<const RevocationList>> CreateRevocationListsFromPem(std::string_view pem) {
  PemReader reader(pem);
  std::vector<Ref<const RevocationList>> lists;
  for (;;) {
    PemBlock block;
    if (!reader.Next(block)) {
      break;
    }
    if (block.Label() == PEM_STRING_X509_CRL) {
      lists.push_back(CreateRevocationListFromDer(block.Bytes(), block.Size()));
    }
  }
  if (lists.empty()) {
    throw CryptoException(std::string("The PEM text holds no revocation list") +
                          DescribeMissingPem(pem));
  }
  return lists;
}

std::vector<Ref<const RevocationList>> CreateRevocationListsFromPemOrDer(std::string_view content) {
  if (!StartsLikeDer(content)) {
    return CreateRevocationListsFromPem(content);
  }
  const auto* bytes = reinterpret_cast<const unsigned char*>(content.data());
  return {CreateRevocationListFromDer(bytes, content.size())};
}

std::vector<Ref<const RevocationList>> LoadRevocationLists(const std::string& path) {
  return LoadFile("revocation list", path, {},
                  [](std::string_view content, const PassphraseCallback& /*passphrase*/) {
                    return CreateRevocationListsFromPemOrDer(content);
                  });
}

}  // namespace Tarnik::Crypto
