#ifndef DEVSTS_SIGNING_SIGNATURE_TEMPLATE_H
#define DEVSTS_SIGNING_SIGNATURE_TEMPLATE_H

#include <libxml/tree.h>

#include "devsts/xml_security.h"

namespace DevSts {

// The element that `options` asks to sign. Throws XmlError.
xmlNode* ElementToSign(xmlDoc* document, const SignOptions& options);

// Puts a signature without values into the element, where SAML 2.0 (Core, section 2.3.3) wants it,
// and gives it.
xmlNode* AddSignatureTemplate(xmlNode* element, const SignOptions& options);

}  // namespace DevSts

#endif
