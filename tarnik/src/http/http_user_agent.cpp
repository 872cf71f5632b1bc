#include <memory>
#include <string>
#include <string_view>
#include <utility>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/http/http_user_agent.h>

#include "http/exchange.h"
#include "http/http_request_impl.h"
#include "http/idle_connections.h"
#include "system/host_name.h"

namespace Tarnik::Http {
namespace {

class ConnectionPoolImpl final : public ConnectionPool, public ObjectImpl {
 public:
  ConnectionPoolImpl() : idle_(std::make_shared<IdleConnections>()) {}

  /// Weak, since an exchange may outlive the pool.
  std::weak_ptr<IdleConnections> Idle() const noexcept { return idle_; }

 private:
  ~ConnectionPoolImpl() override = default;

  const std::shared_ptr<IdleConnections> idle_;
};

bool IsHost(std::string_view host) noexcept {
  return System::IsDnsName(host) || System::IsIPv4Address(host) || System::IsIPv6Address(host);
}

class UserAgentImpl final : public UserAgent, public ObjectImpl {
 public:
  UserAgentImpl(Ref<CustomConnectionSpec> spec, Ref<CookieStore> cookies,
                Ref<ConnectionPoolImpl> pool)
      : spec_(std::move(spec)), cookies_(std::move(cookies)), pool_(std::move(pool)) {}

  Ref<PendingRequestItem> SendAsync(ClientRequest* request, Completion completion,
                                    unsigned long timeoutMicroseconds) override {
    if (request == nullptr) {
      throw InvalidArgumentException("The HTTP request is null.");
    }
    if (!completion) {
      throw InvalidArgumentException("The completion of an HTTP request is empty.");
    }
    const std::string host = spec_->Host();
    // The host becomes part of the request (RFC 9110, section 7.2).
    if (!IsHost(host)) {
      throw InvalidArgumentException("The host to connect to is neither a name nor an address.");
    }
    const Ref<ClientRequestImpl> ownRequest(CheckedCast<ClientRequestImpl>(request));
    ownRequest->MarkSent();
    const auto exchange = MakeRef<Exchange>(Exchange::Parts{{spec_, spec_->EndpointKey()},
                                                            host,
                                                            spec_->CookieHost(),
                                                            spec_->IsProxy(),
                                                            cookies_,
                                                            pool_->Idle(),
                                                            ownRequest,
                                                            std::move(completion)});
    exchange->Start(timeoutMicroseconds);
    return exchange;
  }

  Ref<ClientResponse> Wait(PendingRequestItem* item, unsigned long timeoutMicroseconds) override {
    const Ref<Exchange> exchange(CheckedCast<Exchange>(item));
    return exchange->Wait(timeoutMicroseconds);
  }

 private:
  ~UserAgentImpl() override = default;

  const Ref<CustomConnectionSpec> spec_;
  const Ref<CookieStore> cookies_;
  const Ref<ConnectionPoolImpl> pool_;
};

}  // namespace

Ref<ConnectionPool> CreateConnectionPool() {
  return MakeRef<ConnectionPoolImpl>();
}

Ref<UserAgent> CreateHttpUserAgent(ConnectionSpec* spec, CookieStore* cookies,
                                   ConnectionPool* pool) {
  const Ref<CustomConnectionSpec> customSpec(CheckedCast<CustomConnectionSpec>(spec));
  const Ref<ConnectionPoolImpl> ownPool =
      pool == nullptr ? MakeRef<ConnectionPoolImpl>()
                      : Ref<ConnectionPoolImpl>(CheckedCast<ConnectionPoolImpl>(pool));
  return MakeRef<UserAgentImpl>(customSpec, Ref<CookieStore>(cookies), ownPool);
}

}  // namespace Tarnik::Http
