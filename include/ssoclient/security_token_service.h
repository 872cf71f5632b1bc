#ifndef SSOCLIENT_SECURITY_TOKEN_SERVICE_H
#define SSOCLIENT_SECURITY_TOKEN_SERVICE_H

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include <boost/optional.hpp>

#include <ssoclient/exceptions.h>
#include <ssoclient/negotiation_handler.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/security_token_service_config.h>
#include <ssoclient/token_spec.h>

namespace SsoClient {

/// A client of one WS-Trust 1.3 Security Token Service. Immutable; any number of operations may run
/// at once from any threads. The order of the operations is part of the binary interface.
///
/// Each operation throws
///  - `Tarnik::InvalidArgumentException` for arguments that cannot be sent, before anything is
///    sent: a lifetime that is not positive, a text that XML cannot carry, a token that carries an
///    id of the signed request itself, and what the operation tells;
///  - `Tarnik::Xml::XMLParseException`, also before anything is sent, when the text of a token that
///    the caller gives is malformed;
///  - `Tarnik::InvalidStateException`, also before anything is sent, when the operation needs a
///    `HolderOfKeyConfig` and there is none, or its certificate is not valid now;
///  - `CommunicationException` when the exchange fails or takes longer than 240 seconds;
///  - `InvalidCredentialsException` and `PasswordExpiredException` when the service refuses the
///    login;
///  - `SsoException` for any other fault or an answer that is none;
///  - `InvalidTokenException` (`ParseException`, `InvalidSignatureException`) or another
///    `Tarnik::Exception` (such as `Tarnik::Xml::XMLParseException`) when the token factory refuses
///    the answered token;
///  - `Tarnik::Xml::Security::XmlSecurityException` when a key fails to sign, and when a token that
///    is to be signed along declares a namespace with a relative URI (Canonical XML 1.0, section
///    1.3).
///
/// A token that an operation returns is null only if the service answers with an empty token text.
///
/// Each asynchronous operation returns at once and reports to its callback, which must not be
/// empty (`Tarnik::InvalidArgumentException`). What the operation throws goes to the callback if it
/// is a `Tarnik::Exception`, as every failure listed above is. Anything else, such as a
/// `std::exception` of a negotiation handler of the caller's own, leaves the worker thread and so
/// ends the process. Arguments are copied, except tokens and negotiation handlers, which are taken
/// by reference: the caller keeps them alive until the callback has run. The service may be
/// released before.
class SecurityTokenService {
 public:
  /// Receives a token and null, or null and the exception, which is valid only during the call.
  /// Called once, on a worker thread of the platform's pool, where it may block. It must not throw.
  using TokenCallback =
      std::function<void(const std::shared_ptr<const SamlToken>&, const Tarnik::Exception*)>;
  /// The same for a verdict.
  using ValidateCallback =
      std::function<void(const boost::optional<bool>&, const Tarnik::Exception*)>;

  /// Asks for a token for the user (WS-Trust 1.3, section 4.1; user name and password as in
  /// Web Services Security UsernameToken Profile 1.0). With a holder-of-key configuration, and
  /// unless the spec asks for a bearer token or acts as another, the request is signed and the
  /// token is bound to the key.
  virtual std::shared_ptr<const SamlToken> AcquireToken(const std::string& userName,
                                                        const std::string& password,
                                                        const TokenSpec& spec) const = 0;
  /// Asks for a token by a negotiated login (SPNego in WS-Trust 1.3, section 8): `handler` makes
  /// the legs, all of which travel in one session with its cookies, each within 240 seconds. Bound
  /// to the key as by `AcquireToken`. Throws `Tarnik::InvalidArgumentException` when the handler
  /// returns null and `CommunicationException` when an answer names no negotiation or the service
  /// asks for more than 1000 legs; what the handler throws passes through unchanged.
  virtual std::shared_ptr<const SamlToken> AcquireTokenByGSS(const TokenSpec& spec,
                                                             NegotiationHandler& handler) const = 0;
  /// Asks for a holder-of-key token for the owner of the configured certificate (Web Services
  /// Security: X.509 Token Profile 1.0). Throws `Tarnik::InvalidArgumentException` when the spec's
  /// confirmation is not `CONFIRMATION_DEFAULT`.
  virtual std::shared_ptr<const SamlToken> AcquireTokenByCertificate(
      const TokenSpec& spec) const = 0;
  /// Asks for another token on the strength of `token`, which must be bound to the configured key
  /// (Web Services Security: SAML Token Profile 1.1): with other audiences, delegated to somebody
  /// else, or on behalf of the spec's act-as token.
  virtual std::shared_ptr<const SamlToken> AcquireTokenByToken(const SamlToken& token,
                                                               const TokenSpec& spec) const = 0;
  /// Asks whether `token` is valid (WS-Trust 1.3, section 7).
  virtual bool ValidateSubject(const SamlToken& token) const = 0;
  /// Asks for `token` with a new lifetime of `lifetimeSec` seconds from now on (WS-Trust 1.3,
  /// section 5). Throws `Tarnik::InvalidArgumentException` when it is not a holder-of-key token.
  virtual std::shared_ptr<const SamlToken> RenewToken(const SamlToken& token,
                                                      std::int64_t lifetimeSec) const = 0;

  virtual void AcquireTokenAsync(const std::string& userName, const std::string& password,
                                 const TokenSpec& spec, TokenCallback callback) const = 0;
  virtual void AcquireTokenByGSSAsync(const TokenSpec& spec, NegotiationHandler& handler,
                                      TokenCallback callback) const = 0;
  virtual void AcquireTokenByCertificateAsync(const TokenSpec& spec,
                                              TokenCallback callback) const = 0;
  virtual void AcquireTokenByTokenAsync(const SamlToken& token, const TokenSpec& spec,
                                        TokenCallback callback) const = 0;
  virtual void ValidateSubjectAsync(const SamlToken& token, ValidateCallback callback) const = 0;
  virtual void RenewTokenAsync(const SamlToken& token, std::int64_t lifetimeSec,
                               TokenCallback callback) const = 0;

 protected:
  ~SecurityTokenService() = default;
};

/// A service that connects by itself, with a connection and cookies of its own for each operation.
/// Throws `Tarnik::InvalidArgumentException` for a malformed URL, for an https URL without an SSL
/// context, when the token factory is null, and for a holder-of-key configuration that cannot work:
/// a null part, a certificate whose key is broken or of an unknown kind, a key that is not the
/// certificate's, or one that is not an RSA key of at least 2048 bits.
SSOCLIENT_EXPORT std::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfig& config);
/// A service that sends through the caller's user agent. Throws `Tarnik::InvalidArgumentException`
/// when the user agent or the token factory is null, and for a holder-of-key configuration as
/// above. A request target that cannot be sent is refused by the operations.
SSOCLIENT_EXPORT std::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfigEx& config);

}  // namespace SsoClient

#endif
