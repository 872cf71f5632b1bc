#ifndef TARNIK_XML_SECURITY_SIGNATURE_IMPL_H
#define TARNIK_XML_SECURITY_SIGNATURE_IMPL_H

#include <tarnik/core/object_impl.h>
#include <tarnik/xml/security/signature.h>

#include "xml/security/signature_reader.h"

namespace Tarnik::Xml::Security {

/// A signature with values: read from a document, or created and signed.
class SignatureImpl final : public Signature, public ObjectImpl {
 public:
  SignatureImpl(ElementNode* element, SignatureContent content);
  ~SignatureImpl() override;

  const std::string& CanonicalizationMethod() const override {
    return content_.canonicalizationMethod;
  }
  const std::string& SignatureMethod() const override { return content_.signatureMethod; }
  const std::vector<Reference>& References() const override { return content_.references; }
  const Security::KeyInfo& KeyInfo() const override { return content_.keyInfo; }
  ElementNode* Element() const override { return element_.get(); }
  bool Verify(const KeyInfoResolver* resolver) const override;
  /// The functions below throw `InvalidStateException`.
  Ref<SignatureReference> AddReference(std::string_view uri,
                                       std::string_view digestMethod) override;
  void SetKeyInfo(ElementNode* content) override;
  void Sign(const Crypto::PrivateKey* key) override;

 private:
  Ref<ElementNode> element_;
  SignatureContent content_;
};

}  // namespace Tarnik::Xml::Security

#endif
