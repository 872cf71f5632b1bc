#ifndef TARNIK_HTTP_CONNECTION_SPEC_H
#define TARNIK_HTTP_CONNECTION_SPEC_H

#include <functional>
#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/cancellable_item.h>
#include <tarnik/system/stream.h>

namespace Tarnik::Http {

/// Where and how a user agent connects. Immutable; safe from many threads.
class TARNIK_EXPORT ConnectionSpec : public virtual Object {};

/// A connection spec that opens its streams itself. The order of the virtual functions is part of
/// the binary interface.
class TARNIK_EXPORT CustomConnectionSpec : public ConnectionSpec {
 public:
  using ConnectCompletion = std::function<void(System::Stream*, Exception*)>;

  /// The host of the service, as the Host header names it.
  virtual std::string Host() const = 0;
  /// The host that cookies belong to.
  virtual std::string CookieHost() const = 0;
  /// Names the place in messages and tells the connections of this spec apart: "host:port". The
  /// port becomes part of the Host header, unless it is the scheme's own.
  virtual std::string EndpointKey() const = 0;
  /// True when requests name the whole URL because they go to a proxy.
  virtual bool IsProxy() const = 0;
  /// Opens a stream. The completion runs once, on an I/O thread: with the stream and null, or with
  /// an exception that decides, whatever the stream.
  virtual Ref<System::CancellableItem> StartConnect(ConnectCompletion completion) = 0;
};

}  // namespace Tarnik::Http

#endif
