#include <chrono>
#include <memory>
#include <new>
#include <string>
#include <utility>
#include <variant>

#include <ssoclient/security_token_service.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_url.h>
#include <tarnik/http/http_user_agent.h>

#include "attempt.h"
#include "attempts/attempt_failure.h"
#include "attempts/deviations.h"
#include "attempts/exchange_observer.h"
#include "attempts/part_observers.h"
#include "secret_text.h"

namespace SsoClient::Access {

namespace {

using Token = std::shared_ptr<const SamlToken>;

/// Where the requests of an endpoint go.
struct Target {
  std::string path;
  Tarnik::Ref<Tarnik::Http::ConnectionSpec> connections;
};

Target ResolveTarget(const Endpoint& endpoint, Tarnik::Ssl::SSLContext* sslContext) {
  Target target;
  bool isHttps = false;
  std::string host;
  int port = 0;
  Tarnik::Http::ParseHttpURL(endpoint.url, isHttps, host, port, target.path);
  if (!isHttps) {
    target.connections = Tarnik::Http::CreateTCPConnectionSpec(host, port);
    return target;
  }
  if (sslContext == nullptr) {
    throw Tarnik::InvalidArgumentException("The https endpoint " + endpoint.url +
                                           " needs an SSL context.");
  }
  target.connections =
      Tarnik::Http::CreateTLSConnectionSpec(host, port, sslContext, endpoint.sslPeerName);
  return target;
}

/// One attempt: its parts, and what they have seen. Used by one thread.
struct Attempting {
  explicit Attempting(const std::shared_ptr<SamlTokenFactory>& inner)
      : factory(std::make_shared<ObservingTokenFactory>(inner)) {}

  Observation seen;
  const std::shared_ptr<ObservingTokenFactory> factory;
  bool hasLoginFailed = false;
};

class EndpointClientImpl final : public EndpointClient {
 public:
  EndpointClientImpl(std::shared_ptr<const TokenSourceConfig> config, Endpoint endpoint)
      : endpoint_(std::move(endpoint)),
        target_(ResolveTarget(endpoint_, config->sslContext.get())),
        pool_(Tarnik::Http::CreateConnectionPool()),
        config_(std::move(config)) {
    // Checks what all attempts have in common.
    CreateSecurityTokenService(ServiceConfig(Agent(), config_->tokenFactory));
  }

  const Endpoint& Where() const override { return endpoint_; }

  AttemptOutcome Attempt(const AttemptRequest& request, Tarnik::Http::CallLimit& limit) override {
    const auto begun = std::chrono::steady_clock::now();
    Attempting attempting(config_->tokenFactory);
    AttemptOutcome outcome;
    try {
      outcome.token = Perform(request, limit, attempting);
      if (outcome.token == nullptr) {
        throw SsoException("The token factory has created no token.");
      }
      const auto now = std::chrono::steady_clock::now();
      outcome.deviations = Compare(request, *outcome.token, attempting.seen,
                                   std::chrono::ceil<std::chrono::milliseconds>(now - begun));
      for (DeviationRecord& deviation : outcome.deviations) {
        // The other fields are not the service's own text.
        if (deviation.field == "subject" || deviation.field == "audiences") {
          deviation.issued = HideSecret(std::move(deviation.issued), request.secret);
        }
      }
    } catch (const std::bad_alloc&) {
      throw;
    } catch (...) {
      outcome.token = nullptr;
      SetFailure(outcome, std::current_exception(),
                 {attempting.seen, limit, attempting.factory->Failure(), attempting.hasLoginFailed,
                  request.secret});
    }
    outcome.httpStatus = attempting.seen.httpStatus;
    outcome.retryAfter = attempting.seen.retryAfter;
    if (attempting.seen.clock) {
      outcome.clockOffset = attempting.seen.clock->offset;
    }
    return outcome;
  }

 private:
  // With cookies of its own, and with the connections that all agents of this client keep.
  Tarnik::Ref<Tarnik::Http::UserAgent> Agent() const {
    const auto cookies = Tarnik::Http::CreateCookieStore("");
    return Tarnik::Http::CreateHttpUserAgent(target_.connections.get(), cookies.get(), pool_.get());
  }

  SecurityTokenServiceConfigEx ServiceConfig(const Tarnik::Ref<Tarnik::Http::UserAgent>& agent,
                                             std::shared_ptr<SamlTokenFactory> factory) const {
    SecurityTokenServiceConfigEx config;
    config.url = target_.path;
    config.userAgent = agent;
    config.tokenFactory = std::move(factory);
    config.holderOfKeyConfig = config_->holderOfKey;
    return config;
  }

  Token Perform(const AttemptRequest& request, Tarnik::Http::CallLimit& limit,
                Attempting& attempting) const {
    const auto observing = CreateObservingUserAgent(Agent().get(), attempting.seen);
    const auto bounded = Tarnik::Http::CreateBoundedUserAgent(observing.get(), &limit);
    const auto service = CreateSecurityTokenService(ServiceConfig(bounded, attempting.factory));
    switch (request.operation) {
      case AttemptOperation::kRenewal:
        return service->RenewToken(*request.base, request.spec.tokenLifetimeSec);
      case AttemptOperation::kExchange:
        return service->AcquireTokenByToken(*request.base, request.spec);
      case AttemptOperation::kLogin:
        break;
    }
    return LogIn(*service, request, attempting);
  }

  Token LogIn(const SecurityTokenService& service, const AttemptRequest& request,
              Attempting& attempting) const {
    if (const auto* password = std::get_if<PasswordLogin>(&config_->login)) {
      return service.AcquireToken(password->userName, request.secret, request.spec);
    }
    if (std::holds_alternative<CertificateLogin>(config_->login)) {
      return service.AcquireTokenByCertificate(request.spec);
    }
    if (const auto* negotiated = std::get_if<NegotiatedLogin>(&config_->login)) {
      return Negotiate(service, *negotiated, request.spec, attempting);
    }
    throw Tarnik::InvalidStateException("A login by token exchanges a token.");
  }

  Token Negotiate(const SecurityTokenService& service, const NegotiatedLogin& login,
                  const TokenSpec& spec, Attempting& attempting) const {
    attempting.hasLoginFailed = true;
    const auto handler = login.createHandler(endpoint_);
    if (handler == nullptr) {
      throw Tarnik::InvalidArgumentException("The login's function has returned no handler.");
    }
    ObservingNegotiationHandler observed(*handler);
    try {
      auto token = service.AcquireTokenByGSS(spec, observed);
      attempting.hasLoginFailed = false;
      return token;
    } catch (...) {
      attempting.hasLoginFailed = observed.HasFailed();
      throw;
    }
  }

  std::vector<DeviationRecord> Compare(const AttemptRequest& request, const SamlToken& token,
                                       const Observation& seen,
                                       std::chrono::milliseconds duration) const {
    const RequestedToken requested{request.spec, RequestedSubject(request), RequestedKey(request)};
    const auto now =
        std::chrono::floor<std::chrono::milliseconds>(std::chrono::system_clock::now());
    const auto offset = seen.clock ? seen.clock->offset : std::chrono::milliseconds(0);
    return FindDeviations(requested, token, {now + offset, duration});
  }

  boost::optional<PrincipalId> RequestedSubject(const AttemptRequest& request) const {
    if (request.operation != AttemptOperation::kRenewal && request.spec.actAsToken) {
      return (*request.spec.actAsToken)->Subject();
    }
    if (request.base != nullptr) {
      return request.base->Subject();
    }
    const auto* password = std::get_if<PasswordLogin>(&config_->login);
    return password == nullptr ? boost::none : SubjectOf(password->userName);
  }

  const HolderOfKeyConfig* RequestedKey(const AttemptRequest& request) const noexcept {
    // A login with an act-as token proves possession of no key.
    const bool isUnsigned =
        request.operation == AttemptOperation::kLogin && request.spec.actAsToken;
    const bool asksForKey = request.operation == AttemptOperation::kRenewal ||
                            (request.spec.confirmation == CONFIRMATION_DEFAULT && !isUnsigned);
    return asksForKey ? config_->holderOfKey.get_ptr() : nullptr;
  }

  const Endpoint endpoint_;
  const Target target_;
  const Tarnik::Ref<Tarnik::Http::ConnectionPool> pool_;
  /// All endpoints of a source use the same functions of the login, not copies of them.
  const std::shared_ptr<const TokenSourceConfig> config_;
};

}  // namespace

std::unique_ptr<EndpointClient> CreateEndpointClient(
    const std::shared_ptr<const TokenSourceConfig>& config, const Endpoint& endpoint) {
  return std::make_unique<EndpointClientImpl>(config, endpoint);
}

}  // namespace SsoClient::Access
