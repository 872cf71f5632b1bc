#ifndef SSOCLIENT_GSSAPI_NEGOTIATION_HANDLER_H
#define SSOCLIENT_GSSAPI_NEGOTIATION_HANDLER_H

#include <memory>
#include <string>

#include <ssoclient/export.h>
#include <ssoclient/negotiation_handler.h>

namespace SsoClient {

/// Who logs in with Kerberos, and to whom. The names of files and caches are those of the Kerberos
/// library, which reads its own configuration and environment (KRB5_CONFIG, KRB5CCNAME).
struct GssapiNegotiationConfig {
  /// The service's name in the form "service@host" (RFC 2743, section 4.1), such as
  /// "HTTP@sts.example.com". Required.
  std::string targetService;
  /// The Kerberos principal that logs in, such as "machine" or "machine@EXAMPLE.COM"; if empty, the
  /// owner of the credential cache, or the first principal of the keytab.
  std::string principal;
  /// A file of keys that tickets are got with. If empty, there must be tickets in the credential
  /// cache.
  std::string keytab;
  /// The credential cache, such as "FILE:/run/app/tickets". If empty: without a keytab the default
  /// one, with a keytab one in memory that belongs to the handler alone.
  std::string credentialCache;
};

/// Makes the legs of a negotiated login, SPNEGO (RFC 4178) around Kerberos (RFC 4121), with the
/// system's GSSAPI library. It is for `SecurityTokenService::AcquireTokenByGSS` and for the legs of
/// a `GssNegotiationContext` alike, and it serves one negotiation after the other.
///
/// `Negotiate` begins a negotiation whenever the service's leg is empty, and forgets the one
/// before, finished or not; the credentials are looked for then, so that renewed tickets are found.
/// Its answer is empty, never null, when nothing is left to be said: the service's last leg has
/// proved that the service is the one that the tickets are for, or the service goes on after that.
/// (`AcquireTokenByGSS` hands over a last leg after its loop, and logs a line about the empty
/// answer to it, which means no harm.)
///
/// `Negotiate` throws
/// - `SsoException`, with the texts of the GSSAPI library, when there are no credentials, the realm
///   does not answer or refuses, or the service's leg is broken or proves no identity, and also
///   when the service asks for more than 100 legs; the negotiation is then forgotten;
/// - `Tarnik::InvalidStateException` when no negotiation is under way and the service's leg is not
///   empty, or when another thread is in the same call.
///
/// It blocks while the Kerberos library asks the realm, and no time-out of the service's holds for
/// that: MIT Kerberos 1.20 gives a KDC that is not there up at once, and one that says nothing
/// after 27 seconds (two such after 40, four after 66). A handler is used by one thread at a time,
/// not necessarily by the one that made it; different handlers are independent. Tickets are never
/// delegated to the service.
class GssapiNegotiationHandler : public NegotiationHandler {
 public:
  /// Whether the negotiation begun last is complete and the service has proved its identity. A
  /// service that issues a token without a last leg of its own has not: nothing but TLS and the
  /// token's signature speaks for it then, and it is for the caller to judge whether that will do.
  virtual bool IsEstablished() const = 0;

 protected:
  ~GssapiNegotiationHandler() = default;
};

/// A handler that logs in as `config` says, which is copied. Neither tickets nor files are looked
/// at before the first negotiation.
///
/// Throws `Tarnik::InvalidArgumentException` when the target service is not of the form
/// "service@host" or a field holds a NUL.
SSOCLIENT_EXPORT std::shared_ptr<GssapiNegotiationHandler> CreateGssapiNegotiationHandler(
    const GssapiNegotiationConfig& config);

}  // namespace SsoClient

#endif
