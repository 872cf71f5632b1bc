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
#include <ssoclient/access/endpoint.h>
#include <ssoclient/access/export.h>
#include <ssoclient/access/listener.h>
#include <ssoclient/access/login.h>
#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/ref.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/system/date_time.h>

namespace SsoClient::Access {

// Durations of the configuration that are longer than thirty years count as thirty years.

/// When tokens are replaced.
struct RefreshConfig {
  /// The fraction of a token's lifetime after which a background refresh begins; between 0 and 1,
  /// both excluded.
  double fraction = 0.75;
  /// How far that moment is moved at random, once for each token: by at most this fraction of the
  /// lifetime, earlier or later. Between 0 and 1; what would leave the lifetime is cut off, and
  /// what would be before a tenth of it, or before `fraction` if that is less, is put off until
  /// then.
  double jitter = 0.1;
  /// A token is handed out only while it has at least a twentieth of its lifetime left, limited to
  /// this. Not negative.
  std::chrono::seconds longestMargin{30};
};

/// How attempts are limited and repeated. A refused login is never repeated.
struct RetryConfig {
  /// How many attempts of one request may end without a decision of a service (`AllowsFailover`),
  /// at all endpoints together; at least 1. Each endpoint is asked once without delay; then there
  /// is a pause before each further round. A background refresh that no caller waits for asks each
  /// endpoint once at most. What a service has decided is extra: a refused renewal that a login
  /// follows, and a refused exchange that is repeated with another token (see `TokenSource`). After
  /// a renewal that no endpoint has answered, the login has the full number again.
  int attempts = 4;
  /// The attempts of the source that are under way at once; at least 1. Each endpoint has an equal
  /// share of them, and at least one, so that an endpoint that does not answer leaves room for the
  /// others. As many calls of the login's function run at once, but at most two logins by password
  /// (see `TokenSource`). Each occupies a worker thread of the platform's pool, which has 256 for
  /// all sources of the process. Further requests ask another endpoint if they may, or else wait
  /// for their turn without a thread, first come first served.
  int attemptsAtOnce = 64;
  /// The limit of one attempt, from the look-up of the host to the last byte of the answer (of the
  /// last leg, for a negotiation). At most 240 seconds, the limit of the client. A refresh takes at
  /// most half of the time for which the token is still handed out, but at least a second. The
  /// default leaves callers that wait for ten seconds time to ask another endpoint.
  std::chrono::milliseconds attemptTimeout{std::chrono::seconds{8}};
  /// The pause before round n is random between half of and all of `firstDelay` * 2^(n-2), limited
  /// to `longestDelay`; both are positive. The pauses between the refreshes of a key while they
  /// fail, and between the probes of an endpoint, grow in the same way; the background requests for
  /// one key are at least a second apart, whatever these values and the lifetimes of its tokens
  /// are. So with the defaults, after the first minute of an outage, an endpoint that is down
  /// receives at most 120 requests an hour from the source, and 80 on average, whatever the number
  /// of keys and of callers; and a service that refuses the refreshes of a key receives at most 120
  /// for it. Callers that wait for less than an attempt of an endpoint takes to fail are not
  /// limited in this way.
  std::chrono::milliseconds firstDelay{500};
  std::chrono::milliseconds longestDelay{std::chrono::minutes{1}};  ///< the limit of these pauses
  /// A longer `Retry-After` of an endpoint counts as this. Until then it is left out, and others
  /// are asked.
  std::chrono::milliseconds longestRetryAfter{std::chrono::minutes{5}};
  /// Consecutive failures after which an endpoint is left out until a probe succeeds; at least 1.
  /// Attempts that are cancelled do not count, nor does an HTTP status in answer to a renewal; but
  /// when the deadlines of all callers have passed in one, the next request begins at another
  /// endpoint.
  int failuresToOpen = 3;
  /// How long a refused login is answered from memory, unless the secret changes. Only passwords
  /// can change: logins by certificate and negotiations are refused for this time, also after
  /// `kinit` or after the service has learnt a certificate. A new source remembers none.
  std::chrono::seconds refusalMemory{std::chrono::minutes{5}};
};

/// The tokens that a source keeps.
struct CacheConfig {
  /// The number of tokens kept; at least 1. The one that was not asked for the longest is evicted
  /// first. If tokens that are kept fresh fill the cache, it has room for one more.
  std::size_t capacity = 1000;
};

/// Where and how a source obtains tokens, and what it reports.
struct TokenSourceConfig {
  /// Names the source in records and log lines; may be empty.
  std::string name{};
  /// At least one. All are https URLs, or all are http URLs. All accept the same logins and issue
  /// tokens that `tokenFactory` accepts. The order is that of preference. Sources with the same
  /// order all use the first one while it answers; many servers that are to share equal endpoints
  /// list them in different orders.
  std::vector<Endpoint> endpoints{};
  /// The TLS trust and settings; may be null if all endpoints are http URLs.
  Tarnik::Ref<Tarnik::Ssl::SSLContext> sslContext{};
  /// Creates verified tokens from the service's answers; must not be null.
  std::shared_ptr<SamlTokenFactory> tokenFactory{};
  /// The key that tokens are bound to. `CertificateLogin` and `TokenLogin` need it.
  boost::optional<HolderOfKeyConfig> holderOfKey{};
  /// How the source logs in.
  Login login{};
  /// When tokens are replaced.
  RefreshConfig refresh{};
  /// How often and how fast requests are repeated.
  RetryConfig retry{};
  /// How many tokens are kept.
  CacheConfig cache{};
  /// Tokens that the source requests when it is created and keeps fresh although nobody asks for
  /// them, so that the first call does not wait. Failures are reported to the listener. At most
  /// `cache.capacity`; these tokens are not evicted.
  std::vector<TokenSpec> keepFresh{};
  /// May be null.
  std::shared_ptr<AccessListener> listener{};
};

/// Counters since the source was made, and gauges. They are read one by one while others work, so
/// that sums may be off by what is under way.
struct TokenSourceMetrics {
  std::uint64_t hits = 0;               ///< answered from the cache
  std::uint64_t misses = 0;             ///< began a request
  std::uint64_t shared = 0;             ///< waited for the request of another caller
  std::uint64_t refusedFromMemory = 0;  ///< answered with a refusal from memory: each caller, and
                                        ///< each refresh that no caller waited for
  std::uint64_t evictions = 0;          ///< for lack of space
  std::uint64_t logins = 0;             ///< successful
  std::uint64_t renewals = 0;           ///< successful
  std::uint64_t exchanges = 0;          ///< successful
  std::uint64_t refreshFailures = 0;    ///< reported by `AccessListener::OnRefreshFailed`
  std::uint64_t deviations = 0;         ///< reported by `AccessListener::OnDeviation`
  /// Attempts by `FailureKind`, in the order of the enumeration; the first element is the number of
  /// those that succeeded.
  std::vector<std::uint64_t> attempts{};
  std::size_t keys = 0;            ///< in the cache now
  std::size_t callersWaiting = 0;  ///< now
  /// The earliest end of a token in the cache; none for an empty cache.
  boost::optional<Tarnik::System::DateTime> earliestExpiration{};
};

/// Returns tokens that remain valid for a while, and keeps them fresh in the background. One source
/// has one login; its cache has a token for each distinct spec (every field counts; of an act-as
/// token, its text). Thread-safe.
///
/// Callers that need the same token share one request, which has its own limits (`RetryConfig`).
/// It ends when the last of them has given up, so that nothing is left running that nobody waits
/// for, except a login with a password that may be wrong (see below); name tokens that callers with
/// short deadlines need in `TokenSourceConfig::keepFresh`. A failure of a request is the failure of
/// all callers that wait for it, and is not kept, except a refused login.
///
/// A token is replaced in the background when a part of its lifetime has passed (`RefreshConfig`):
/// it is renewed if it is renewable and bound to the key of this source, and otherwise, or when the
/// renewal is refused or each endpoint has failed to answer it, there is a new login. While that
/// fails, the last token is served for as long as it has its margin. A new token replaces only one
/// that ends earlier or is not handed out any longer. A token that was not asked for since its last
/// refresh is not refreshed, and leaves the cache at its end. The lifetime that counts is the one
/// that the service granted, by the service's clock.
///
/// Requests go to the endpoint that answered last and has not failed since. When it fails in a way
/// that no service has decided (`AllowsFailover`), the next one is asked; an endpoint that fails
/// repeatedly is left out until a probe succeeds. When all are left out, a call fails at once, with
/// the reason of each. A SOAP fault and a token that is not accepted are decisions: no other
/// endpoint is asked. The first attempt to refresh a token begins at the first endpoint of the list
/// that is not left out, unless a caller waits or the token would not outlast the attempt
/// (`RetryConfig::attemptTimeout`): so a source returns to its first endpoint after a failure, and
/// callers do not wait for that.
///
/// A refused login reaches one endpoint once, however many callers and specs there are: until a
/// login has succeeded with a secret, only one is under way, and again when the last success was
/// more than ten seconds ago. Within these ten seconds two passwords are under way at most (other
/// logins: as many as `RetryConfig::attemptsAtOnce`), so that a password that was changed at the
/// service meanwhile is refused twice at most. The refusal is then answered from memory, with the
/// same exception class and message, until the secret changes or `RetryConfig::refusalMemory` has
/// passed.
///
/// A password that was sent without a success in the last ten seconds is not abandoned: when all
/// callers have left, they receive their exceptions at once, but the attempt goes on to its own
/// limit (`RetryConfig::attemptTimeout`) or to `Stop`, so that its verdict is known. Until then,
/// other logins with the password wait. When it ends without a verdict, there is a pause before the
/// next one that grows as the pauses between the refreshes of a key do.
///
/// When an exchange is refused, the token to exchange is replaced, if it has been known for 30
/// seconds or is the first one, and the exchange is repeated once. The last refusal is remembered
/// in the same way, but only for its spec, as is the refusal of a login for a spec with an act-as
/// token, unless the fault's code is `FailedAuthentication`. At most `CacheConfig::capacity` such
/// refusals are remembered. Sources do not share what they know of refusals, not with
/// those of other processes either: each of several sources with one account, and each child that
/// was forked before, sends a wrong login once.
///
/// A source may be used in a forked child, where it begins with an empty cache. When the process
/// ends, calls end as those of `SecurityTokenService` do. Destroying a source stops it; the last
/// reference may be released anywhere, in a callback too. When it is released elsewhere after
/// `Stop` has returned true, nothing of the configuration is left, so that the plug-in whose
/// functions it contained may be unloaded.
///
/// A program may implement this class itself, for its tests for example. The order of the
/// operations is part of the binary interface, and later versions add none.
class SSOCLIENT_ACCESS_EXPORT TokenSource {
 public:
  /// Receives a token and null, or null and the exception, which is valid only during the call.
  /// Called exactly once, on a worker thread of the platform's pool, where it may block. Only when
  /// no worker can be started is it called on another thread of the platform, or on one that
  /// cancels, stops or calls the source, but never in its own call of `GetTokenAsync`. It must not
  /// throw: an exception that leaves it ends the process. While it waits, for `GetToken` for
  /// example, it occupies a worker that requests need: if as many callbacks as the pool has workers
  /// wait for tokens, they wait until their deadlines. Use `GetTokenAsync` in callbacks.
  using TokenCallback =
      std::function<void(const std::shared_ptr<const SamlToken>&, const Tarnik::Exception*)>;

  virtual ~TokenSource();

  /// Returns a token for `spec`, from the cache if it contains one with enough life left. Never
  /// returns null.
  ///
  /// Throws, besides what the operations of `SecurityTokenService` throw,
  ///  - `Tarnik::InvalidArgumentException` when the deadline of `context` is in the past, or when
  ///    the request that the spec describes cannot be sent; nothing is then sent;
  ///  - `CommunicationException` when the deadline passes, with what the call was waiting for;
  ///  - when the endpoints have failed: the exception of the client, if there is one endpoint; of
  ///    several, one exception with the reason of each, which is a `CommunicationException` if the
  ///    last failure was one, and otherwise an `SsoException`, as after an HTTP status 500 without
  ///    a fault;
  ///  - `SsoException` when the service grants less than `CallContext::minimumLife`, or issues a
  ///    token that has ended;
  ///  - `Tarnik::CancelledException` when the caller has cancelled;
  ///  - `Tarnik::InvalidStateException` after `Stop`;
  ///  - the exceptions of the login's functions.
  virtual std::shared_ptr<const SamlToken> GetToken(const TokenSpec& spec,
                                                    const CallContext& context = {}) = 0;
  /// Returns the token that `GetToken` would return from the cache, and null if it would have to
  /// wait. Sends nothing, and never blocks. Refreshes are timed by a clock that stops while the
  /// machine is suspended: a token that has ended meanwhile is replaced by the next `GetToken`, or
  /// when its refresh is due. Throws `Tarnik::InvalidStateException` after `Stop`,
  /// and `Tarnik::InvalidArgumentException` for a spec that cannot be sent.
  virtual std::shared_ptr<const SamlToken> TryGetToken(const TokenSpec& spec) = 0;
  /// Does what `GetToken` does without blocking, and reports to `callback` what that returns or
  /// throws; an exception of the login's functions that is not a `Tarnik::Exception` is reported as
  /// an `SsoException` with its text. Waiting does not occupy a thread.
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
  /// Does not block.
  virtual TokenSourceMetrics Metrics() const = 0;
  /// Ends all that is under way: waiting calls throw `Tarnik::InvalidStateException`, callbacks
  /// receive it, as does every later call, also for tokens in the cache. Waits at most `wait` until
  /// no function of the login and no callback is running on another thread; returns whether that
  /// is so. A negative `wait` counts as zero. May be called several times, also in a callback.
  virtual bool Stop(std::chrono::milliseconds wait = std::chrono::seconds{1}) = 0;
};

/// Creates a source. Sends nothing, except for `keepFresh` in the background. Throws
/// `Tarnik::InvalidArgumentException` when there is no endpoint, for a malformed URL, for https
/// URLs beside http URLs, since a login must not reach the network in plain text when TLS fails,
/// for an https URL without an SSL context, when the token factory is null, for a login whose
/// functions are not set or that lacks the holder-of-key configuration that it needs, for an
/// unusable holder-of-key configuration (see `CreateSecurityTokenService`), for a spec in
/// `keepFresh` that cannot be sent, for more of them than `cache.capacity`, and for a number that
/// is outside its range.
SSOCLIENT_ACCESS_EXPORT std::shared_ptr<TokenSource> CreateTokenSource(TokenSourceConfig config);

}  // namespace SsoClient::Access

#endif
