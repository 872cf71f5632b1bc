#ifndef DEVSTS_SOAP_REQUEST_SIGNATURE_H
#define DEVSTS_SOAP_REQUEST_SIGNATURE_H

#include <optional>
#include <string>

#include "devsts/server.h"
#include "soap/security_header.h"
#include "soap/soap_request.h"

namespace DevSts {

// The Id that a request's signature bears and that wst:UseKey names.
inline constexpr char kProofSignatureId[] = "holderOfKeyProofSignature";

// The key that a request's sender was seen to hold.
struct KeyProof {
  RequestSignature form = RequestSignature::None;
  std::string certificatePem;
};

// Judges the request's signature: what it covers, by which algorithms, and that the key it names
// made it. None for a request without one, which must not carry what belongs to one. Whether the
// certificate is anybody's is the caller's business. Throws Fault.
std::optional<KeyProof> CheckRequestSignature(const SoapRequest& request,
                                              const SecurityHeader& header);

}  // namespace DevSts

#endif
