#include <optional>
#include <utility>

#include <openssl/pem.h>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>

#include "crypto/load_file.h"
#include "crypto/passphrase.h"
#include "crypto/pem.h"
#include "crypto/private_key_impl.h"
#include "support/openssl_error.h"
#include "support/quote.h"

namespace Tarnik::Crypto {
namespace {

constexpr std::string_view kPrivateKeyLabel = "PRIVATE KEY";
constexpr const char* kUndecryptable =
    "The private key cannot be decrypted: the passphrase is wrong, or the key is broken";
constexpr const char* kUndecodable = "The private key cannot be decoded";

// A separate key, so that verifying with it never accesses the private half or its device.
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

bool IsPrivateKeyLabel(std::string_view label) noexcept {
  return label.size() >= kPrivateKeyLabel.size() &&
         label.substr(label.size() - kPrivateKeyLabel.size()) == kPrivateKeyLabel;
}

PemBlock OnlyKeyBlock(std::string_view pem) {
  PemReader reader(pem);
  std::optional<PemBlock> found;
  for (;;) {
    PemBlock block;
    if (!reader.Next(block)) {
      break;
    }
    if (!IsPrivateKeyLabel(block.Label())) {
      continue;
    }
    if (found) {
      throw CryptoException("The PEM text holds more than one private key.");
    }
    found.emplace(std::move(block));
  }
  if (!found) {
    throw CryptoException(std::string("The PEM text holds no private key") +
                          DescribeMissingPem(pem));
  }
  return std::move(*found);
}

OpenSsl::OwnedKey KeyFromInfo(const PKCS8_PRIV_KEY_INFO* info, const OpenSsl::ErrorScope& errors) {
  OpenSsl::OwnedKey key(EVP_PKCS82PKEY(info));
  if (key == nullptr) {
    throw CryptoException(errors.Describe(kUndecodable));
  }
  return key;
}

OpenSsl::OwnedKey DecodePkcs8(const PemBlock& block) {
  const OpenSsl::ErrorScope errors;
  const unsigned char* position = block.Bytes();
  const OpenSsl::OwnedKeyInfo info(
      d2i_PKCS8_PRIV_KEY_INFO(nullptr, &position, static_cast<long>(block.Size())));
  if (info == nullptr) {
    throw CryptoException(errors.Describe(kUndecodable));
  }
  return KeyFromInfo(info.get(), errors);
}

OpenSsl::OwnedKey DecodeEncryptedPkcs8(const PemBlock& block, Passphrase& passphrase) {
  const OpenSsl::ErrorScope errors;
  const unsigned char* position = block.Bytes();
  const OpenSsl::Owned<X509_SIG, X509_SIG_free> encrypted(
      d2i_X509_SIG(nullptr, &position, static_cast<long>(block.Size())));
  if (encrypted == nullptr) {
    throw CryptoException(errors.Describe(kUndecodable));
  }
  const std::string& text = passphrase.Get();
  const OpenSsl::OwnedKeyInfo info(
      PKCS8_decrypt(encrypted.get(), text.data(), static_cast<int>(text.size())));
  if (info == nullptr) {
    throw CryptoException(errors.Describe(kUndecryptable));
  }
  return KeyFromInfo(info.get(), errors);
}

int TraditionalTypeOf(std::string_view label) {
  if (label == PEM_STRING_RSA) {
    return EVP_PKEY_RSA;
  }
  if (label == PEM_STRING_ECPRIVATEKEY) {
    return EVP_PKEY_EC;
  }
  throw CryptoException("Private keys of the form " + Quote(label) + " are not supported.");
}

// RFC 1421, section 4.6.1.1.
bool IsEncrypted(const PemBlock& block) noexcept {
  return std::string_view(block.Header()).find("ENCRYPTED") != std::string_view::npos;
}

void Decrypt(PemBlock& block, Passphrase& passphrase) {
  const OpenSsl::ErrorScope errors;
  EVP_CIPHER_INFO cipher;
  if (PEM_get_EVP_CIPHER_INFO(block.Header(), &cipher) != 1) {
    throw CryptoException(errors.Describe(kUndecodable));
  }
  if (PEM_do_header(&cipher, block.Bytes(), &block.Length(), Passphrase::Read, &passphrase) != 1) {
    passphrase.RethrowFailure();
    throw CryptoException(errors.Describe(kUndecryptable));
  }
}

OpenSsl::OwnedKey DecodeTraditional(PemBlock& block, Passphrase& passphrase) {
  const int type = TraditionalTypeOf(block.Label());
  const bool isEncrypted = IsEncrypted(block);
  if (isEncrypted) {
    Decrypt(block, passphrase);
  }
  const OpenSsl::ErrorScope errors;
  const unsigned char* position = block.Bytes();
  OpenSsl::OwnedKey key(d2i_PrivateKey(type, nullptr, &position, static_cast<long>(block.Size())));
  if (key == nullptr) {
    throw CryptoException(errors.Describe(isEncrypted ? kUndecryptable : kUndecodable));
  }
  return key;
}

OpenSsl::OwnedKey Decode(PemBlock& block, Passphrase& passphrase) {
  if (block.Label() == PEM_STRING_PKCS8INF) {
    return DecodePkcs8(block);
  }
  if (block.Label() == PEM_STRING_PKCS8) {
    return DecodeEncryptedPkcs8(block, passphrase);
  }
  return DecodeTraditional(block, passphrase);
}

// The scope of errors ends before the value is verified, which puts errors of the host program back
// into the queue as new ones.
void SignWith(EVP_PKEY_CTX* context, const unsigned char* digest, std::size_t digestLength,
              std::vector<unsigned char>& value) {
  const OpenSsl::ErrorScope errors;
  std::size_t length = value.size();
  if (EVP_PKEY_sign(context, value.data(), &length, digest, digestLength) != 1) {
    throw CryptoException(errors.Describe("The signature cannot be made"));
  }
  value.resize(length);
}

}  // namespace

PrivateKeyImpl::PrivateKeyImpl(OpenSsl::OwnedKey key)
    : key_(std::move(key)), publicKey_(new PublicKeyImpl(PublicHalfOf(key_.get()))) {}

PrivateKeyImpl::~PrivateKeyImpl() = default;

bool PrivateKeyImpl::Matches(const Certificate& certificate) const {
  // Decoded again, since the caller may have implemented `Certificate`.
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
  OpenSsl::OwnedKeyContext context = contexts_.Take(key_.get(), scheme, hash);
  std::vector<unsigned char> value(publicKey_->ValueLength());
  SignWith(context.get(), digest, HashLength(hash), value);
  // When an allocation fails while OpenSSL blinds the key, it reports a wrong value as a success.
  // Such a value also endangers the key.
  if (scheme != SignatureScheme::kEcdsa &&
      !publicKey_->Verify(scheme, hash, digest, value.data(), value.size())) {
    throw CryptoException("The signature cannot be made: the cryptographic library failed.");
  }
  contexts_.Keep(scheme, hash, std::move(context));
  return value;
}

Ref<const PrivateKey> CreatePrivateKeyFromPem(std::string_view pem,
                                              const PassphraseCallback& passphrase) {
  PemBlock block = OnlyKeyBlock(pem);
  Passphrase asked(passphrase);
  return MakeRef<const PrivateKeyImpl>(Decode(block, asked));
}

Ref<const PrivateKey> LoadPrivateKey(const std::string& path,
                                     const PassphraseCallback& passphrase) {
  return LoadFile("private key", path, passphrase, CreatePrivateKeyFromPem);
}

}  // namespace Tarnik::Crypto
