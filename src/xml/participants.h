#ifndef SSOCLIENT_XML_PARTICIPANTS_H
#define SSOCLIENT_XML_PARTICIPANTS_H

#include <memory>
#include <set>
#include <string>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// wst:Participants (WS-Trust 1.3, section 9.5) with one participant for each audience, in order.
std::shared_ptr<XMLCompositeBuilder> BuildParticipants(
    const std::set<std::string>& audienceRestriction);

}  // namespace SsoClient

#endif
