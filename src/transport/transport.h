#ifndef SSOCLIENT_TRANSPORT_TRANSPORT_H
#define SSOCLIENT_TRANSPORT_TRANSPORT_H

#include <functional>
#include <memory>
#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/text/string_util.h>

namespace SsoClient {

/// What a session posts. Its body contains passwords and tokens, so it cannot be copied and is
/// cleansed from memory when it is destroyed.
struct SoapRequest {
  std::string action;  ///< the SOAPAction URI, without quotes
  std::string body;    ///< the whole serialised envelope

  SoapRequest() = default;
  SoapRequest(const SoapRequest&) = delete;
  SoapRequest& operator=(const SoapRequest&) = delete;
  ~SoapRequest() { Tarnik::StringUtil::Cleanse(body); }
};

/// One exchange, or one negotiation of several exchanges. Used by one exchange at a time. Owned by
/// a `std::shared_ptr` to the concrete class.
class TransportSession {
 public:
  /// Receives null and a reader over the answer's body, or the `CommunicationException` and null.
  /// Both are valid only during the call. Called once, on an I/O thread; must not block.
  using Completion = std::function<void(const Tarnik::Exception*, Tarnik::Reader*)>;

  /// Posts `request`, waits for the answer and assigns a reader over its body to `reader`. Throws
  /// `CommunicationException` when the exchange fails or the answer's HTTP status is neither 2xx
  /// nor 500. Exceptions from creating the HTTP request propagate.
  virtual void SendRequest(const SoapRequest& request,
                           Tarnik::Ref<Tarnik::Reader>& reader) const = 0;

  /// Posts `request` and returns immediately with a handle that can cancel the exchange.
  virtual void SendRequestAsync(const SoapRequest& request, const Completion& completion,
                                Tarnik::Ref<Tarnik::Http::PendingRequestItem>& handle) const = 0;

 protected:
  ~TransportSession() = default;
};

/// Creates sessions. Thread-safe. Owned like a session.
class Transport {
 public:
  virtual std::shared_ptr<TransportSession> CreateSession() const = 0;

 protected:
  ~Transport() = default;
};

}  // namespace SsoClient

#endif
