#ifndef SSOCLIENT_ACCESS_TOKEN_GATE_H
#define SSOCLIENT_ACCESS_TOKEN_GATE_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <ssoclient/access/export.h>
#include <ssoclient/access/presenter.h>
#include <ssoclient/access/trust_store.h>
#include <ssoclient/access/verdict.h>
#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <tarnik/system/date_time.h>

namespace SsoClient::Access {

// Durations of the configuration that are longer than a thousand years count as a thousand years.

/// Whether bearer tokens are accepted, which anybody can present who has seen them. A bearer token
/// stays one when its presenter has a certificate.
enum class BearerTokens {
  kNotSaid,  ///< `CreateTokenGate` refuses the configuration
  kRefuse,   ///< only holder-of-key tokens are accepted
  kAccept,   ///< both are
};

/// The tokens that a gate remembers, so that it need not read and verify them again.
struct GateCacheConfig {
  /// The number of tokens; 0 for no cache. The cache is divided into up to 16 parts; of a part that
  /// is full, the token that was not presented for the longest is evicted first.
  std::size_t tokens = 10000;
  /// The memory of all tokens. A token counts a kilobyte, three times the length of its text, 72
  /// bytes for each "<" in it, 56 for each ">" that another character than "<" follows, and 32 for
  /// each "=".
  std::size_t bytes = std::size_t{64} * 1024 * 1024;
};

/// What a gate accepts. `CreateTokenGate` refuses a configuration that leaves open whom to trust,
/// for whom tokens must be, or whether bearer tokens are accepted.
struct GateConfig {
  /// Names the gate in the first line of `Verdict::ToString`; may be empty.
  std::string name{};
  /// Who may sign tokens; must not be null.
  std::shared_ptr<TrustStore> trust{};
  /// The names by which tokens may be restricted to this service (SAML 2.0 core, section 2.5.1.4):
  /// at least one. A restricted token must name one of them, byte for byte.
  std::vector<std::string> audiences{};
  /// Whether tokens are accepted that are not restricted to audiences, and so to no service.
  bool acceptsUnrestrictedTokens = false;
  /// Must be said.
  BearerTokens bearerTokens = BearerTokens::kNotSaid;
  /// Widens the validity of tokens, of signers' certificates and of revocation lists at both ends.
  /// Not negative.
  std::chrono::seconds clockTolerance{std::chrono::minutes{5}};
  /// From NotBefore to NotOnOrAfter of the token. Positive.
  std::chrono::seconds longestLifetime{std::chrono::hours{24 * 31}};
  /// The number of delegates in the token's delegation chain.
  std::size_t deepestDelegation = 10;
  /// The token's subject must be in one of these groups; if the list is empty, groups do not
  /// matter. Names must not be empty.
  std::vector<PrincipalId> allowedGroups{};
  /// The last check; may be empty. Returns whether the token is accepted; otherwise it may set
  /// `why`, which becomes the refusal's message. Called for each presentation of a token, on the
  /// thread of the check, several at once. The token is refused if it throws. Rules that depend on
  /// the request are better checked after the verdict, on `Verdict::Token`.
  std::function<bool(const SamlToken& token, std::string& why)> predicate{};
  /// The longest text of a token in bytes; longer ones are refused before they are read. Positive.
  std::size_t largestToken = std::size_t{256} * 1024;
  /// The size of the cache of accepted tokens.
  GateCacheConfig cache{};
  /// The current time; the system's clock if it is empty. For tests.
  std::function<Tarnik::System::DateTime()> clock{};
};

/// Counters since the gate was made, or since the fork in a child, and gauges. They are read one by
/// one while others work.
struct GateMetrics {
  std::uint64_t accepted = 0;  ///< checks that accepted the token
  /// By `Reason`, in the order of the enumeration, with an element for each; the first is zero.
  std::vector<std::uint64_t> refused{};
  std::uint64_t cacheHits = 0;    ///< checks of a remembered token, whatever their verdict
  std::uint64_t cacheMisses = 0;  ///< checks that read the token
  std::uint64_t evictions = 0;    ///< tokens forgotten for lack of space
  std::size_t cachedTokens = 0;   ///< now
  std::size_t cachedBytes = 0;    ///< now, as counted by `GateCacheConfig::bytes`
};

/// Checks the tokens that callers of a service present. Each check of a token is one of
/// `CheckKind`; the first that fails decides.
///
/// An accepted token is remembered by the SHA-256 of its whole text. When it is presented again, it
/// is not read and its signature is not verified again while the trust store is unchanged; all
/// other checks are made again, with the presenter and the time of that presentation. A gate keeps
/// nothing of a token that was never accepted, nor of one that is presented after its end; the
/// platform keeps the certificates that it has decoded last
/// (`Tarnik::Crypto::CreateCertificateFromDer`).
///
/// Thread-safe; a check takes no lock for longer than a look-up in a part of the cache, and never
/// waits for a file or the network. May be used in a forked child, where the cache begins empty.
///
/// A program may implement this class itself, for its tests for example. The order of the
/// operations is part of the binary interface, and later versions add none.
class SSOCLIENT_ACCESS_EXPORT TokenGate {
 public:
  virtual ~TokenGate();
  /// Checks `token`, the XML text of one SAML 2.0 assertion, which `presenter` has sent: a document
  /// as `CreateSamlToken` accepts it, so white space and comments may be around the assertion.
  /// Refusals are verdicts: throws only `std::bad_alloc` and the exceptions of `GateConfig::clock`.
  ///
  /// The text of an assertion in a larger document, such as a WS-Security header, is its canonical
  /// text by Canonical XML 1.0 (`Tarnik::Xml::Security::CreateCanonicalizer`), which declares the
  /// namespaces of the elements around it. The exclusive form leaves out those that only values
  /// use. Conditions of SAML that the accepted layout does not contain are refused as
  /// `Reason::kBadLayout`.
  virtual Verdict Check(const std::string& token, const Presenter& presenter) const = 0;
  /// The counters of this gate. May be called at any time; does not wait for checks.
  virtual GateMetrics Metrics() const = 0;
};

/// Throws `Tarnik::InvalidArgumentException` when the trust store is null or not one of
/// `CreateTrustStore`, there is no audience or an empty one, `bearerTokens` is not said, an allowed
/// group has no name, and for a number that is outside its range.
SSOCLIENT_ACCESS_EXPORT std::shared_ptr<TokenGate> CreateTokenGate(GateConfig config);

}  // namespace SsoClient::Access

#endif
