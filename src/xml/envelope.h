#ifndef SSOCLIENT_XML_ENVELOPE_H
#define SSOCLIENT_XML_ENVELOPE_H

#include <memory>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// A SOAP 1.1 envelope (SOAP 1.1, section 4). An empty `header` leaves the Header element empty.
/// "wst" is declared on the Body, for bodies that do not declare it themselves.
std::shared_ptr<XMLCompositeBuilder> BuildEnvelope(const std::shared_ptr<XMLBaseBuilder>& header,
                                                   const std::shared_ptr<XMLBaseBuilder>& body);

}  // namespace SsoClient

#endif
