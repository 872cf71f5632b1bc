#ifndef SSOCLIENT_XML_VALIDATE_BODY_H
#define SSOCLIENT_XML_VALIDATE_BODY_H

#include <memory>

#include <ssoclient/saml_token.h>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// wst:RequestSecurityToken that asks for the status of `token` (WS-Trust 1.3, section 7). Throws
/// `Tarnik::Xml::XMLParseException` when the token's text is malformed.
std::shared_ptr<XMLCompositeBuilder> BuildValidateBody(const SamlToken& token);

}  // namespace SsoClient

#endif
