#include "sts/security_token_service_impl.h"

#include <utility>

#include "describe/describe.h"
#include "sts/logger.h"
#include "sts/secret_text.h"
#include "sts/sync_to_async_call.h"

namespace SsoClient {

namespace {

constexpr long kClockToleranceSec = 600;

void LogRequest(const std::string& userName, const TokenSpec& spec) {
  if (!kLogger.IsEnabled(kTraceLevel)) {
    return;
  }
  Tarnik::Service::LogInternal(kLogger, kTraceLevel, "Requested token for subject `%1', spec `%2'",
                               {userName, Describe(spec)});
}

void LogToken(const SamlToken& token) {
  if (!kLogger.IsEnabled(kSuccessLevel)) {
    return;
  }
  Tarnik::Service::LogInternal(kLogger, kSuccessLevel, "Successfully acquired token: %1",
                               {CreateSamlTokenDescription(token)});
}

}  // namespace

SecurityTokenServiceImpl::SecurityTokenServiceImpl(
    std::shared_ptr<const RequestBuilder> requestBuilder,
    std::shared_ptr<const Transport> transport,
    std::shared_ptr<const ResponseHandler> responseHandler,
    std::shared_ptr<SamlTokenFactory> tokenFactory)
    : requestBuilder_(std::move(requestBuilder)),
      transport_(std::move(transport)),
      responseHandler_(std::move(responseHandler)),
      tokenFactory_(std::move(tokenFactory)) {}

std::shared_ptr<const SamlToken> SecurityTokenServiceImpl::AcquireToken(
    const std::string& userName, const std::string& password, const TokenSpec& spec) const {
  const OperationLog operation("AcquireToken");
  LogRequest(userName, spec);
  SoapRequest request;
  requestBuilder_->BuildAcquireTokenRequest(userName, password, spec, request);
  Tarnik::Service::LogInternal(kLogger, kTraceLevel,
                               "SecurityTokenServiceImpl::AcquireToken sending request", {});
  Tarnik::Ref<Tarnik::Reader> response;
  const auto session = transport_->CreateSession();
  session->SendRequest(request, response);
  Tarnik::Service::LogInternal(kLogger, kTraceLevel,
                               "SecurityTokenServiceImpl::AcquireToken processing response", {});
  SecretText assertion;
  responseHandler_->ParseIssueResponse(response.get(), assertion.text);
  return MakeToken(assertion.text);
}

void SecurityTokenServiceImpl::AcquireTokenAsync(const std::string& userName,
                                                 const std::string& password, const TokenSpec& spec,
                                                 TokenCallback callback) const {
  // Shared, since a work item is copied about: the password then stands in memory only once, and is
  // cleansed with the last copy.
  auto secret = std::make_shared<const SecretText>(password);
  auto service = std::make_shared<const SecurityTokenServiceImpl>(*this);
  SyncToAsyncCall<std::shared_ptr<const SamlToken>>(
      [service = std::move(service), userName, secret = std::move(secret), spec] {
        return service->AcquireToken(userName, secret->text, spec);
      },
      std::move(callback));
}

std::shared_ptr<const SamlToken> SecurityTokenServiceImpl::MakeToken(
    const std::string& assertion) const {
  if (assertion.empty()) {
    return nullptr;
  }
  auto token = tokenFactory_->CreateToken(assertion, kClockToleranceSec);
  if (token != nullptr) {
    LogToken(*token);
  }
  return token;
}

}  // namespace SsoClient
