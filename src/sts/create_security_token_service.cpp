#include <memory>
#include <utility>

#include <ssoclient/security_token_service.h>
#include <tarnik/core/exception.h>

#include "sts/holder_of_key_check.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "sts/security_token_service_impl.h"
#include "transport/https_client.h"

namespace SsoClient {

namespace {

constexpr unsigned long kTimeoutMicroseconds = 240'000'000;

std::shared_ptr<SecurityTokenService> CreateService(
    const boost::optional<HolderOfKeyConfig>& holderOfKeyConfig,
    std::shared_ptr<const Transport> transport,
    const std::shared_ptr<SamlTokenFactory>& tokenFactory) {
  return std::make_shared<SecurityTokenServiceImpl>(
      std::make_shared<RequestBuilderImpl>(holderOfKeyConfig), std::move(transport),
      std::make_shared<ResponseHandlerImpl>(), tokenFactory);
}

void CheckTokenFactory(const std::shared_ptr<SamlTokenFactory>& tokenFactory) {
  if (tokenFactory == nullptr) {
    throw Tarnik::InvalidArgumentException("The token factory must not be null.");
  }
}

}  // namespace

std::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfig& config) {
  CheckTokenFactory(config.tokenFactory);
  CheckHolderOfKeyConfig(config.holderOfKeyConfig);
  return CreateService(
      config.holderOfKeyConfig,
      std::make_shared<HttpsClient>(config.url, config.sslContext, config.sslPeerName,
                                    kTimeoutMicroseconds, config.flag),
      config.tokenFactory);
}

std::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfigEx& config) {
  CheckTokenFactory(config.tokenFactory);
  CheckHolderOfKeyConfig(config.holderOfKeyConfig);
  return CreateService(
      config.holderOfKeyConfig,
      std::make_shared<HttpsClient>(config.userAgent.get(), config.url, kTimeoutMicroseconds),
      config.tokenFactory);
}

}  // namespace SsoClient
