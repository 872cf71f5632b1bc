#ifndef DEVSTS_SIGNING_CANONICAL_FORM_H
#define DEVSTS_SIGNING_CANONICAL_FORM_H

#include <string>
#include <vector>

#include <libxml/tree.h>

#include "devsts/xml_security.h"

namespace DevSts {

// The canonical form of the element and its content, as part of its document; of the whole document
// if `element` is null. Throws XmlError.
std::string CanonicalForm(xmlDoc* document, xmlNode* element, CanonicalMode mode,
                          const std::vector<std::string>& inclusivePrefixes);

}  // namespace DevSts

#endif
