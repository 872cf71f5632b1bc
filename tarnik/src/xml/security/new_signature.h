#ifndef TARNIK_XML_SECURITY_NEW_SIGNATURE_H
#define TARNIK_XML_SECURITY_NEW_SIGNATURE_H

#include <cstddef>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/security/signature.h>

#include "crypto/private_key_impl.h"
#include "xml/security/signature_impl.h"
#include "xml/security/signature_plan.h"
#include "xml/security/signature_reader.h"

namespace Tarnik::Xml::Security {

/// A signature that is being created. Its element is complete from the start except for the values.
/// Once it is signed, a `SignatureImpl` provides what a reader of the element would see.
class NewSignature final : public Signature, public ObjectImpl {
 public:
  /// Throws as `CreateBlankSignature` does.
  NewSignature(ElementNode* root, const std::string& c14nMethod, const std::string& signatureMethod,
               const std::string& prefix);
  ~NewSignature() override;

  const std::string& CanonicalizationMethod() const override {
    return content_.canonicalizationMethod;
  }
  const std::string& SignatureMethod() const override { return content_.signatureMethod; }
  const std::vector<Reference>& References() const override { return Signed().References(); }
  const Security::KeyInfo& KeyInfo() const override { return Signed().KeyInfo(); }
  ElementNode* Element() const override { return element_.get(); }
  bool Verify(const KeyInfoResolver* resolver) const override { return Signed().Verify(resolver); }
  Ref<SignatureReference> AddReference(std::string_view uri,
                                       std::string_view digestMethod) override;
  void SetKeyInfo(ElementNode* content) override;
  void Sign(const Crypto::PrivateKey* key) override;

  /// `SignatureReference::AddTransform` for the reference with this index.
  void AddTransform(std::size_t index, std::string_view algorithm);

 private:
  /// The elements of a reference that are modified. They are part of the signature's tree.
  struct ReferenceParts {
    ElementNode* reference;
    ElementNode* transforms;  // null before the first transform
    ElementNode* digestMethod;
    ElementNode* digestValue;
    TextNode* digestText;
  };
  class ValueRollback;

  Ref<ElementNode> MakeElement(std::string_view localName) const;
  Ref<ElementNode> MakeAlgorithm(std::string_view localName, std::string_view algorithm) const;
  void RequireBlank() const;
  void RequireElementIn(const Node* root) const;
  const SignatureImpl& Signed() const;
  /// Writes the digests into `content` and the tree; returns the signature value.
  std::vector<unsigned char> ComputeValues(const Crypto::PrivateKeyImpl& key,
                                           const SignaturePlan& plan, SignatureContent& content);

  const std::string prefix_;
  const Ref<ElementNode> root_;
  Ref<ElementNode> element_;
  ElementNode* signedInfo_ = nullptr;
  TextNode* valueText_ = nullptr;
  ElementNode* keyInfo_ = nullptr;
  std::vector<ReferenceParts> parts_;
  SignatureContent content_;
  Ref<const SignatureImpl> signed_;
};

}  // namespace Tarnik::Xml::Security

#endif
