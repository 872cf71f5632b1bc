#include "config_check.h"

#include <algorithm>
#include <string>
#include <variant>
#include <vector>

#include <tarnik/http/http_url.h>
#include <tarnik/xml/character_nodes.h>

#include "instant.h"
#include "require.h"

namespace SsoClient::Access {

namespace {

constexpr std::chrono::milliseconds kLongestAttempt = std::chrono::seconds(240);

struct LoginCheck {
  const TokenSourceConfig& config;

  void operator()(const PasswordLogin& login) const {
    Require(login.password != nullptr, "The function for the password is not set.");
  }
  void operator()(const CertificateLogin&) const {
    Require(config.holderOfKey.has_value(),
            "The login by certificate needs a holder-of-key configuration.");
  }
  void operator()(const NegotiatedLogin& login) const {
    Require(login.createHandler != nullptr, "The function for negotiation handlers is not set.");
  }
  void operator()(const TokenLogin& login) const {
    Require(login.source != nullptr, "The source of the token to exchange is null.");
    Require(config.holderOfKey.has_value(),
            "The login by token needs a holder-of-key configuration.");
    Require(login.spec.tokenLifetimeSec > 0,
            "The lifetime of the token to exchange is not positive.");
  }
};

void CheckRefresh(const RefreshConfig& refresh) {
  // Written so that a value that is not a number is refused.
  Require(refresh.fraction > 0 && refresh.fraction < 1,
          "The fraction of the lifetime after which tokens are refreshed is not between 0 and 1.");
  Require(refresh.jitter >= 0 && refresh.jitter <= 1,
          "The jitter of refreshes is not between 0 and 1.");
  Require(refresh.longestMargin >= std::chrono::seconds(0),
          "The longest margin of a token is negative.");
}

void CheckRetry(const RetryConfig& retry) {
  constexpr std::chrono::milliseconds kNone{0};
  Require(retry.attempts >= 1, "The number of attempts is not positive.");
  Require(retry.attemptsAtOnce >= 1, "The number of attempts at once is not positive.");
  Require(retry.attemptTimeout > kNone && retry.attemptTimeout <= kLongestAttempt,
          "The limit of an attempt is not between 1 ms and 240 s.");
  Require(retry.firstDelay > kNone && retry.longestDelay > kNone,
          "A delay between attempts is not positive.");
  Require(retry.longestRetryAfter >= kNone, "The longest Retry-After is negative.");
  Require(retry.failuresToOpen >= 1,
          "The number of failures after which an endpoint is left out is not positive.");
  Require(retry.refusalMemory >= std::chrono::seconds(0),
          "The time for which a refused login is remembered is negative.");
}

bool IsHttps(const Endpoint& endpoint) {
  bool isHttps = false;
  std::string host;
  int port = 0;
  std::string path;
  Tarnik::Http::ParseHttpURL(endpoint.url, isHttps, host, port, path);
  return isHttps;
}

// Otherwise a peer that is not trusted would cause a failover to plain text.
void CheckSchemes(const std::vector<Endpoint>& endpoints) {
  const bool isHttps = IsHttps(endpoints.front());
  for (const Endpoint& endpoint : endpoints) {
    Require(IsHttps(endpoint) == isHttps,
            "Some endpoints are https URLs and others http URLs: a failure of TLS would send the "
            "login in plain text.");
  }
}

template <class Duration>
void Limit(Duration& duration) noexcept {
  duration = std::min(duration, std::chrono::duration_cast<Duration>(kLongestDuration));
}

}  // namespace

void CheckConfig(const TokenSourceConfig& config) {
  Require(!config.endpoints.empty(), "There is no endpoint.");
  Require(config.tokenFactory != nullptr, "The token factory is null.");
  std::visit(LoginCheck{config}, config.login);
  CheckRefresh(config.refresh);
  CheckRetry(config.retry);
  Require(config.cache.capacity >= 1, "The capacity of the cache is 0.");
  Require(config.keepFresh.size() <= config.cache.capacity,
          "More tokens are to be kept fresh than the cache has room for.");
  for (const TokenSpec& spec : config.keepFresh) {
    CheckSpec(spec, config.login);
    CheckTexts(spec);
  }
  CheckSchemes(config.endpoints);
}

void LimitDurations(TokenSourceConfig& config) noexcept {
  Limit(config.refresh.longestMargin);
  Limit(config.retry.firstDelay);
  Limit(config.retry.longestDelay);
  Limit(config.retry.longestRetryAfter);
  Limit(config.retry.refusalMemory);
}

void CheckTexts(const TokenSpec& spec) {
  Tarnik::Ref<Tarnik::Xml::TextNode> node;
  Tarnik::Xml::CreateTextNode(node);
  for (const std::string& audience : spec.audienceRestriction) {
    node->SetText(audience);
  }
  if (spec.delegateTo) {
    node->SetText(*spec.delegateTo);
  }
  for (const Advice& advice : spec.advice) {
    node->SetText(advice.source);
    for (const AdviceAttribute& attribute : advice.attributes) {
      node->SetText(attribute.name);
      for (const std::string& value : attribute.values) {
        node->SetText(value);
      }
    }
  }
}

void CheckSpec(const TokenSpec& spec, const Login& login) {
  Require(spec.tokenLifetimeSec > 0, "The lifetime of the token is not positive.");
  Require(!spec.actAsToken || *spec.actAsToken != nullptr, "The act-as token is null.");
  Require(
      spec.confirmation == CONFIRMATION_DEFAULT || !std::holds_alternative<CertificateLogin>(login),
      "A login by certificate cannot request a bearer token.");
}

}  // namespace SsoClient::Access
