#include "xml/security/signature_plan.h"

#include <utility>

#include <tarnik/xml/security/xml_security_exception.h>

#include "support/quote.h"
#include "xml/security/reference_targets.h"

namespace Tarnik::Xml::Security {
namespace {

DigestInput PlanSignedInfo(const SignatureContent& content, Crypto::Hash hash) {
  DigestInput input;
  input.apex = content.signedInfo;
  input.canonicalization = LookUpCanonicalizationMethod(content.canonicalizationMethod,
                                                        content.canonicalizationMethodElement);
  input.hash = hash;
  return input;
}

DigestInput PlanReference(const Reference& reference, const ReferenceElements& elements,
                          const ElementNode* signature) {
  DigestInput input;
  input.hash = LookUpDigestMethod(reference.digestMethod, elements.digestMethod);
  TransformPlan transforms = PlanTransforms(reference.transforms, elements.transforms);
  input.omitted = transforms.enveloped ? signature : nullptr;
  input.canonicalization = std::move(transforms.canonicalization);
  // A same-document reference yields a node-set without comments, whatever the canonicalisation
  // would write (XML Signature 1.1, section 4.4.3.3).
  input.canonicalization.withComments = false;
  return input;
}

void CheckTarget(const DigestInput& input, const Reference& reference,
                 const ElementNode* signature) {
  if (IsWithin(input.apex, signature)) {
    throw XmlSecurityException("The reference " + Quote(reference.uri) +
                               " points into the signature itself.");
  }
  const bool encloses = IsWithin(signature, input.apex);
  if (encloses && input.omitted == nullptr) {
    throw XmlSecurityException("The reference " + Quote(reference.uri) +
                               " encloses the signature without the enveloped-signature "
                               "transform.");
  }
  if (!encloses && input.omitted != nullptr) {
    throw XmlSecurityException("The reference " + Quote(reference.uri) +
                               " has the enveloped-signature transform but does not enclose the "
                               "signature.");
  }
}

}  // namespace

SignaturePlan PlanSignature(const Node* root, const ElementNode* signature,
                            const SignatureContent& content) {
  const SignatureMethod method =
      LookUpSignatureMethod(content.signatureMethod, content.signatureMethodElement);
  SignaturePlan plan;
  plan.scheme = method.scheme;
  plan.signedInfo = PlanSignedInfo(content, method.hash);
  plan.references.reserve(content.references.size());
  for (std::size_t i = 0; i < content.references.size(); ++i) {
    plan.references.push_back(
        PlanReference(content.references[i], content.referenceElements[i], signature));
  }
  const std::vector<const Node*> targets =
      FindReferenceTargets(root, signature, content.references);
  for (std::size_t i = 0; i < targets.size(); ++i) {
    plan.references[i].apex = targets[i];
    CheckTarget(plan.references[i], content.references[i], signature);
  }
  return plan;
}

Digest ComputeDigest(const DigestInput& input, DigestWriter& writer) {
  writer.Start(input.hash);
  WriteCanonical(input.apex, input.omitted, input.canonicalization, writer);
  return writer.Finish();
}

}  // namespace Tarnik::Xml::Security
