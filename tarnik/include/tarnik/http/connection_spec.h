#ifndef TARNIK_HTTP_CONNECTION_SPEC_H
#define TARNIK_HTTP_CONNECTION_SPEC_H

#include <functional>
#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/cancellable_item.h>
#include <tarnik/system/stream.h>

namespace Tarnik::Http {

/// Defines where and how a user agent connects. Immutable; thread-safe.
class TARNIK_EXPORT ConnectionSpec : public virtual Object {};

/// A connection spec that opens its streams itself. The order of the virtual functions is part of
/// the binary interface.
class TARNIK_EXPORT CustomConnectionSpec : public ConnectionSpec {
 public:
  /// Receives the stream and null, or the exception; see `StartConnect`.
  using ConnectCompletion = std::function<void(System::Stream*, Exception*)>;

  /// The host of the service for the Host header.
  virtual std::string Host() const = 0;
  /// The host whose cookies are used.
  virtual std::string CookieHost() const = 0;
  /// "host:port". Names the endpoint in messages and distinguishes the connections of this spec.
  /// The port becomes part of the Host header, unless it is the default port of the scheme.
  virtual std::string EndpointKey() const = 0;
  /// True when requests go to a proxy and therefore contain the whole URL.
  virtual bool IsProxy() const = 0;
  /// Opens a stream. The completion runs once, on an I/O thread: with the stream and null, or with
  /// an exception, in which case a stream passed with it is closed.
  virtual Ref<System::CancellableItem> StartConnect(ConnectCompletion completion) = 0;
};

}  // namespace Tarnik::Http

#endif
