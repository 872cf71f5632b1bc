#ifndef SSOCLIENT_ACCESS_LOGIN_H
#define SSOCLIENT_ACCESS_LOGIN_H

#include <functional>
#include <memory>
#include <string>
#include <variant>

#include <ssoclient/negotiation_handler.h>
#include <ssoclient/token_spec.h>

namespace SsoClient::Access {

class TokenSource;

/// Logs in with a user name and a password.
struct PasswordLogin {
  std::string userName;
  /// Returns the password. Called on a worker thread for each login, so that a changed file or
  /// vault takes effect with the next one; it may block, but a deadline does not interrupt it. Its
  /// result is cleansed from memory after use. An exception that it throws ends the calls that wait
  /// for the login, unchanged if it is a `Tarnik::Exception`; nothing is remembered or sent. An
  /// empty password causes `Tarnik::InvalidArgumentException`. Must not be empty.
  std::function<std::string()> password;
};

/// Logs in as the owner of the holder-of-key certificate.
struct CertificateLogin {};

/// Logs in by a negotiation such as Kerberos.
struct NegotiatedLogin {
  /// Returns a new handler. Called on a worker thread for each login and each endpoint that is
  /// tried, with the host of that endpoint; throws as `PasswordLogin::password` may. With the
  /// Kerberos handler:
  ///
  ///     NegotiatedLogin{[](const std::string& host) {
  ///       return SsoClient::CreateGssapiNegotiationHandler({"HTTP@" + host});
  ///     }}
  ///
  /// Must not be empty and must not return null.
  std::function<std::shared_ptr<NegotiationHandler>(const std::string& host)> createHandler;
};

/// Exchanges the token of another source, which must be bound to the holder-of-key configuration of
/// this source. The spec of each call says what for: other audiences, a delegate, or on behalf of
/// the subject of its act-as token.
struct TokenLogin {
  std::shared_ptr<TokenSource> source;
  /// What to ask that source for.
  TokenSpec spec;
};

using Login = std::variant<PasswordLogin, CertificateLogin, NegotiatedLogin, TokenLogin>;

}  // namespace SsoClient::Access

#endif
