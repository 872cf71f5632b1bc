#include <memory>

#include <ssoclient/gss_negotiation_context.h>

#include "sts/holder_of_key_check.h"
#include "sts/internal/gss_negotiation_context_impl.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "transport/https_client.h"

namespace SsoClient::InternalApi {

namespace {

// A leg is expected to be quicker than a whole operation.
constexpr unsigned long kTimeoutMicroseconds = 40'000'000;

}  // namespace

std::shared_ptr<GssNegotiationContext> CreateGssNegotiationContext(
    const SecurityTokenServiceConfig& config, const TokenSpec& spec) {
  CheckHolderOfKeyConfig(config.holderOfKeyConfig);
  const auto requestBuilder = std::make_shared<RequestBuilderImpl>(config.holderOfKeyConfig);
  const HttpsClient client(config.url, config.sslContext, config.sslPeerName, kTimeoutMicroseconds,
                           false);
  const auto responseHandler = std::make_shared<ResponseHandlerImpl>();
  return std::make_shared<GssNegotiationContextImpl>(
      spec, requestBuilder, client.CreateSession(), responseHandler,
      Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver>(config.keyInfoResolver));
}

}  // namespace SsoClient::InternalApi
