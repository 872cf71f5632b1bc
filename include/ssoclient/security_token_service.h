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
/// concurrently, on any threads. The order of the operations is part of the binary interface.
///
/// Each operation throws
///  - `Tarnik::InvalidArgumentException`, before anything is sent, for a lifetime that is not
///    positive, a text that XML cannot represent, a token that has an id of the signed request
///    itself, and what the operation lists;
///  - `Tarnik::Xml::XMLParseException`, before anything is sent, when the text of a token that the
///    caller passes is malformed;
///  - `Tarnik::InvalidStateException`, before anything is sent, when the operation needs a
///    `HolderOfKeyConfig` and there is none, or its certificate is not valid now;
///  - `Tarnik::Xml::Security::XmlSecurityException` when the key fails to sign, and when a token in
///    the signed part of the request, or the assertion in the service's answer, is in the scope of
///    a namespace declaration with a relative URI (Canonical XML 1.0, section 1.3);
///  - `CommunicationException` when the exchange fails or takes longer than 240 seconds, and when
///    the process is ending. The exceptions of connections, TLS and HTTP (`Tarnik::IOException` and
///    the classes derived from it) leave an operation only as this class;
///  - `InvalidCredentialsException` and `PasswordExpiredException` when the service refuses the
///    login;
///  - `ParseException` when the code of a SOAP fault has a prefix that is not declared;
///  - `SsoException` for any other fault, and for an answer of an unexpected form;
///  - what the token factory throws when it rejects the issued token: the library's own throws
///    `ParseException`, `InvalidSignatureException`, `Tarnik::Xml::XMLParseException`,
///    `Tarnik::Base64FormatException`, `Tarnik::Crypto::CryptoException` and the exceptions of its
///    resolver, as `CreateSamlToken` does;
///  - `Tarnik::ResourceException` when the platform's thread pool cannot be started;
///  - `std::bad_alloc` when memory runs out on the calling thread. A shortage on a thread of the
///    platform is a failure of the exchange, a `CommunicationException`.
///
/// A returned token is null only if the service answers with an empty token text.
///
/// Each asynchronous operation returns immediately and reports to its callback. Arguments are
/// copied, except tokens and negotiation handlers, which are passed by reference: the caller keeps
/// them alive until the callback has returned. The service may be released earlier. At most 256
/// asynchronous operations run at the same time in a process; further ones wait in a queue.
///
/// The function itself throws, and the callback then never runs,
///  - `Tarnik::InvalidArgumentException` when the callback is empty;
///  - `CommunicationException` when the process is ending;
///  - `Tarnik::ResourceException` when the platform's thread pool cannot be started;
///  - `std::bad_alloc` when memory runs out before the operation is in the queue.
///
/// The callback receives every `Tarnik::Exception` that the operation throws, as listed above; a
/// `Tarnik::ResourceException` in place of `std::bad_alloc`, and when there is no worker thread and
/// none can be started; and a `CommunicationException` when the process ends before the operation
/// has started. Any other exception that leaves the operation, such as a `std::exception` from the
/// caller's negotiation handler, ends the process.
///
/// Time-outs are fixed. To give up earlier, use a service with a bounded user agent
/// (`tarnik/http/bounded_user_agent.h`): an asynchronous operation that is only abandoned keeps its
/// thread until its time-out, and delays the others when there are 256 of them.
class SecurityTokenService {
 public:
  /// Receives a token and null, or null and the exception, which is valid only during the call.
  /// Called once, on a worker thread of the platform's pool, where it may block. Only when no
  /// worker can be started is it called on an I/O thread, with a `Tarnik::ResourceException`, and
  /// only when the process ends before the operation has started, on a thread that is started for
  /// that. It must not throw: an exception that leaves it, also `std::bad_alloc`, ends the process.
  using TokenCallback =
      std::function<void(const std::shared_ptr<const SamlToken>&, const Tarnik::Exception*)>;
  /// The same for the result of `ValidateSubject`.
  using ValidateCallback =
      std::function<void(const boost::optional<bool>&, const Tarnik::Exception*)>;

  /// Requests a token for the user (WS-Trust 1.3, section 4.1; user name and password as in Web
  /// Services Security: UsernameToken Profile 1.0). With a holder-of-key configuration, the request
  /// is signed and the token is bound to the key, unless the spec asks for a bearer token or has an
  /// act-as token.
  virtual std::shared_ptr<const SamlToken> AcquireToken(const std::string& userName,
                                                        const std::string& password,
                                                        const TokenSpec& spec) const = 0;
  /// Requests a token by a negotiated login (SPNEGO in WS-Trust 1.3, section 8). `handler` creates
  /// the legs; all are sent in one session with its own cookies, each within 240 seconds. The token
  /// is bound to the key as by `AcquireToken`. Throws `Tarnik::InvalidArgumentException` when the
  /// handler returns null, also after earlier legs were sent, and `CommunicationException` when an
  /// answer has an empty negotiation id or the service asks for more than 1000 legs.
  /// Exceptions of the handler propagate unchanged.
  virtual std::shared_ptr<const SamlToken> AcquireTokenByGSS(const TokenSpec& spec,
                                                             NegotiationHandler& handler) const = 0;
  /// Requests a holder-of-key token for the owner of the configured certificate (Web Services
  /// Security: X.509 Token Profile 1.0). Throws `Tarnik::InvalidArgumentException` when the spec's
  /// confirmation is not `CONFIRMATION_DEFAULT`.
  virtual std::shared_ptr<const SamlToken> AcquireTokenByCertificate(
      const TokenSpec& spec) const = 0;
  /// Requests another token by `token`, which must be bound to the configured key (Web Services
  /// Security: SAML Token Profile 1.1): with other audiences, delegated to another principal, or on
  /// behalf of the subject of the spec's act-as token, which should not be `token` itself: many
  /// services refuse a request that contains one assertion twice.
  virtual std::shared_ptr<const SamlToken> AcquireTokenByToken(const SamlToken& token,
                                                               const TokenSpec& spec) const = 0;
  /// Asks the service whether `token` is valid (WS-Trust 1.3, section 7).
  virtual bool ValidateSubject(const SamlToken& token) const = 0;
  /// Requests `token` with a new lifetime of `lifetimeSec` seconds from now (WS-Trust 1.3, section
  /// 5). Throws `Tarnik::InvalidArgumentException` when `token` is not a holder-of-key token.
  virtual std::shared_ptr<const SamlToken> RenewToken(const SamlToken& token,
                                                      std::int64_t lifetimeSec) const = 0;

  /// `AcquireToken` on a worker thread.
  virtual void AcquireTokenAsync(const std::string& userName, const std::string& password,
                                 const TokenSpec& spec, TokenCallback callback) const = 0;
  /// `AcquireTokenByGSS` on a worker thread, which calls the handler.
  virtual void AcquireTokenByGSSAsync(const TokenSpec& spec, NegotiationHandler& handler,
                                      TokenCallback callback) const = 0;
  /// `AcquireTokenByCertificate` on a worker thread.
  virtual void AcquireTokenByCertificateAsync(const TokenSpec& spec,
                                              TokenCallback callback) const = 0;
  /// `AcquireTokenByToken` on a worker thread.
  virtual void AcquireTokenByTokenAsync(const SamlToken& token, const TokenSpec& spec,
                                        TokenCallback callback) const = 0;
  /// `ValidateSubject` on a worker thread.
  virtual void ValidateSubjectAsync(const SamlToken& token, ValidateCallback callback) const = 0;
  /// `RenewToken` on a worker thread.
  virtual void RenewTokenAsync(const SamlToken& token, std::int64_t lifetimeSec,
                               TokenCallback callback) const = 0;

 protected:
  ~SecurityTokenService() = default;
};

/// Creates a service that opens its own connections, with a new connection and new cookies for each
/// operation. Throws `Tarnik::InvalidArgumentException` for a malformed URL, for an https URL
/// without an SSL context, when the token factory is null, and for an unusable holder-of-key
/// configuration: a null field, a certificate whose key is malformed or of an unknown kind, a
/// private key that does not belong to the certificate, or a key that is not an RSA key of at least
/// 2048 bits.
SSOCLIENT_EXPORT std::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfig& config);
/// Creates a service that sends through the caller's user agent. Throws
/// `Tarnik::InvalidArgumentException` when the user agent or the token factory is null, and for a
/// holder-of-key configuration as above. The operations throw this class for a malformed request
/// target, and whatever the user agent's `SendAsync` throws. A `Tarnik::Exception` that its `Wait`
/// throws becomes a `CommunicationException`.
SSOCLIENT_EXPORT std::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfigEx& config);

}  // namespace SsoClient

#endif
