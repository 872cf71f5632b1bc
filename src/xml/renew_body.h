#ifndef SSOCLIENT_XML_RENEW_BODY_H
#define SSOCLIENT_XML_RENEW_BODY_H

#include <cstdint>
#include <memory>

#include <ssoclient/saml_token.h>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// wst:RequestSecurityToken that asks for `token` with a new lifetime of `lifetimeSec` seconds from
/// now on (WS-Trust 1.3, section 5). Throws `Tarnik::Xml::XMLParseException` when the token's text
/// is malformed.
std::shared_ptr<XMLCompositeBuilder> BuildRenewBody(const SamlToken& token,
                                                    std::int64_t lifetimeSec);

}  // namespace SsoClient

#endif
