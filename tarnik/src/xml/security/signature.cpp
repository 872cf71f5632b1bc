#include <algorithm>
#include <exception>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "crypto/ecdsa_value.h"
#include "crypto/public_key_impl.h"
#include "xml/security/digest_writer.h"
#include "xml/security/key_selection.h"
#include "xml/security/new_signature.h"
#include "xml/security/reference_targets.h"
#include "xml/security/signature_impl.h"
#include "xml/security/signature_plan.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::PublicKeyImpl;
using Crypto::SignatureScheme;

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

// A failure of the library with one key does not keep another from verifying the signature.
bool IsSignatureOfAny(const Digest& digest, const std::vector<unsigned char>& value,
                      const KeySelection& selection, const SignaturePlan& plan) {
  std::exception_ptr failure;
  for (const Ref<const PublicKeyImpl>& key : selection.keys) {
    try {
      if (IsSignatureOf(digest, value, *key, plan)) {
        return true;
      }
    } catch (const Crypto::CryptoException&) {
      failure = std::current_exception();
    }
  }
  if (failure != nullptr) {
    std::rethrow_exception(failure);
  }
  return false;
}

// The signature over SignedInfo is verified first, so that the work that the references require is
// done only for the owner of a trusted key.
bool IsValid(const SignatureContent& content, const SignaturePlan& plan,
             const KeySelection& selection) {
  DigestWriter writer;
  const Digest digest = ComputeDigest(plan.signedInfo, writer);
  if (IsSignatureOfAny(digest, content.signatureValue, selection, plan)) {
    return AllDigestsMatch(content, plan, writer);
  }
  if (selection.isChoice) {
    RefuseAllKeys(selection, content.keyInfo);
  }
  return false;
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
  const KeySelection selection = SelectKeys(*resolver, content_.keyInfo, plan.scheme);
  try {
    return IsValid(content_, plan, selection);
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
