#include <string>
#include <string_view>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/data_signature.h>

#include "crypto/decoded_certificate.h"
#include "crypto/hash.h"
#include "crypto/key_rules.h"
#include "crypto/private_key_impl.h"
#include "crypto/public_key_impl.h"
#include "crypto/signature_check.h"
#include "crypto/signature_scheme.h"

namespace Tarnik::Crypto {
namespace {

struct DataAlgorithm {
  SignatureScheme scheme;
  Hash hash;
};

DataAlgorithm DataAlgorithmOf(SignatureAlgorithm algorithm) {
  switch (algorithm) {
    case SignatureAlgorithm::kRsaPkcs1Sha256:
      return {SignatureScheme::kRsaPkcs1, Hash::kSha256};
    case SignatureAlgorithm::kRsaPkcs1Sha384:
      return {SignatureScheme::kRsaPkcs1, Hash::kSha384};
    case SignatureAlgorithm::kRsaPkcs1Sha512:
      return {SignatureScheme::kRsaPkcs1, Hash::kSha512};
    case SignatureAlgorithm::kRsaPssSha256:
      return {SignatureScheme::kRsaPss, Hash::kSha256};
    case SignatureAlgorithm::kRsaPssSha384:
      return {SignatureScheme::kRsaPss, Hash::kSha384};
    case SignatureAlgorithm::kRsaPssSha512:
      return {SignatureScheme::kRsaPss, Hash::kSha512};
    case SignatureAlgorithm::kEcdsaSha256:
      return {SignatureScheme::kEcdsa, Hash::kSha256};
    case SignatureAlgorithm::kEcdsaSha384:
      return {SignatureScheme::kEcdsa, Hash::kSha384};
    case SignatureAlgorithm::kEcdsaSha512:
      return {SignatureScheme::kEcdsa, Hash::kSha512};
  }
  throw InvalidArgumentException("The signature algorithm is not one of those that are defined.");
}

void CheckKey(const PublicKeyImpl& key, SignatureScheme scheme, const char* owner) {
  const std::string subject = std::string("The ") + owner + " key ";
  if (!IsOfType(key, scheme)) {
    throw CryptoException(subject + "is " + KeyTypeText(key.Algorithm()) +
                          "; the signature algorithm needs " + NeededKeyText(scheme) + ".");
  }
  if (IsStrong(key, scheme)) {
    return;
  }
  if (scheme == SignatureScheme::kEcdsa) {
    throw CryptoException(subject + "is not on the curve P-256, P-384 or P-521.");
  }
  throw CryptoException(subject + "has " + std::to_string(key.Bits()) + " bits; at least " +
                        std::to_string(kMinRsaBits) + " are needed.");
}

std::vector<unsigned char> DigestOf(Hash hash, std::string_view data) {
  return HashOf(hash, reinterpret_cast<const unsigned char*>(data.data()), data.size());
}

}  // namespace

bool VerifyData(const Certificate& certificate, SignatureAlgorithm algorithm, std::string_view data,
                const std::vector<unsigned char>& signature) {
  const DataAlgorithm used = DataAlgorithmOf(algorithm);
  const Ref<const PublicKey> key = DecodedCertificate(certificate)->GetPublicKey();
  const auto& implementation = dynamic_cast<const PublicKeyImpl&>(*key);
  CheckKey(implementation, used.scheme, "certificate's");
  return IsSignatureOf(implementation, used.scheme, used.hash, DigestOf(used.hash, data).data(),
                       signature);
}

std::vector<unsigned char> SignData(const PrivateKey& privateKey, SignatureAlgorithm algorithm,
                                    std::string_view data) {
  const DataAlgorithm used = DataAlgorithmOf(algorithm);
  const auto* key = dynamic_cast<const PrivateKeyImpl*>(&privateKey);
  if (key == nullptr) {
    throw InvalidArgumentException("The private key was not made by this library.");
  }
  CheckKey(key->Public(), used.scheme, "private");
  const std::vector<unsigned char> digest = DigestOf(used.hash, data);
  std::vector<unsigned char> signature = key->Sign(used.scheme, used.hash, digest.data());
  // The key verifies RSA signatures itself.
  if (used.scheme == SignatureScheme::kEcdsa &&
      !IsSignatureOf(key->Public(), used.scheme, used.hash, digest.data(), signature)) {
    throw CryptoException("The signature cannot be made: the key's provider made a wrong one.");
  }
  return signature;
}

}  // namespace Tarnik::Crypto
