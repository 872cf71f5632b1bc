#ifndef SSOCLIENT_ACCESS_LOGIN_H
#define SSOCLIENT_ACCESS_LOGIN_H

#include <functional>
#include <memory>
#include <string>
#include <variant>

#include <ssoclient/access/endpoint.h>
#include <ssoclient/negotiation_handler.h>
#include <ssoclient/token_spec.h>

namespace SsoClient::Access {

class TokenSource;

/// Logs in with a user name and a password. Only one source of one process protects the account
/// (see `TokenSource`): if several sources have the same account, or several processes such as the
/// children of a pre-forking server, each sends a wrong password once.
struct PasswordLogin {
  /// The name of the user, as `SecurityTokenService::AcquireToken` takes it.
  std::string userName{};
  /// Returns the password, which must not be empty; its text is cleansed from memory after use.
  /// Called on a worker thread before each login, so that a changed file or vault takes effect at
  /// once. It may block: callers still end at their deadlines, and its result is then dropped. All
  /// calls use the same copy of this function, several at once. An exception of any type that it
  /// throws reaches the callers that wait for the login, and nothing is sent or
  /// remembered. Must be set.
  std::function<std::string()> password{};
};

/// Logs in as the owner of the holder-of-key certificate, which the source must have. The specs
/// must have `CONFIRMATION_DEFAULT`. A refusal is remembered for `RetryConfig::refusalMemory`.
struct CertificateLogin {};

/// Logs in by a negotiation such as Kerberos. A refusal is remembered for
/// `RetryConfig::refusalMemory`, also when new tickets are there (see `RetryConfig`).
struct NegotiatedLogin {
  /// Returns a new handler, never null. Called on a worker thread for each login at each endpoint;
  /// may block and throw as `PasswordLogin::password` may. All calls use the same copy of this
  /// function, several at once. Must be set. With the handler of
  /// `ssoclient/gssapi_negotiation_handler.h`:
  ///
  ///     NegotiatedLogin{[](const Endpoint&) {
  ///       return SsoClient::CreateGssapiNegotiationHandler({"HTTP@sts.example.com", "", "", ""});
  ///     }}
  std::function<std::shared_ptr<NegotiationHandler>(const Endpoint& endpoint)> createHandler{};
};

/// Exchanges the token of another source, which must be bound to the holder-of-key configuration of
/// this source. The spec of each call says what for: other audiences, a delegate, or on behalf of
/// the subject of its act-as token, whose result is never refreshed past the end of that token.
struct TokenLogin {
  /// Must not be null, and must not depend on this source.
  std::shared_ptr<TokenSource> source{};
  /// What to ask `source` for.
  TokenSpec spec{};
};

/// How a source logs in.
using Login = std::variant<PasswordLogin, CertificateLogin, NegotiatedLogin, TokenLogin>;

}  // namespace SsoClient::Access

#endif
