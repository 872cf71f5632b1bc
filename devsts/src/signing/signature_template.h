#ifndef DEVSTS_SIGNING_SIGNATURE_TEMPLATE_H
#define DEVSTS_SIGNING_SIGNATURE_TEMPLATE_H

#include <libxml/tree.h>

#include "devsts/xml_security.h"

namespace DevSts {

// The element that `options` selects for signing. Throws XmlError.
xmlNode* ElementToSign(xmlDoc* document, const SignOptions& options);

// Inserts a signature without values into the element, at the place that SAML 2.0 requires (Core,
// section 2.3.3), and returns it.
xmlNode* AddSignatureTemplate(xmlNode* element, const SignOptions& options);

}  // namespace DevSts

#endif
