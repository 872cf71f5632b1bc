#ifndef SSOCLIENT_TRANSPORT_HTTPS_SESSION_H
#define SSOCLIENT_TRANSPORT_HTTPS_SESSION_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/http/http_user_agent.h>

#include "transport/transport.h"

namespace SsoClient {

/// Posts to `path` through `userAgent`, at most `timeout` microseconds for each exchange.
class HttpsSession final : public TransportSession {
 public:
  HttpsSession(Tarnik::Ref<Tarnik::Http::UserAgent> userAgent, std::string path,
               unsigned long timeout);

  void SendRequest(const SoapRequest& request, Tarnik::Ref<Tarnik::Reader>& reader) const override;
  void SendRequestAsync(const SoapRequest& request, const Completion& completion,
                        Tarnik::Ref<Tarnik::Http::PendingRequestItem>& handle) const override;

 private:
  Tarnik::Ref<Tarnik::Http::PendingRequestItem> Post(const SoapRequest& request,
                                                     Tarnik::Http::UserAgent::Completion completion,
                                                     unsigned long timeout) const;

  Tarnik::Ref<Tarnik::Http::UserAgent> userAgent_;
  std::string path_;
  unsigned long timeout_;
};

}  // namespace SsoClient

#endif
