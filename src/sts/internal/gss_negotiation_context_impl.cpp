#include "sts/internal/gss_negotiation_context_impl.h"

#include <utility>

#include "sts/holder_of_key_check.h"
#include "sts/negotiation_leg.h"
#include "support/secret_text.h"
#include "transport/https_client.h"

namespace SsoClient::InternalApi {

namespace {

// A leg should take less time than a whole operation.
constexpr unsigned long kTimeoutMicroseconds = 40'000'000;

}  // namespace

GssNegotiationContextImpl::GssNegotiationContextImpl(
    TokenSpec spec, std::shared_ptr<const RequestBuilder> requestBuilder,
    std::shared_ptr<const TransportSession> session,
    std::shared_ptr<const ResponseHandler> responseHandler,
    Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> keyInfoResolver)
    : spec_(std::move(spec)),
      requestBuilder_(std::move(requestBuilder)),
      session_(std::move(session)),
      responseHandler_(std::move(responseHandler)),
      keyInfoResolver_(std::move(keyInfoResolver)) {}

GssNegotiationResult GssNegotiationContextImpl::Negotiate(
    const std::vector<unsigned char>& inputLeg) {
  NegotiationResponse answer = SendNegotiationLeg({*requestBuilder_, *session_, *responseHandler_},
                                                  spec_, contextId_, inputLeg);
  SecretText assertion;
  assertion.text.swap(answer.token);
  contextId_.swap(answer.contextId);
  GssNegotiationResult result;
  result.outputLeg = std::make_shared<std::vector<unsigned char>>(std::move(answer.leg));
  if (!assertion.text.empty()) {
    result.token = CreateSamlToken(assertion.text, keyInfoResolver_.get());
  }
  return result;
}

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
