#ifndef SSOCLIENT_ACCESS_GATE_VERDICT_FACTS_H
#define SSOCLIENT_ACCESS_GATE_VERDICT_FACTS_H

#include <cstddef>
#include <memory>
#include <string>

#include <ssoclient/access/presenter.h>
#include <ssoclient/access/token_gate.h>
#include <ssoclient/access/verdict.h>
#include <tarnik/system/date_time.h>

#include "trust/trust_snapshot.h"

namespace SsoClient::Access {

/// What a token says that its interface does not, and what the policy of a gate says about it at
/// any time. Pointers are to the configuration.
struct TokenTraits {
  Tarnik::System::DateTime confirmationEnd;  ///< see `ConfirmationEndOf`
  const std::string* audience = nullptr;     ///< the gate's, which the token names
  const PrincipalId* group = nullptr;        ///< the allowed group, which the subject is in
  std::size_t delegates = 0;
  bool isRestricted = false;  ///< to audiences
};

/// A token that could be read, and what remains true of it while the trust stays as it is.
/// Immutable once it is shared.
struct CheckedToken {
  std::shared_ptr<const SamlToken> token;
  std::shared_ptr<const GateConfig> config;
  std::shared_ptr<const TrustSnapshot> trust;  ///< null before it was used
  const Signer* signer = nullptr;  ///< whose key has verified the signature; owned by `trust`
  TokenTraits traits;
  Tarnik::System::DateTime readAt;
};

/// What a verdict says about the presenter: without its data and signature.
struct PresenterFacts {
  Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate;
  std::size_t dataLength = 0;
  Presenter::Kind kind = Presenter::Kind::kNobody;
  Tarnik::Crypto::SignatureAlgorithm algorithm{};
};

/// All that the texts of a verdict are made from. They are made only when they are asked for, since
/// nobody reads those of most accepted tokens.
struct VerdictFacts {
  /// The configuration of the gate if there is no `checked`.
  std::shared_ptr<const GateConfig> config;
  /// Null for a token that could not be read. Without a configuration for a verdict that a program
  /// has made.
  std::shared_ptr<const CheckedToken> checked;
  PresenterFacts presenter;
  Tarnik::System::DateTime now;
  std::size_t length = 0;  ///< of the token's text
  /// What the failed check says in words of others, as a text for records.
  std::string detail;
  std::string message;
  Reason reason = Reason::kNone;
  CheckKind failed = CheckKind::kSize;  ///< only with a reason
  bool isRemembered = false;            ///< from the cache

  /// Null for a verdict that a program has made.
  const GateConfig* Config() const noexcept {
    return config != nullptr ? config.get() : checked != nullptr ? checked->config.get() : nullptr;
  }
};

}  // namespace SsoClient::Access

#endif
