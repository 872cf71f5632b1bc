#ifndef SSOCLIENT_STS_RESPONSE_HANDLER_IMPL_H
#define SSOCLIENT_STS_RESPONSE_HANDLER_IMPL_H

#include <string>

#include "sts/response_handler.h"

namespace SsoClient {

/// Stateless; safe from many threads.
class ResponseHandlerImpl final : public ResponseHandler {
 public:
  void ParseIssueResponse(Tarnik::Reader* response, std::string& assertion) const override;
  bool ParseValidateResponse(Tarnik::Reader* response) const override;
  void ParseRenewResponse(Tarnik::Reader* response, std::string& assertion) const override;
  void ParseNegotiationResponse(Tarnik::Reader* response,
                                NegotiationResponse& negotiation) const override;
};

}  // namespace SsoClient

#endif
