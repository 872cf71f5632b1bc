#ifndef SSOCLIENT_SECURITY_TOKEN_SERVICE_H
#define SSOCLIENT_SECURITY_TOKEN_SERVICE_H

#include <functional>
#include <memory>
#include <string>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/security_token_service_config.h>
#include <ssoclient/token_spec.h>

namespace SsoClient {

/// A client of one WS-Trust 1.3 Security Token Service. Immutable; any number of operations may run
/// at once from any threads. The order of the operations is part of the binary interface.
///
/// Each operation throws
///  - `Tarnik::InvalidArgumentException` for arguments that cannot be sent, before anything is
///  sent;
///  - `CommunicationException` when the exchange fails or takes longer than 240 seconds;
///  - `InvalidCredentialsException` and `PasswordExpiredException` when the service refuses the
///  login;
///  - `SsoException` for any other fault or an answer that is none;
///  - `InvalidTokenException` (`ParseException`, `InvalidSignatureException`) or
///    `Tarnik::Xml::XMLParseException` when the token factory refuses the answered token.
class SecurityTokenService {
 public:
  /// Receives a token and null, or null and the exception, which is valid only during the call.
  /// Called once, on a worker thread of the platform's pool, where it may block. It must not throw.
  using TokenCallback =
      std::function<void(const std::shared_ptr<const SamlToken>&, const Tarnik::Exception*)>;

  /// Asks for a token for the user (WS-Trust 1.3, section 4.1; user name and password as in
  /// Web Services Security UsernameToken Profile 1.0). The result is null only if the service
  /// answers with an empty token text.
  virtual std::shared_ptr<const SamlToken> AcquireToken(const std::string& userName,
                                                        const std::string& password,
                                                        const TokenSpec& spec) const = 0;

  /// As above, but returns at once and reports to `callback`. Arguments are copied; the service may
  /// be released before the call has ended. Throws `Tarnik::InvalidArgumentException` when
  /// `callback` is empty; every failure of the operation itself goes to the callback.
  virtual void AcquireTokenAsync(const std::string& userName, const std::string& password,
                                 const TokenSpec& spec, TokenCallback callback) const = 0;

 protected:
  ~SecurityTokenService() = default;
};

/// A service that connects by itself, with a connection and cookies of its own for each operation.
/// Throws `Tarnik::InvalidArgumentException` for a malformed URL, for an https URL without an SSL
/// context, and when the token factory is null.
SSOCLIENT_EXPORT std::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfig& config);
/// A service that sends through the caller's user agent. Throws `Tarnik::InvalidArgumentException`
/// when the user agent or the token factory is null. A request target that cannot be sent is
/// refused by the operations.
SSOCLIENT_EXPORT std::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfigEx& config);

}  // namespace SsoClient

#endif
