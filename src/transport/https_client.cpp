#include "transport/https_client.h"

#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_url.h>

#include "transport/https_session.h"
#include "transport/sso_connection_specs.h"

namespace SsoClient {

HttpsClient::HttpsClient(const std::string& url, Tarnik::Ssl::SSLContext* sslContext,
                         const std::string& sslPeerName, unsigned long timeout, bool flag)
    : timeout_(timeout) {
  bool isHttps = false;
  std::string host;
  int port = 0;
  Tarnik::Http::ParseHttpURL(url, isHttps, host, port, path_);
  if (!isHttps) {
    CreateSsoConnectionSpec(host, port, flag, connectionSpec_);
    return;
  }
  if (sslContext == nullptr) {
    throw Tarnik::InvalidArgumentException(
        "HTTPS connection requested but no SSLContext provided.");
  }
  CreateSsoSSLConnectionSpec(host, port, sslContext, sslPeerName, flag, connectionSpec_);
}

HttpsClient::HttpsClient(Tarnik::Http::UserAgent* userAgent, std::string path,
                         unsigned long timeout)
    : sharedUserAgent_(userAgent), path_(std::move(path)), timeout_(timeout) {
  if (userAgent == nullptr) {
    throw Tarnik::InvalidArgumentException("The HTTP user agent must not be null.");
  }
}

std::shared_ptr<TransportSession> HttpsClient::CreateSession() const {
  if (sharedUserAgent_ != nullptr) {
    return std::make_shared<HttpsSession>(sharedUserAgent_, path_, timeout_);
  }
  const auto cookies = Tarnik::Http::CreateCookieStore("");
  return std::make_shared<HttpsSession>(
      Tarnik::Http::CreateHttpUserAgent(connectionSpec_.get(), cookies.get(), nullptr), path_,
      timeout_);
}

}  // namespace SsoClient
