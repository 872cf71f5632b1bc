#ifndef SSOCLIENT_ACCESS_FAILURE_KIND_H
#define SSOCLIENT_ACCESS_FAILURE_KIND_H

#include <ssoclient/access/export.h>
#include <tarnik/core/exception.h>

namespace SsoClient::Access {

/// Why an attempt to get a token failed, for programs. Kinds may be added in later versions.
enum class FailureKind {
  kNone,          ///< it did not fail
  kUnreachable,   ///< no address for the host, connection refused or reset, or no route
  kTlsTrust,      ///< the service's certificate is not trusted, expired or revoked
  kTlsName,       ///< the service's certificate is for another name
  kTls,           ///< any other failure of TLS
  kTimedOut,      ///< the endpoint did not answer within the limit of an attempt
  kCutOff,        ///< the connection ended before the answer did
  kHttpStatus,    ///< an HTTP status other than 2xx and 401, without a SOAP fault
  kBadAnswer,     ///< an answer that violates HTTP or is not what WS-Trust specifies
  kFault,         ///< a SOAP fault, except a refused login
  kRefusedLogin,  ///< the service refused the credentials, by the HTTP status 401 or a fault with
                  ///< the code `FailedAuthentication` or `InvalidSecurityToken` of any namespace
  kExpiredPassword,  ///< the service refused the password because it has expired
  kBadToken,         ///< the service issued a token that was not accepted
  kSecretFailed,     ///< a function of the login threw, before anything was sent
  kAbandoned,        ///< it was cancelled, since nobody waited for it any longer, or by `Stop`
  kLocal,            ///< another failure on this side: an argument, a key, threads or memory, or a
                     ///< later leg of a negotiation
};

/// The name of the kind in lower case with hyphens, such as "refused-login"; valid for the
/// lifetime of the process.
SSOCLIENT_ACCESS_EXPORT const char* NameOf(FailureKind kind) noexcept;

/// The kind of a failure as far as its class determines it: a `CommunicationException` is
/// `kUnreachable`, whether the connection, TLS, the time-out or the HTTP status was the cause. The
/// classes of the platform, which do not leave the client, determine the cause. The records of an
/// `AccessListener` have the exact kind.
SSOCLIENT_ACCESS_EXPORT FailureKind Classify(const Tarnik::Exception& failure) noexcept;

/// True for the failures that no service has decided, after which the next endpoint is asked:
/// `kUnreachable`, `kTlsTrust`, `kTlsName`, `kTls`, `kTimedOut`, `kCutOff` and `kHttpStatus`.
SSOCLIENT_ACCESS_EXPORT bool AllowsFailover(FailureKind kind) noexcept;

}  // namespace SsoClient::Access

#endif
