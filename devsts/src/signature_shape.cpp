#include "signature_shape.h"

#include "algorithms.h"
#include "element_reader.h"
#include "fault.h"
#include "namespaces.h"
#include "xml_library.h"

namespace DevSts {
namespace {

void RequireAlgorithm(xmlNode* element, const char* uri) {
  RequireAttributes(element, {{"Algorithm"}});
  ElementReader(element).End();
  const std::string algorithm = AttributeOf(element, "Algorithm");
  if (algorithm != uri) {
    ThrowUnsupportedAlgorithm(std::string(LocalName(element)) + " is not " + uri + " but " +
                              algorithm);
  }
}

// No parameters of any algorithm are taken, so none of these may have children.
void RequireExclusiveTransform(xmlNode* transforms) {
  RequireAttributes(transforms, {});
  ElementReader reader(transforms);
  RequireAlgorithm(reader.Expect(kDsigNamespace, "Transform"), UriOf(CanonicalMode::Exclusive));
  if (!reader.AtEnd()) {
    ThrowInvalidSecurity("A Reference has more than one Transform");
  }
}

void RequireReference(xmlNode* reference, const char* place, const std::string& id) {
  RequireAttributes(reference, {{"URI"}});
  const std::string uri = AttributeOf(reference, "URI");
  if (uri != "#" + id) {
    ThrowInvalidSecurity(std::string(place) + " is not the target of its Reference: " + uri);
  }
  ElementReader reader(reference);
  RequireExclusiveTransform(reader.Expect(kDsigNamespace, "Transforms"));
  RequireAlgorithm(reader.Expect(kDsigNamespace, "DigestMethod"), UriOf(DigestAlgorithm::Sha256));
  PlainText(reader.Expect(kDsigNamespace, "DigestValue"));
  reader.End();
}

void RequireSignedInfo(xmlNode* signedInfo, const std::string& bodyId,
                       const std::string& timestampId) {
  RequireAttributes(signedInfo, {});
  ElementReader reader(signedInfo);
  RequireAlgorithm(reader.Expect(kDsigNamespace, "CanonicalizationMethod"),
                   UriOf(CanonicalMode::Exclusive));
  RequireAlgorithm(reader.Expect(kDsigNamespace, "SignatureMethod"),
                   UriOf(SignatureAlgorithm::RsaSha256));
  RequireReference(reader.Expect(kDsigNamespace, "Reference"), "The Body", bodyId);
  RequireReference(reader.Expect(kDsigNamespace, "Reference"), "The Timestamp", timestampId);
  if (!reader.AtEnd()) {
    ThrowInvalidSecurity("The Signature has more than two References");
  }
}

}  // namespace

void RequireSignatureShape(xmlNode* signature, const std::string& bodyId,
                           const std::string& timestampId) {
  RequireAttributes(signature, {{"Id"}});
  if (AttributeOf(signature, "Id") != kProofSignatureId) {
    ThrowInvalidSecurity("Signature/@Id is not " + std::string(kProofSignatureId));
  }
  ElementReader reader(signature);
  RequireSignedInfo(reader.Expect(kDsigNamespace, "SignedInfo"), bodyId, timestampId);
  PlainText(reader.Expect(kDsigNamespace, "SignatureValue"));
  reader.Expect(kDsigNamespace, "KeyInfo");
  reader.End();
}

}  // namespace DevSts
