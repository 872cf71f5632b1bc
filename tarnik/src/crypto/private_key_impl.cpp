#include "crypto/private_key_impl.h"

#include <tarnik/crypto/crypto_exception.h>
#include <utility>

#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

// A key of its own, so that what verifies with it never reaches the private half or its device.
OpenSsl::OwnedKey PublicHalfOf(const EVP_PKEY* key) {
  const OpenSsl::ErrorScope errors;
  unsigned char* bytes = nullptr;
  const int length = i2d_PUBKEY(key, &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  const unsigned char* position = bytes;
  OpenSsl::OwnedKey half(length <= 0 ? nullptr : d2i_PUBKEY(nullptr, &position, length));
  if (half == nullptr) {
    throw CryptoException(errors.Describe("The private key's public half cannot be read"));
  }
  return half;
}

}  // namespace

PrivateKeyImpl::PrivateKeyImpl(OpenSsl::OwnedKey key)
    : key_(std::move(key)), publicKey_(new PublicKeyImpl(PublicHalfOf(key_.get()))) {}

PrivateKeyImpl::~PrivateKeyImpl() = default;

bool PrivateKeyImpl::Matches(const Certificate& certificate) const {
  // By its bytes: `certificate` may be of the caller's own making.
  const Ref<const PublicKey> issued =
      CreateCertificateFromDer(certificate.DerBytes(), certificate.DerLength())->GetPublicKey();
  const OpenSsl::ErrorScope errors;
  return EVP_PKEY_eq(publicKey_->Handle(), static_cast<const PublicKeyImpl&>(*issued).Handle()) ==
         1;
}

std::string PrivateKeyImpl::ToString() const {
  return "<PrivateKey>";
}

std::vector<unsigned char> PrivateKeyImpl::Sign(SignatureScheme scheme, Hash hash,
                                                const unsigned char* digest) const {
  const OpenSsl::ErrorScope errors;
  OpenSsl::OwnedKeyContext context = contexts_.Take(key_.get(), scheme, hash);
  std::vector<unsigned char> value(publicKey_->ValueLength());
  std::size_t length = value.size();
  if (EVP_PKEY_sign(context.get(), value.data(), &length, digest, HashLength(hash)) != 1) {
    throw CryptoException(errors.Describe("The signature cannot be made"));
  }
  value.resize(length);
  contexts_.Keep(scheme, hash, std::move(context));
  return value;
}

}  // namespace Tarnik::Crypto
