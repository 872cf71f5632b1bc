#ifndef SSOCLIENT_TESTS_CALLS_RECORDED_CALLS_H
#define SSOCLIENT_TESTS_CALLS_RECORDED_CALLS_H

#include <cstddef>
#include <string>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/system/tcp_client_socket.h>

#include "transport/fake_http.h"

namespace SsoClient::Testing {

/// Keeps the completion of its connect and never calls it.
class RecordingSocket final : public Tarnik::System::TCPClientSocket, public Tarnik::ObjectImpl {
 public:
  void ConnectAsync(const std::string& host, int port, ConnectCompletion connected) override;
  void ReadAsync(char*, std::size_t, ReadCompletion) override {}
  void WriteAsync(const char*, std::size_t, WriteCompletion) override {}
  void Close() noexcept override;

  ConnectCompletion completion;
};

/// What was called since the last `ForgetCalls`. This program has functions of its own in place of
/// those that make specs, cookie stores, user agents, requests and sockets and that read the clock:
/// what they make does nothing but tell what it is given, and each reading puts the clock on by a
/// second. For one thread at a time.
struct RecordedCalls {
  /// One line a call, with its arguments.
  std::vector<std::string> log;
  std::vector<Tarnik::Ref<FakeUserAgent>> agents;
  Tarnik::Ref<Tarnik::Http::ConnectionSpec> lastSpec;
  Tarnik::Ref<Tarnik::Http::CookieStore> lastCookies;
  Tarnik::Ssl::SSLContext* lastSslContext = nullptr;
  Tarnik::Ref<RecordingSocket> lastSocket;
  int clockReadings = 0;
};

RecordedCalls& Recorded();
void ForgetCalls();

/// What the first reading of the clock gives.
inline constexpr char kFirstReading[] = "2024-03-05T07:08:09.010Z";

}  // namespace SsoClient::Testing

#endif
