#include <algorithm>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "crypto/ecdsa_value.h"
#include "crypto/public_key_impl.h"
#include "xml/security/digest_writer.h"
#include "xml/security/key_check.h"
#include "xml/security/new_signature.h"
#include "xml/security/reference_targets.h"
#include "xml/security/signature_impl.h"
#include "xml/security/signature_plan.h"
#include "xml/security/signer_description.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::PublicKeyImpl;
using Crypto::SignatureScheme;

Ref<const Crypto::PublicKey> ResolveKey(const KeyInfoResolver& resolver, const KeyInfo& keyInfo) {
  Ref<const Crypto::PublicKey> key = resolver.Resolve(keyInfo);
  if (key == nullptr) {
    throw XmlSecurityException("There is no trusted key for the signature, " +
                               DescribeSigner(keyInfo) + ".");
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

bool IsSignatureOf(const Digest& digest, const std::vector<unsigned char>& value,
                   const PublicKeyImpl& key, const SignaturePlan& plan) {
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

bool IsEqual(const Digest& digest, const std::vector<unsigned char>& value) {
  return std::equal(value.begin(), value.end(), digest.bytes.begin(),
                    digest.bytes.begin() + static_cast<std::ptrdiff_t>(digest.length));
}

bool AllDigestsMatch(const SignatureContent& content, const SignaturePlan& plan,
                     DigestWriter& writer) {
  for (std::size_t i = 0; i < plan.references.size(); ++i) {
    if (!IsEqual(ComputeDigest(plan.references[i], writer), content.references[i].digestValue)) {
      return false;
    }
  }
  return true;
}

// The signature over SignedInfo is verified first, so that the work that the references require is
// done only for the owner of the key.
bool IsValid(const SignatureContent& content, const SignaturePlan& plan, const PublicKeyImpl& key) {
  DigestWriter writer;
  return IsSignatureOf(ComputeDigest(plan.signedInfo, writer), content.signatureValue, key, plan) &&
         AllDigestsMatch(content, plan, writer);
}

[[noreturn]] void RefuseChange() {
  throw InvalidStateException("A signature that was read from a document cannot be changed.");
}

}  // namespace

SignatureImpl::SignatureImpl(ElementNode* element, SignatureContent content)
    : element_(element), content_(std::move(content)) {}

SignatureImpl::~SignatureImpl() = default;

Ref<SignatureReference> SignatureImpl::AddReference(std::string_view /*uri*/,
                                                    std::string_view /*digestMethod*/) {
  RefuseChange();
}

void SignatureImpl::SetKeyInfo(ElementNode* /*content*/) {
  RefuseChange();
}

void SignatureImpl::Sign(const Crypto::PrivateKey* /*key*/) {
  RefuseChange();
}

bool SignatureImpl::Verify(const KeyInfoResolver* resolver) const {
  if (resolver == nullptr) {
    throw XmlSecurityException("A signature cannot be verified without a key resolver.");
  }
  const SignaturePlan plan = PlanSignature(RootOf(element_.get()), element_.get(), content_);
  const Ref<const Crypto::PublicKey> key = ResolveKey(*resolver, content_.keyInfo);
  const PublicKeyImpl& implementation = ImplementationOf(*key);
  CheckTrustedKey(implementation, plan.scheme);
  try {
    return IsValid(content_, plan, implementation);
  } catch (const Crypto::CryptoException& error) {
    throw XmlSecurityException(error.Message());
  }
}

Ref<Signature> CreateSignatureFromDom(ElementNode* element) {
  if (element == nullptr) {
    throw InvalidArgumentException("A signature cannot be read from a null element.");
  }
  return MakeRef<SignatureImpl>(element, ReadSignature(element));
}

void CreateBlankSignature(ElementNode* root, const std::string& c14nMethod,
                          const std::string& signatureMethod, const std::string& prefix,
                          Ref<Signature>& signature) {
  if (root == nullptr) {
    throw InvalidArgumentException("A signature cannot be made for a null element.");
  }
  signature = MakeRef<NewSignature>(root, c14nMethod, signatureMethod, prefix);
}

}  // namespace Tarnik::Xml::Security
