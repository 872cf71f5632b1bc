#ifndef SSOCLIENT_XML_LIFETIME_H
#define SSOCLIENT_XML_LIFETIME_H

#include <cstdint>
#include <memory>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// wst:Lifetime (WS-Trust 1.3, section 4.1) from now on for `seconds`, which is not judged here.
std::shared_ptr<XMLCompositeBuilder> BuildLifetime(std::int64_t seconds);

}  // namespace SsoClient

#endif
