#include "sts/security_token_service_impl.h"

#include <utility>

#include "describe/describe.h"
#include "sts/async_call.h"
#include "sts/logger.h"
#include "sts/negotiation_leg.h"
#include "support/clock_tolerance.h"
#include "support/secret_text.h"

namespace SsoClient {

namespace {

using TokenHandle = std::shared_ptr<const SamlToken>;

Tarnik::PrintFormatter Printed(const TokenSpec& spec) {
  return Describe(spec);
}

Tarnik::PrintFormatter Printed(const SamlToken& token) {
  return CreateSamlTokenDescription(token);
}

template <class Value>
Tarnik::PrintFormatter Printed(const Value& value) {
  return value;
}

// Formats the arguments only when the line is written.
template <class... Arguments>
void Log(int level, std::string_view format, const Arguments&... arguments) {
  if (kLogger.IsEnabled(level)) {
    Tarnik::Service::LogInternal(kLogger, level, format, {Printed(arguments)...});
  }
}

std::shared_ptr<const std::vector<unsigned char>> NextLeg(
    NegotiationHandler& handler, const std::vector<unsigned char>& serverLeg) {
  auto leg = handler.Negotiate(serverLeg);
  if (leg == nullptr) {
    throw Tarnik::InvalidArgumentException(
        "Invalid NegotiationHandler: the returned leg may not be NULL");
  }
  return leg;
}

// No mechanism takes more than a few legs. A service may go on answering with empty legs while the
// handler starts again each time, and then nothing else would end the loop.
constexpr int kMaxLegs = 1000;

void CountLeg(int& legs) {
  if (++legs > kMaxLegs) {
    throw CommunicationException("The service asks for more than " + std::to_string(kMaxLegs) +
                                 " legs of SPNEGO.");
  }
}

void CheckContextId(const NegotiationResponse& answer) {
  if (answer.contextId.empty()) {
    throw CommunicationException(
        "Error processing the response to SPNego token request: no Context ID was returned.");
  }
}

// The text says the opposite of its condition; readers of logs depend on it as it is.
void HandOverLastLeg(NegotiationHandler& handler, const std::vector<unsigned char>& serverLeg) {
  if (serverLeg.empty()) {
    return;
  }
  const auto leg = handler.Negotiate(serverLeg);
  if (leg == nullptr || leg->empty()) {
    Log(kWarningLevel, "GSS contract error: non-empty user leg after negotiation is complete");
  }
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

TokenHandle SecurityTokenServiceImpl::AcquireToken(const std::string& userName,
                                                   const std::string& password,
                                                   const TokenSpec& spec) const {
  const OperationLog operation("AcquireToken");
  Log(kTraceLevel, "Requested token for subject `%1', spec `%2'", userName, spec);
  SoapRequest request;
  requestBuilder_->BuildAcquireTokenRequest(userName, password, spec, request);
  Log(kTraceLevel, "SecurityTokenServiceImpl::AcquireToken sending request");
  const auto response = Send(request);
  Log(kTraceLevel, "SecurityTokenServiceImpl::AcquireToken processing response");
  return MakeIssuedToken(response.get());
}

TokenHandle SecurityTokenServiceImpl::AcquireTokenByGSS(const TokenSpec& spec,
                                                        NegotiationHandler& handler) const {
  const OperationLog operation("AcquireTokenByGSS");
  Log(kTraceLevel, "Requested token with spec `%1'", spec);
  const auto session = transport_->CreateSession();
  const NegotiationParts parts{*requestBuilder_, *session, *responseHandler_};
  NegotiationResponse answer;
  SecretText assertion;
  int legs = 0;
  do {
    CountLeg(legs);
    const auto leg = NextLeg(handler, answer.leg);
    answer = SendNegotiationLeg(parts, spec, answer.contextId, *leg);
    assertion.text.swap(answer.token);
    CheckContextId(answer);
  } while (assertion.text.empty());
  HandOverLastLeg(handler, answer.leg);
  return MakeToken(assertion.text);
}

TokenHandle SecurityTokenServiceImpl::AcquireTokenByCertificate(const TokenSpec& spec) const {
  const OperationLog operation("AcquireTokenByCertificate");
  Log(kTraceLevel, "Requested token with spec `%1'", spec);
  SoapRequest request;
  requestBuilder_->BuildAcquireTokenByCertificateRequest(spec, request);
  return MakeIssuedToken(Send(request).get());
}

TokenHandle SecurityTokenServiceImpl::AcquireTokenByToken(const SamlToken& token,
                                                          const TokenSpec& spec) const {
  const OperationLog operation("AcquireTokenByToken");
  Log(kTraceLevel, "Requested token for %1 with spec `%2'", token, spec);
  SoapRequest request;
  requestBuilder_->BuildAcquireTokenByTokenRequest(token, spec, request);
  return MakeIssuedToken(Send(request).get());
}

bool SecurityTokenServiceImpl::ValidateSubject(const SamlToken& token) const {
  const OperationLog operation("ValidateSubject");
  Log(kTraceLevel, "Validating subject of token %1", token);
  SoapRequest request;
  requestBuilder_->BuildValidateRequest(token, request);
  const bool isValid = responseHandler_->ParseValidateResponse(Send(request).get());
  Log(kTraceLevel, "Result: %1", isValid);
  return isValid;
}

TokenHandle SecurityTokenServiceImpl::RenewToken(const SamlToken& token,
                                                 std::int64_t lifetimeSec) const {
  const OperationLog operation("RenewToken");
  Log(kTraceLevel, "Renewing token %1 for %2 more seconds", token, lifetimeSec);
  SoapRequest request;
  requestBuilder_->BuildRenewRequest(token, lifetimeSec, request);
  SecretText assertion;
  responseHandler_->ParseRenewResponse(Send(request).get(), assertion.text);
  return MakeToken(assertion.text);
}

void SecurityTokenServiceImpl::AcquireTokenAsync(const std::string& userName,
                                                 const std::string& password, const TokenSpec& spec,
                                                 TokenCallback callback) const {
  // Shared, because a work item is copied: the password is then in memory only once, and is
  // cleansed with the last copy.
  SyncToAsyncCall<TokenHandle>(
      [service = Copy(), userName, secret = std::make_shared<const SecretText>(password), spec] {
        return service->AcquireToken(userName, secret->text, spec);
      },
      std::move(callback));
}

void SecurityTokenServiceImpl::AcquireTokenByGSSAsync(const TokenSpec& spec,
                                                      NegotiationHandler& handler,
                                                      TokenCallback callback) const {
  SyncToAsyncCall<TokenHandle>(
      [service = Copy(), spec, negotiating = PassByRefHelper(handler)] {
        return service->AcquireTokenByGSS(spec, negotiating.Get());
      },
      std::move(callback));
}

void SecurityTokenServiceImpl::AcquireTokenByCertificateAsync(const TokenSpec& spec,
                                                              TokenCallback callback) const {
  SyncToAsyncCall<TokenHandle>(
      [service = Copy(), spec] { return service->AcquireTokenByCertificate(spec); },
      std::move(callback));
}

void SecurityTokenServiceImpl::AcquireTokenByTokenAsync(const SamlToken& token,
                                                        const TokenSpec& spec,
                                                        TokenCallback callback) const {
  SyncToAsyncCall<TokenHandle>(
      [service = Copy(), presented = PassByRefHelper(token), spec] {
        return service->AcquireTokenByToken(presented.Get(), spec);
      },
      std::move(callback));
}

void SecurityTokenServiceImpl::ValidateSubjectAsync(const SamlToken& token,
                                                    ValidateCallback callback) const {
  SyncToAsyncCall<boost::optional<bool>>(
      [service = Copy(), presented = PassByRefHelper(token)] {
        return boost::optional<bool>(service->ValidateSubject(presented.Get()));
      },
      std::move(callback));
}

void SecurityTokenServiceImpl::RenewTokenAsync(const SamlToken& token, std::int64_t lifetimeSec,
                                               TokenCallback callback) const {
  SyncToAsyncCall<TokenHandle>(
      [service = Copy(), presented = PassByRefHelper(token), lifetimeSec] {
        return service->RenewToken(presented.Get(), lifetimeSec);
      },
      std::move(callback));
}

std::shared_ptr<const SecurityTokenServiceImpl> SecurityTokenServiceImpl::Copy() const {
  return std::make_shared<const SecurityTokenServiceImpl>(*this);
}

Tarnik::Ref<Tarnik::Reader> SecurityTokenServiceImpl::Send(const SoapRequest& request) const {
  Tarnik::Ref<Tarnik::Reader> response;
  const auto session = transport_->CreateSession();
  session->SendRequest(request, response);
  return response;
}

TokenHandle SecurityTokenServiceImpl::MakeIssuedToken(Tarnik::Reader* response) const {
  SecretText assertion;
  responseHandler_->ParseIssueResponse(response, assertion.text);
  return MakeToken(assertion.text);
}

TokenHandle SecurityTokenServiceImpl::MakeToken(const std::string& assertion) const {
  if (assertion.empty()) {
    return nullptr;
  }
  auto token = tokenFactory_->CreateToken(assertion, kDefaultClockToleranceSec);
  if (token != nullptr) {
    Log(kSuccessLevel, "Successfully acquired token: %1", *token);
  }
  return token;
}

}  // namespace SsoClient
