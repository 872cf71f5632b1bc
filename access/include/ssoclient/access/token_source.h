#ifndef SSOCLIENT_ACCESS_TOKEN_SOURCE_H
#define SSOCLIENT_ACCESS_TOKEN_SOURCE_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include <ssoclient/access/call_context.h>
#include <ssoclient/access/export.h>
#include <ssoclient/access/listener.h>
#include <ssoclient/access/login.h>
#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/ref.h>
#include <tarnik/ssl/ssl_context.h>

namespace SsoClient::Access {

/// One address of the security token service. All endpoints of a source accept the same logins and
/// issue tokens that the same factory accepts.
struct Endpoint {
  std::string url;  ///< http or https
  /// The name that the service's TLS certificate must have; the URL's host if empty.
  std::string sslPeerName;
};

/// When tokens are replaced.
struct RefreshConfig {
  /// The fraction of a token's lifetime after which a background refresh begins; between 0 and 1,
  /// both excluded.
  double fraction = 0.75;
  /// How far the moment is moved, once for each token and at random: at most this fraction of the
  /// lifetime earlier or later. At least 0, and less than both `fraction` and 1 - `fraction`.
  double jitter = 0.1;
  /// A token is handed out only while it has at least a twentieth of its lifetime left, limited to
  /// this. Not negative.
  std::chrono::seconds longestMargin{30};
};

/// How failed attempts are repeated. A refused login never is.
struct RetryConfig {
  /// Attempts of one call on all endpoints together; at least 1.
  int attempts = 4;
  /// The delay before attempt n is random between 0 and `firstDelay` * 2^(n-1), limited to
  /// `longestDelay` ("full jitter"). Of the same form are the times between the refreshes of a key
  /// while they fail, and those between the probes of an endpoint.
  std::chrono::milliseconds firstDelay{500};
  std::chrono::milliseconds longestDelay{std::chrono::minutes{1}};
  /// A longer `Retry-After` of the service counts as this.
  std::chrono::milliseconds longestRetryAfter{std::chrono::minutes{5}};
  /// Consecutive failures after which an endpoint is not asked until a probe succeeds; at least 1.
  int failuresToOpen = 3;
  /// How long a refused login is answered from memory, unless the secret changes.
  std::chrono::seconds refusalMemory{std::chrono::minutes{5}};
};

struct CacheConfig {
  /// Keys; at least 1. The key that was not asked for the longest is evicted first.
  std::size_t capacity = 1000;
};

struct TokenSourceConfig {
  /// At least one.
  std::vector<Endpoint> endpoints;
  /// The TLS trust and settings; may be null if all endpoints are http URLs.
  Tarnik::Ref<Tarnik::Ssl::SSLContext> sslContext;
  /// Creates verified tokens from the service's answers; must not be null.
  std::shared_ptr<SamlTokenFactory> tokenFactory;
  /// The key that tokens are bound to. `CertificateLogin` and `TokenLogin` need it.
  boost::optional<HolderOfKeyConfig> holderOfKey;
  Login login;
  RefreshConfig refresh;
  RetryConfig retry;
  CacheConfig cache;
  /// May be null.
  std::shared_ptr<AccessListener> listener;
};

/// Counters since the source was made. They are read one by one while others work, so that sums may
/// be off by what is under way.
struct TokenSourceMetrics {
  std::uint64_t hits = 0;
  std::uint64_t misses = 0;
  std::uint64_t shared = 0;
  std::uint64_t stale = 0;
  std::uint64_t refusedFromMemory = 0;
  std::uint64_t attempts = 0;
  std::uint64_t logins = 0;     ///< successful
  std::uint64_t renewals = 0;   ///< successful
  std::uint64_t exchanges = 0;  ///< successful
  std::uint64_t deviations = 0;
  /// Failed attempts by `FailureKind`, in the order of the enumeration.
  std::vector<std::uint64_t> failures;
  std::size_t keys = 0;            ///< in the cache now
  std::size_t callersWaiting = 0;  ///< now
};

/// Returns tokens that remain valid for a while, and keeps them fresh in the background. One source
/// has one login; its cache has a token for each distinct spec (every field counts; of an act-as
/// token, its text). Thread-safe.
///
/// Callers that need the same token share one request. It ends when the last of them has given up,
/// so that nothing is left running that nobody waits for. A failure of a request is the failure of
/// all callers that wait for it, and is not kept, except a refused login.
///
/// A token is replaced in the background when a part of its lifetime has passed (`RefreshConfig`):
/// it is renewed if it is renewable and bound to the key of this source, and otherwise, or when the
/// renewal fails, there is a new login. While that fails, the last token is served for as long as
/// it is valid. A token that was not asked for since its last refresh is dropped instead. The
/// lifetime that counts is the one that the service granted, not the one that was requested.
///
/// Requests go to the endpoint that answered last. When it fails in a way that no service has
/// decided (`IsUndecided`), the next one is asked; an endpoint that fails repeatedly is left out
/// until a probe succeeds (`RetryConfig`). A SOAP fault and a token that is not accepted are
/// decisions: no other endpoint is asked.
///
/// A refused login reaches one endpoint once. It is then answered from memory, with the same
/// exception class and message, until the secret changes or `RetryConfig::refusalMemory` has
/// passed.
///
/// A source may be used in a forked child, where it begins with an empty cache. When the process
/// ends, calls end as those of `SecurityTokenService` do. Destroying a source stops it.
///
/// The order of the operations is part of the binary interface.
class TokenSource {
 public:
  /// Receives a token and null, or null and the exception, which is valid only during the call.
  /// Called exactly once, on a worker thread of the platform's pool, where it may block. It must
  /// not throw: an exception that leaves it ends the process.
  using TokenCallback =
      std::function<void(const std::shared_ptr<const SamlToken>&, const Tarnik::Exception*)>;

  /// Returns a token for `spec`, from the cache if it contains one with enough life left. Never
  /// returns null.
  ///
  /// Throws, besides what the operations of `SecurityTokenService` throw,
  ///  - `Tarnik::InvalidArgumentException` when the deadline of `context` is in the past, when the
  ///    spec has a field that the login does not accept, and what the operation lists; nothing is
  ///    then sent;
  ///  - `CommunicationException` when the deadline passes, with what the call was waiting for, and
  ///    when every endpoint has failed, with the reason of each;
  ///  - `Tarnik::CancelledException` when the caller has cancelled;
  ///  - `Tarnik::InvalidStateException` after `Stop`;
  ///  - the exceptions of the login's functions.
  virtual std::shared_ptr<const SamlToken> GetToken(const TokenSpec& spec,
                                                    const CallContext& context = {}) = 0;
  /// Does the same without blocking, and reports to `callback` what `GetToken` returns or throws;
  /// an exception of the login that is not a `Tarnik::Exception` is reported as an
  /// `SsoException` with its text. Waiting does not occupy a thread.
  ///
  /// Itself throws only `Tarnik::InvalidArgumentException` when the callback is empty,
  /// `Tarnik::ResourceException` when there is no thread to report on, and `std::bad_alloc`; the
  /// callback then never runs.
  virtual void GetTokenAsync(const TokenSpec& spec, const CallContext& context,
                             TokenCallback callback) = 0;
  /// Removes `token` from the cache, since a service has refused it. Does nothing when the cache
  /// has a newer token for the same spec, so that many callers with the same refused token cause
  /// one request.
  virtual void Invalidate(const SamlToken& token) = 0;
  /// Counts and gauges. Does not block.
  virtual TokenSourceMetrics Metrics() const = 0;
  /// Ends all that is under way: waiting calls throw `Tarnik::InvalidStateException`, callbacks
  /// receive it, as does every later call. Returns within 100 ms, without waiting for functions of
  /// the login that are running. May be called several times.
  virtual void Stop() = 0;

 protected:
  ~TokenSource() = default;
};

/// Creates a source. Sends nothing. Throws `Tarnik::InvalidArgumentException` when there is no
/// endpoint, for a malformed URL, for an https URL without an SSL context, when the token factory
/// is null, for a login whose functions are empty or that lacks the holder-of-key configuration
/// that it needs, for an unusable holder-of-key configuration (see `CreateSecurityTokenService`),
/// and for a number that is outside its range.
SSOCLIENT_ACCESS_EXPORT std::shared_ptr<TokenSource> CreateTokenSource(TokenSourceConfig config);

}  // namespace SsoClient::Access

#endif
