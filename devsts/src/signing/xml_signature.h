#ifndef DEVSTS_SIGNING_XML_SIGNATURE_H
#define DEVSTS_SIGNING_XML_SIGNATURE_H

#include <string_view>

#include <libxml/tree.h>

#include "devsts/xml_security.h"

namespace DevSts {

// Verifies this signature in its document, whose ids must be registered. The document must not be
// used afterwards: the signature's method may have been replaced.
VerifyResult VerifySignature(xmlNode* signature, std::string_view certificatePem);

}  // namespace DevSts

#endif
