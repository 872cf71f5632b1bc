#include "request_signature.h"

#include <chrono>

#include "certificate_values.h"
#include "element_reader.h"
#include "fault.h"
#include "key_reference.h"
#include "namespaces.h"
#include "signature_shape.h"
#include "xml_library.h"
#include "xml_verifier.h"

namespace DevSts {
namespace {

void RequireNothingOfASignature(const SoapRequest& request, const SecurityHeader& header) {
  RequireAttributes(request.body, {});
  RequireAttributes(header.timestamp, {});
  if (header.assertion != nullptr || header.certificateToken != nullptr) {
    ThrowInvalidSecurity("A token that names a key needs a signature by that key");
  }
}

// WS-Security 1.1, section 4.2: an xs:ID. Another text could be an expression where a reference to
// it stands, and would be evaluated there.
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
    RequireNothingOfASignature(request, header);
    return std::nullopt;
  }
  RequireTenMinutes(header);
  RequireSignatureShape(header.signature, SignedIdOf(request.body), SignedIdOf(header.timestamp));
  const KeyProof proof{SignatureFormOf(header), CertificateOfSignature(header)};
  RequireUsableCertificate(proof.certificatePem);
  const VerifyResult result = VerifySignature(header.signature, proof.certificatePem);
  if (!result) {
    ThrowFailedCheck("The request's signature does not verify: " + result.reason);
  }
  return proof;
}

}  // namespace DevSts
