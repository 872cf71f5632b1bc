#ifndef DEVSTS_SOAP_KEY_REFERENCE_H
#define DEVSTS_SOAP_KEY_REFERENCE_H

#include <string>

#include "devsts/server.h"
#include "soap/security_header.h"

namespace DevSts {

// The form of the reference in ds:KeyInfo, which is not checked; None if there is no signature.
RequestSignature SignatureFormOf(const SecurityHeader& header);

// The certificate, as PEM, whose key the signature's KeyInfo names: the one in the header's
// BinarySecurityToken (X.509 Token Profile 1.1, section 3.2), or the holder's in the header's
// assertion (SAML Token Profile 1.1, section 3.4). Throws Fault.
std::string CertificateOfSignature(const SecurityHeader& header);

}  // namespace DevSts

#endif
