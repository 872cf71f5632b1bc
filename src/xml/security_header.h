#ifndef SSOCLIENT_XML_SECURITY_HEADER_H
#define SSOCLIENT_XML_SECURITY_HEADER_H

#include <cstdint>
#include <memory>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// wsse:Security (Web Services Security: SOAP Message Security 1.0, section 5) with a timestamp
/// (section 10) that is valid from now on for `minutes`, at most 35. The caller adds tokens behind
/// it.
std::shared_ptr<XMLCompositeBuilder> BuildSecurityHeader(std::uint32_t minutes);

}  // namespace SsoClient

#endif
