#include <tarnik/xml/security/signature.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <algorithm>

#include "crypto/ecdsa_value.h"
#include "crypto/public_key_impl.h"
#include "xml/security/digest_writer.h"
#include "xml/security/signature_impl.h"
#include "xml/security/verification_plan.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::Curve;
using Crypto::KeyAlgorithm;
using Crypto::PublicKeyImpl;
using Crypto::SignatureScheme;

// NIST SP 800-131A: shorter RSA keys are disallowed.
constexpr int kMinRsaBits = 2048;

bool FitsScheme(const PublicKeyImpl& key, SignatureScheme scheme) {
  switch (scheme) {
    case SignatureScheme::kRsaPkcs1:
      return key.Algorithm() == KeyAlgorithm::kRsa;
    case SignatureScheme::kRsaPss:
      return key.Algorithm() == KeyAlgorithm::kRsa || key.Algorithm() == KeyAlgorithm::kRsaPss;
    case SignatureScheme::kEcdsa:
      break;
  }
  return key.Algorithm() == KeyAlgorithm::kEc;
}

void CheckKey(const PublicKeyImpl& key, SignatureScheme scheme) {
  if (!FitsScheme(key, scheme)) {
    throw XmlSecurityException("The trusted key is not of the type of the signature algorithm.");
  }
  if (scheme == SignatureScheme::kEcdsa) {
    if (key.NamedCurve() == Curve::kNone) {
      throw XmlSecurityException("The trusted key is not on the curve P-256, P-384 or P-521.");
    }
    return;
  }
  if (key.Bits() < kMinRsaBits) {
    throw XmlSecurityException("The trusted RSA key has " + std::to_string(key.Bits()) +
                               " bits; at least " + std::to_string(kMinRsaBits) + " are needed.");
  }
}

Ref<const Crypto::PublicKey> ResolveKey(const KeyInfoResolver& resolver, const KeyInfo& keyInfo) {
  Ref<const Crypto::PublicKey> key = resolver.Resolve(keyInfo);
  if (key == nullptr) {
    throw XmlSecurityException("There is no trusted key for the signature.");
  }
  return key;
}

const PublicKeyImpl& ImplementationOf(const Crypto::PublicKey& key) {
  const auto* implementation = dynamic_cast<const PublicKeyImpl*>(&key);
  if (implementation == nullptr) {
    throw XmlSecurityException("The trusted key was not made by this library.");
  }
  return *implementation;
}

Digest Compute(const DigestInput& input, DigestWriter& writer) {
  writer.Start(input.hash);
  WriteCanonical(input.apex, input.omitted, input.canonicalization, writer);
  return writer.Finish();
}

bool IsSignatureOf(const Digest& digest, const std::vector<unsigned char>& value,
                   const PublicKeyImpl& key, const VerificationPlan& plan) {
  if (plan.scheme == SignatureScheme::kEcdsa) {
    const std::vector<unsigned char> der = Crypto::DerFromRawEcdsa(value, key.OrderLength());
    return !der.empty() && key.Verify(plan.scheme, plan.signedInfo.hash, digest.bytes.data(),
                                      der.data(), der.size());
  }
  // RFC 8017, sections 8.1.2 and 8.2.2: a signature is exactly as long as the modulus.
  return value.size() == key.ValueLength() &&
         key.Verify(plan.scheme, plan.signedInfo.hash, digest.bytes.data(), value.data(),
                    value.size());
}

bool Equal(const Digest& digest, const std::vector<unsigned char>& value) {
  return std::equal(value.begin(), value.end(), digest.bytes.begin(),
                    digest.bytes.begin() + static_cast<std::ptrdiff_t>(digest.length));
}

// The signature over SignedInfo comes first: what the references ask for is done only for the owner
// of the key.
bool Carries(const SignatureContent& content, const VerificationPlan& plan,
             const PublicKeyImpl& key) {
  DigestWriter writer;
  if (!IsSignatureOf(Compute(plan.signedInfo, writer), content.signatureValue, key, plan)) {
    return false;
  }
  for (std::size_t i = 0; i < plan.references.size(); ++i) {
    if (!Equal(Compute(plan.references[i], writer), content.references[i].digestValue)) {
      return false;
    }
  }
  return true;
}

}  // namespace

SignatureImpl::SignatureImpl(ElementNode* element)
    : element_(element), content_(ReadSignature(element)) {}

SignatureImpl::~SignatureImpl() = default;

bool SignatureImpl::Verify(const KeyInfoResolver* resolver) const {
  if (resolver == nullptr) {
    throw XmlSecurityException("A signature cannot be verified without a key resolver.");
  }
  const VerificationPlan plan = PlanVerification(element_.get(), content_);
  const Ref<const Crypto::PublicKey> key = ResolveKey(*resolver, content_.keyInfo);
  const PublicKeyImpl& implementation = ImplementationOf(*key);
  CheckKey(implementation, plan.scheme);
  try {
    return Carries(content_, plan, implementation);
  } catch (const Crypto::CryptoException& error) {
    throw XmlSecurityException(error.Message());
  }
}

Ref<Signature> CreateSignatureFromDom(ElementNode* element) {
  if (element == nullptr) {
    throw InvalidArgumentException("A signature cannot be read from a null element.");
  }
  return MakeRef<SignatureImpl>(element);
}

}  // namespace Tarnik::Xml::Security
