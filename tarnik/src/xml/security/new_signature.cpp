#include "xml/security/new_signature.h"

#include <string>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "crypto/ecdsa_value.h"
#include "xml/security/algorithms.h"
#include "xml/security/content_reader.h"
#include "xml/security/key_check.h"
#include "xml/security/key_info_reader.h"
#include "xml/security/reference_targets.h"

namespace Tarnik::Xml::Security {
namespace {

class NewReference final : public SignatureReference, public ObjectImpl {
 public:
  NewReference(NewSignature* signature, std::size_t index) : signature_(signature), index_(index) {}

  void AddTransform(std::string_view algorithm) override {
    signature_->AddTransform(index_, algorithm);
  }

 private:
  const Ref<NewSignature> signature_;
  const std::size_t index_;
};

TextNode* AppendText(ElementNode* element) {
  Ref<TextNode> text;
  CreateTextNode(text);
  element->AppendChild(text.get());
  return text.get();
}

const Crypto::PrivateKeyImpl& ImplementationOf(const Crypto::PrivateKey* key) {
  if (key == nullptr) {
    throw InvalidArgumentException("A signature cannot be made without a private key.");
  }
  const auto* implementation = dynamic_cast<const Crypto::PrivateKeyImpl*>(key);
  if (implementation == nullptr) {
    throw XmlSecurityException("The private key was not made by this library.");
  }
  return *implementation;
}

std::vector<unsigned char> DigestBytes(const Digest& digest) {
  return {digest.bytes.begin(), digest.bytes.begin() + static_cast<std::ptrdiff_t>(digest.length)};
}

}  // namespace

/// Removes the values from the element again unless signing succeeds.
class NewSignature::ValueRollback {
 public:
  explicit ValueRollback(NewSignature& signature) noexcept : signature_(signature) {}
  ValueRollback(const ValueRollback&) = delete;
  ValueRollback& operator=(const ValueRollback&) = delete;
  ~ValueRollback() {
    if (signature_.signed_ != nullptr) {
      return;
    }
    signature_.valueText_->SetText({});
    for (const ReferenceParts& parts : signature_.parts_) {
      parts.digestText->SetText({});
    }
  }

 private:
  NewSignature& signature_;
};

NewSignature::NewSignature(ElementNode* root, const std::string& c14nMethod,
                           const std::string& signatureMethod, const std::string& prefix)
    : prefix_(prefix), root_(root) {
  if (prefix == "xml" || prefix == "xmlns") {
    throw InvalidArgumentException("The prefix '" + prefix + "' of a signature is reserved.");
  }
  element_ = MakeElement("Signature");
  element_->SetAttribute(prefix.empty() ? "xmlns" : "xmlns:" + prefix, kDsNamespace);
  const Ref<ElementNode> signedInfo = MakeElement("SignedInfo");
  const Ref<ElementNode> canonicalization = MakeAlgorithm("CanonicalizationMethod", c14nMethod);
  const Ref<ElementNode> method = MakeAlgorithm("SignatureMethod", signatureMethod);
  LookUpCanonicalizationMethod(c14nMethod, canonicalization.get());
  LookUpSignatureMethod(signatureMethod, method.get());
  const Ref<ElementNode> value = MakeElement("SignatureValue");
  signedInfo->AppendChild(canonicalization.get());
  signedInfo->AppendChild(method.get());
  element_->AppendChild(signedInfo.get());
  element_->AppendChild(value.get());
  signedInfo_ = signedInfo.get();
  valueText_ = AppendText(value.get());
  content_.signedInfo = signedInfo_;
  content_.canonicalizationMethodElement = canonicalization.get();
  content_.canonicalizationMethod = c14nMethod;
  content_.signatureMethodElement = method.get();
  content_.signatureMethod = signatureMethod;
}

NewSignature::~NewSignature() = default;

Ref<SignatureReference> NewSignature::AddReference(std::string_view uri,
                                                   std::string_view digestMethod) {
  RequireBlank();
  if (parts_.size() == kMaxReferences) {
    throw InvalidStateException("A signature may have no more than " +
                                std::to_string(kMaxReferences) + " references.");
  }
  const Ref<ElementNode> reference = MakeElement("Reference");
  reference->SetAttribute("URI", uri);
  const Ref<ElementNode> method = MakeAlgorithm("DigestMethod", digestMethod);
  LookUpDigestMethod(digestMethod, method.get());
  const Ref<ElementNode> value = MakeElement("DigestValue");
  reference->AppendChild(method.get());
  reference->AppendChild(value.get());
  ReferenceParts parts{reference.get(), nullptr, method.get(), value.get(),
                       AppendText(value.get())};

  Ref<SignatureReference> added = MakeRef<NewReference>(this, parts_.size());
  Reference read;
  read.uri = uri;
  read.digestMethod = digestMethod;
  ReferenceElements elements;
  elements.digestMethod = method.get();
  // After these three calls nothing can fail.
  parts_.reserve(kMaxReferences);
  content_.references.reserve(kMaxReferences);
  content_.referenceElements.reserve(kMaxReferences);
  parts_.push_back(parts);
  content_.references.push_back(std::move(read));
  content_.referenceElements.push_back(std::move(elements));
  signedInfo_->AppendChild(reference.get());
  return added;
}

void NewSignature::AddTransform(std::size_t index, std::string_view algorithm) {
  RequireBlank();
  const Ref<ElementNode> transform = MakeAlgorithm("Transform", algorithm);
  std::vector<std::string> algorithms = content_.references[index].transforms;
  std::vector<const ElementNode*> elements = content_.referenceElements[index].transforms;
  algorithms.emplace_back(algorithm);
  elements.push_back(transform.get());
  PlanTransforms(algorithms, elements);

  ReferenceParts& parts = parts_[index];
  if (parts.transforms == nullptr) {
    const Ref<ElementNode> transforms = MakeElement("Transforms");
    // In the order of the schema. Appending an existing child moves it to the end.
    parts.reference->AppendChild(transforms.get());
    parts.reference->AppendChild(parts.digestMethod);
    parts.reference->AppendChild(parts.digestValue);
    parts.transforms = transforms.get();
  }
  parts.transforms->AppendChild(transform.get());
  content_.references[index].transforms.swap(algorithms);
  content_.referenceElements[index].transforms.swap(elements);
}

void NewSignature::SetKeyInfo(ElementNode* content) {
  RequireBlank();
  if (content == nullptr || IsWithin(element_.get(), content) ||
      IsWithin(content, element_.get())) {
    throw InvalidArgumentException(
        "The content of KeyInfo must be an element outside of the signature.");
  }
  const Ref<ElementNode> keyInfo = MakeElement("KeyInfo");
  keyInfo->AppendChild(content);
  if (keyInfo_ != nullptr) {
    element_->RemoveChild(keyInfo_);
  }
  element_->AppendChild(keyInfo.get());
  try {
    content_.keyInfo = ReadKeyInfo(keyInfo.get());
  } catch (...) {
    element_->RemoveChild(keyInfo.get());
    if (keyInfo_ != nullptr) {
      element_->AppendChild(keyInfo_);
    }
    throw;
  }
  keyInfo_ = keyInfo.get();
}

void NewSignature::Sign(const Crypto::PrivateKey* key) {
  RequireBlank();
  const Crypto::PrivateKeyImpl& implementation = ImplementationOf(key);
  if (parts_.empty()) {
    throw InvalidStateException("A signature needs at least one reference.");
  }
  const Node* root = RootOf(root_.get());
  const SignaturePlan plan = PlanSignature(root, element_.get(), content_);
  if (!plan.signedInfo.canonicalization.exclusive) {
    RequireElementIn(root);
  }
  CheckSigningKey(implementation.Public(), plan.scheme, content_.signatureMethod);

  const ValueRollback rollback(*this);
  SignatureContent content = content_;
  try {
    content.signatureValue = ComputeValues(implementation, plan, content);
  } catch (const Crypto::CryptoException& error) {
    throw XmlSecurityException(error.Message());
  }
  valueText_->SetText(StringUtil::Base64Encode(content.signatureValue));
  signed_ = MakeRef<const SignatureImpl>(element_.get(), std::move(content));
}

Ref<ElementNode> NewSignature::MakeElement(std::string_view localName) const {
  Ref<ElementNode> element;
  CreateElementNode(prefix_, localName, element);
  return element;
}

Ref<ElementNode> NewSignature::MakeAlgorithm(std::string_view localName,
                                             std::string_view algorithm) const {
  Ref<ElementNode> element = MakeElement(localName);
  element->SetAttribute("Algorithm", algorithm);
  return element;
}

void NewSignature::RequireBlank() const {
  if (signed_ != nullptr) {
    throw InvalidStateException("A signature cannot be changed once it is signed.");
  }
}

// Canonical XML 1.0 adds namespaces and xml: attributes of the elements around SignedInfo to the
// signed octets.
void NewSignature::RequireElementIn(const Node* root) const {
  if (!IsWithin(element_.get(), root)) {
    throw XmlSecurityException(
        "A signature with inclusive canonicalisation must be in its document before it is "
        "signed.");
  }
}

const SignatureImpl& NewSignature::Signed() const {
  if (signed_ == nullptr) {
    throw InvalidStateException("The signature is not signed yet.");
  }
  return *signed_;
}

// The digests are written to the tree first, since SignedInfo is canonicalised from there.
std::vector<unsigned char> NewSignature::ComputeValues(const Crypto::PrivateKeyImpl& key,
                                                       const SignaturePlan& plan,
                                                       SignatureContent& content) {
  DigestWriter writer;
  for (std::size_t i = 0; i < parts_.size(); ++i) {
    std::vector<unsigned char>& value = content.references[i].digestValue;
    value = DigestBytes(ComputeDigest(plan.references[i], writer));
    parts_[i].digestText->SetText(StringUtil::Base64Encode(value));
  }
  const Digest digest = ComputeDigest(plan.signedInfo, writer);
  std::vector<unsigned char> value =
      key.Sign(plan.scheme, plan.signedInfo.hash, digest.bytes.data());
  return plan.scheme == Crypto::SignatureScheme::kEcdsa
             ? Crypto::RawEcdsaFromDer(value, key.Public().OrderLength())
             : value;
}

}  // namespace Tarnik::Xml::Security
