#ifndef SSOCLIENT_XML_SAML_TOKEN_REFERENCE_H
#define SSOCLIENT_XML_SAML_TOKEN_REFERENCE_H

#include <memory>
#include <string_view>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// wsse:SecurityTokenReference to the assertion with the ID `assertionId` (Web Services Security:
/// SAML Token Profile 1.1, section 3.4).
std::shared_ptr<XMLCompositeBuilder> BuildSamlTokenReference(std::string_view assertionId);

}  // namespace SsoClient

#endif
