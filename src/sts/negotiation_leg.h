#ifndef SSOCLIENT_STS_NEGOTIATION_LEG_H
#define SSOCLIENT_STS_NEGOTIATION_LEG_H

#include <string>
#include <vector>

#include <ssoclient/token_spec.h>

#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "transport/transport.h"

namespace SsoClient {

/// What a negotiation uses to build, send and read its legs.
struct NegotiationParts {
  const RequestBuilder& requestBuilder;
  const TransportSession& session;
  const ResponseHandler& responseHandler;
};

/// Sends one leg of a negotiation and returns the answer. With an empty `contextId` the leg opens a
/// negotiation for the token that `spec` describes; otherwise it continues the negotiation with
/// that id.
NegotiationResponse SendNegotiationLeg(const NegotiationParts& parts, const TokenSpec& spec,
                                       const std::string& contextId,
                                       const std::vector<unsigned char>& leg);

}  // namespace SsoClient

#endif
