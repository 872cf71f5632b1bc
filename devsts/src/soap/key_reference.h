#ifndef DEVSTS_SOAP_KEY_REFERENCE_H
#define DEVSTS_SOAP_KEY_REFERENCE_H

#include <string>

#include "devsts/server.h"
#include "soap/security_header.h"

namespace DevSts {

// The form of what ds:KeyInfo refers to, without a look at whether it is right; None if there is no
// signature.
RequestSignature SignatureFormOf(const SecurityHeader& header);

// PEM of the certificate whose key the signature's KeyInfo names: that of the header's
// BinarySecurityToken (X.509 Token Profile 1.1, section 3.2), or of the holder of the header's
// assertion (SAML Token Profile 1.1, section 3.4). Throws Fault.
std::string CertificateOfSignature(const SecurityHeader& header);

}  // namespace DevSts

#endif
