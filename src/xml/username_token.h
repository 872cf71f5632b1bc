#ifndef SSOCLIENT_XML_USERNAME_TOKEN_H
#define SSOCLIENT_XML_USERNAME_TOKEN_H

#include <memory>
#include <string_view>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// wsse:UsernameToken with the name alone (Web Services Security UsernameToken Profile 1.0,
/// section 3).
std::shared_ptr<XMLCompositeBuilder> BuildUsernameToken(std::string_view user);

/// The same with the password in clear text, without nonce or creation time.
std::shared_ptr<XMLCompositeBuilder> BuildUsernamePasswordToken(std::string_view user,
                                                                std::string_view password);

}  // namespace SsoClient

#endif
