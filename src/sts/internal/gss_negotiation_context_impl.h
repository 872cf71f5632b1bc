#ifndef SSOCLIENT_STS_INTERNAL_GSS_NEGOTIATION_CONTEXT_IMPL_H
#define SSOCLIENT_STS_INTERNAL_GSS_NEGOTIATION_CONTEXT_IMPL_H

#include <memory>
#include <string>
#include <vector>

#include <ssoclient/gss_negotiation_context.h>

#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "transport/transport.h"

namespace SsoClient::InternalApi {

/// Uses three parts, none of which may be null.
class GssNegotiationContextImpl final : public virtual GssNegotiationContext {
 public:
  /// `keyInfoResolver` may be null.
  GssNegotiationContextImpl(
      TokenSpec spec, std::shared_ptr<const RequestBuilder> requestBuilder,
      std::shared_ptr<const TransportSession> session,
      std::shared_ptr<const ResponseHandler> responseHandler,
      Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> keyInfoResolver);

  GssNegotiationResult Negotiate(const std::vector<unsigned char>& inputLeg) override;

 private:
  TokenSpec spec_;
  std::string contextId_;
  std::shared_ptr<const RequestBuilder> requestBuilder_;
  std::shared_ptr<const TransportSession> session_;
  std::shared_ptr<const ResponseHandler> responseHandler_;
  Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> keyInfoResolver_;
};

}  // namespace SsoClient::InternalApi

#endif
