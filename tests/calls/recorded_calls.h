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

/// The calls since the last `ForgetCalls`. This program replaces the functions that create specs,
/// cookie stores, user agents, requests and sockets and the one that reads the clock. The objects
/// they create only record what they are given, and each reading advances the clock by a second.
/// For one thread at a time.
struct RecordedCalls {
  /// One line per call, with its arguments.
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

/// The result of the first reading of the clock.
inline constexpr char kFirstReading[] = "2024-03-05T07:08:09.010Z";

}  // namespace SsoClient::Testing

#endif
