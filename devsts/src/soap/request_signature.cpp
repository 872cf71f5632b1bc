#include "soap/request_signature.h"

#include <chrono>

#include "signing/algorithms.h"
#include "signing/certificates.h"
#include "signing/xml_signature.h"
#include "soap/element_reader.h"
#include "soap/fault.h"
#include "soap/key_reference.h"
#include "xml/document.h"
#include "xml/namespaces.h"

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

// Algorithm parameters are not accepted, so the elements must not have children.
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

// Throws unless the signature has the layout that requests must use: RSA-SHA256 over exclusive
// canonical form, with one reference to each of these ids, in this order, and only SHA-256 over
// exclusive canonical form in each reference. Verifies no values.
void RequireSignatureLayout(xmlNode* signature, const std::string& bodyId,
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

void RequireNoSignatureParts(const SoapRequest& request, const SecurityHeader& header) {
  RequireAttributes(request.body, {});
  RequireAttributes(header.timestamp, {});
  if (header.assertion != nullptr || header.certificateToken != nullptr) {
    ThrowInvalidSecurity("A token that names a key needs a signature by that key");
  }
}

// WS-Security 1.1, section 4.2: an xs:ID. Any other text could be an XPointer expression, which
// would be evaluated in the reference to it.
std::string SignedIdOf(const xmlNode* element) {
  RequireAttributes(element, {{"Id", kWsuNamespace}});
  std::string id = AttributeOf(element, "Id", kWsuNamespace);
  if (xmlValidateNCName(AsXml(id.c_str()), 0) != 0) {
    ThrowInvalidSecurity(std::string(LocalName(element)) + "/@Id is not an NCName: " + id);
  }
  return id;
}

void RequireTenMinutes(const SecurityHeader& header) {
  if (header.expires - header.created != std::chrono::minutes(10)) {
    ThrowInvalidSecurity("The signed Timestamp is not valid for ten minutes");
  }
}

void RequireUsableCertificate(const std::string& certificatePem) {
  if (!HasStrongRsaKey(certificatePem)) {
    ThrowInvalidSecurityToken("The certificate's key is not an RSA key of 2048 bits or more");
  }
  if (!IsCurrent(certificatePem)) {
    ThrowInvalidSecurityToken("The certificate has expired or is not yet valid");
  }
}

}  // namespace

std::optional<KeyProof> CheckRequestSignature(const SoapRequest& request,
                                              const SecurityHeader& header) {
  if (header.signature == nullptr) {
    RequireNoSignatureParts(request, header);
    return std::nullopt;
  }
  RequireTenMinutes(header);
  RequireSignatureLayout(header.signature, SignedIdOf(request.body), SignedIdOf(header.timestamp));
  const KeyProof proof{SignatureFormOf(header), CertificateOfSignature(header)};
  RequireUsableCertificate(proof.certificatePem);
  const VerifyResult result = VerifySignature(header.signature, proof.certificatePem);
  if (!result) {
    ThrowFailedCheck("The request's signature does not verify: " + result.reason);
  }
  return proof;
}

}  // namespace DevSts
