#ifndef SSOCLIENT_XML_ISSUE_BODY_H
#define SSOCLIENT_XML_ISSUE_BODY_H

#include <memory>

#include <ssoclient/token_spec.h>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// wst:RequestSecurityToken that asks for a token (WS-Trust 1.3, section 4.1; ActAs as in WS-Trust
/// 1.4, section 9.3). `keyType` 0 asks for a bearer token, anything else for a holder-of-key one.
///
/// Throws `Tarnik::InvalidArgumentException` when the spec's act-as token is set but null, and
/// `Tarnik::Xml::XMLParseException` when that token's text is malformed.
std::shared_ptr<XMLCompositeBuilder> BuildIssueBody(unsigned keyType, const TokenSpec& spec);

/// The same, with a last wst:UseKey that names the request's signature as proof of possession
/// (WS-Trust 1.3, section 9.2) when `keyType` is 1 and the token is not to be delegated.
std::shared_ptr<XMLCompositeBuilder> BuildIssueBodyWithUseKey(unsigned keyType,
                                                              const TokenSpec& spec);

}  // namespace SsoClient

#endif
