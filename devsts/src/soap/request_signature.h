#ifndef DEVSTS_SOAP_REQUEST_SIGNATURE_H
#define DEVSTS_SOAP_REQUEST_SIGNATURE_H

#include <optional>
#include <string>

#include "devsts/server.h"
#include "soap/security_header.h"
#include "soap/soap_request.h"

namespace DevSts {

// The Id of a request's signature, to which wst:UseKey refers.
inline constexpr char kProofSignatureId[] = "holderOfKeyProofSignature";

// The key whose possession the sender of a request has proved.
struct KeyProof {
  RequestSignature form = RequestSignature::None;
  std::string certificatePem;
};

// Checks the request's signature: what it covers, its algorithms, and its value under the key that
// it names. Returns nothing for a request without a signature, which must not contain the elements
// and attributes that belong to one. Does not check whether a user has the certificate. Throws
// Fault.
std::optional<KeyProof> CheckRequestSignature(const SoapRequest& request,
                                              const SecurityHeader& header);

}  // namespace DevSts

#endif
