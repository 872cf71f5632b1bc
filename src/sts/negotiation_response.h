#ifndef SSOCLIENT_STS_NEGOTIATION_RESPONSE_H
#define SSOCLIENT_STS_NEGOTIATION_RESPONSE_H

#include <string>
#include <vector>

namespace SsoClient {

/// The answer to one leg of an SPNego negotiation.
struct NegotiationResponse {
  std::string contextId;           ///< names the negotiation towards the service
  std::vector<unsigned char> leg;  ///< the service's leg; empty when the answer carries none
  std::string token;               ///< the assertion's canonical text; empty until it is issued
};

}  // namespace SsoClient

#endif
