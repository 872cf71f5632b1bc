#ifndef SSOCLIENT_STS_NEGOTIATION_LEG_H
#define SSOCLIENT_STS_NEGOTIATION_LEG_H

#include <string>
#include <vector>

#include <ssoclient/token_spec.h>

#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "transport/transport.h"

namespace SsoClient {

/// The parts that a negotiation works with.
struct NegotiationParts {
  const RequestBuilder& requestBuilder;
  const TransportSession& session;
  const ResponseHandler& responseHandler;
};

/// Sends one leg of a negotiation and returns the answer: a request for a token by `spec` while
/// `contextId` is empty, and after that a continuation of the negotiation that it names.
NegotiationResponse SendNegotiationLeg(const NegotiationParts& parts, const TokenSpec& spec,
                                       const std::string& contextId,
                                       const std::vector<unsigned char>& leg);

}  // namespace SsoClient

#endif
