#ifndef SSOCLIENT_TRANSPORT_HTTPS_CLIENT_H
#define SSOCLIENT_TRANSPORT_HTTPS_CLIENT_H

#include <memory>
#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/ssl/ssl_context.h>

#include "transport/transport.h"

namespace SsoClient {

/// Posts SOAP requests over HTTP or HTTPS. Immutable.
class HttpsClient final : public Transport {
 public:
  /// Connects to the host of `url`; each session has its own user agent and cookies. `sslPeerName`
  /// and `flag` are passed to the connection spec. `timeout`, in microseconds, limits each
  /// exchange.
  ///
  /// Throws `Tarnik::InvalidArgumentException` for a malformed URL, and for an https URL when
  /// `sslContext` is null; for an http URL the TLS arguments are ignored.
  HttpsClient(const std::string& url, Tarnik::Ssl::SSLContext* sslContext,
              const std::string& sslPeerName, unsigned long timeout, bool flag);

  /// Sends through the caller's `userAgent`, which all sessions share. `path` is the request
  /// target, used unchanged. Throws `Tarnik::InvalidArgumentException` when `userAgent` is null.
  HttpsClient(Tarnik::Http::UserAgent* userAgent, std::string path, unsigned long timeout);

  std::shared_ptr<TransportSession> CreateSession() const override;

 private:
  Tarnik::Ref<Tarnik::Http::ConnectionSpec> connectionSpec_;
  Tarnik::Ref<Tarnik::Http::UserAgent> sharedUserAgent_;
  std::string path_;
  unsigned long timeout_;
};

}  // namespace SsoClient

#endif
