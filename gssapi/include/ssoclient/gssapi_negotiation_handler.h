#ifndef SSOCLIENT_GSSAPI_NEGOTIATION_HANDLER_H
#define SSOCLIENT_GSSAPI_NEGOTIATION_HANDLER_H

#include <memory>
#include <string>

#include <ssoclient/export.h>
#include <ssoclient/negotiation_handler.h>

namespace SsoClient {

/// The client and the service of a login with Kerberos. Files and caches are named in the syntax of
/// the Kerberos library, which reads its own configuration and environment (KRB5_CONFIG,
/// KRB5CCNAME).
struct GssapiNegotiationConfig {
  /// The service's name in the form "service@host" (RFC 2743, section 4.1), such as
  /// "HTTP@sts.example.com". Required.
  std::string targetService;
  /// The Kerberos principal that logs in, such as "machine" or "machine@EXAMPLE.COM". If empty: the
  /// owner of the credential cache, or the first principal of the keytab.
  std::string principal;
  /// The keytab whose keys are used to acquire tickets. If empty, the credential cache must contain
  /// tickets.
  std::string keytab;
  /// The credential cache, such as "FILE:/run/app/tickets". If empty: the default cache without a
  /// keytab, and with a keytab a cache in memory that only the handler uses.
  std::string credentialCache;
};

/// Creates the legs of a negotiated login, Kerberos (RFC 4121) inside SPNEGO (RFC 4178), with the
/// system's GSSAPI library. It can be used with `SecurityTokenService::AcquireTokenByGSS` as well
/// as for the legs of a `GssNegotiationContext`, and for any number of negotiations in sequence.
///
/// `Negotiate` begins a negotiation whenever the service's leg is empty and forgets the previous
/// one, finished or not. It looks up the credentials at that time, so that it finds renewed
/// tickets. It returns an empty leg, never null, when the client has nothing left to send: when the
/// service's last leg has proved that the service is the one that the tickets are for, and when the
/// service sends further legs after that proof. (`AcquireTokenByGSS` passes the last leg to the
/// handler after its loop and logs a line about the empty leg that the handler returns, which is
/// harmless.)
///
/// `Negotiate` throws
/// - `SsoException`, with the texts of the GSSAPI library, if there are no credentials, if the
///   realm does not answer or rejects the request, if the service's leg is malformed or does not
///   prove its identity, and also if the service asks for more than 100 legs; the negotiation is
///   then forgotten;
/// - `Tarnik::InvalidStateException` if no negotiation is in progress and the service's leg is not
///   empty, or if another thread is in the same call.
///
/// It blocks while the Kerberos library sends requests to the realm, to which the timeouts of the
/// service do not apply: MIT Kerberos 1.20 gives up immediately if the KDC is not running, and
/// after 27 seconds if it does not answer (after 40 with two such KDCs, after 66 with four). A
/// handler must be used by one thread at a time, not necessarily the one that created it; different
/// handlers are independent. Tickets are never delegated to the service.
class GssapiNegotiationHandler : public NegotiationHandler {
 public:
  /// Whether the most recent negotiation is complete and the service has proved its identity. A
  /// service that issues a token without sending a last leg has not: only TLS and the token's
  /// signature authenticate it then, and the caller must decide whether that is sufficient.
  virtual bool IsEstablished() const = 0;

 protected:
  ~GssapiNegotiationHandler() = default;
};

/// Creates a handler that logs in as `config` specifies, which is copied. Tickets and files are not
/// accessed before the first negotiation.
///
/// Throws `Tarnik::InvalidArgumentException` if the target service is not of the form
/// "service@host" or a field contains a NUL.
SSOCLIENT_EXPORT std::shared_ptr<GssapiNegotiationHandler> CreateGssapiNegotiationHandler(
    const GssapiNegotiationConfig& config);

}  // namespace SsoClient

#endif
