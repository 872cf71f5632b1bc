#include "calls/recorded_calls.h"

#include <string>
#include <string_view>
#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/core/writer.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/http_request.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/system/date_time.h>

#include "transport/sso_connection_specs.h"

namespace SsoClient::Testing {
namespace {

void Log(std::string line) {
  Recorded().log.push_back(std::move(line));
}

std::string Endpoint(const std::string& host, int port, bool flag) {
  return host + ":" + std::to_string(port) + (flag ? ", flag set" : ", flag not set");
}

class IdleSpec final : public Tarnik::Http::ConnectionSpec, public Tarnik::ObjectImpl {};

class EmptyCookieStore final : public Tarnik::Http::CookieStore, public Tarnik::ObjectImpl {
 public:
  void Store(std::string_view, std::string_view, bool, std::string_view,
             const Tarnik::System::DateTime&) override {}
  std::string HeaderFor(std::string_view, std::string_view, bool,
                        const Tarnik::System::DateTime&) override {
    return {};
  }
};

class RecordingWriter final : public Tarnik::Writer, public Tarnik::ObjectImpl {
 public:
  void Write(std::string_view text) override { Log("body: " + std::string(text)); }
};

class RecordingRequest final : public Tarnik::Http::ClientRequest, public Tarnik::ObjectImpl {
 public:
  void SetHeader(const std::string& name, const std::string& value) override {
    Log(name + ": " + value);
  }
  Tarnik::Ref<Tarnik::Writer> BodyWriter() override { return Tarnik::MakeRef<RecordingWriter>(); }
};

}  // namespace

void RecordingSocket::ConnectAsync(const std::string& host, int port, ConnectCompletion connected) {
  Log("connect to " + host + ":" + std::to_string(port));
  completion = std::move(connected);
}

void RecordingSocket::Close() noexcept {
  Log("close");
}

RecordedCalls& Recorded() {
  static RecordedCalls calls;
  return calls;
}

void ForgetCalls() {
  Recorded() = RecordedCalls();
}

}  // namespace SsoClient::Testing

// The functions below replace those of the libraries, because the linker finds them first.

namespace SsoClient {

using Testing::Recorded;

void CreateSsoConnectionSpec(const std::string& host, int port, bool flag,
                             Tarnik::Ref<Tarnik::Http::ConnectionSpec>& spec) {
  Testing::Log("plain spec: " + Testing::Endpoint(host, port, flag));
  spec = Recorded().lastSpec = Tarnik::MakeRef<Testing::IdleSpec>();
}

void CreateSsoSSLConnectionSpec(const std::string& host, int port,
                                Tarnik::Ssl::SSLContext* sslContext, const std::string& serverName,
                                bool flag, Tarnik::Ref<Tarnik::Http::ConnectionSpec>& spec) {
  Testing::Log("TLS spec: " + Testing::Endpoint(host, port, flag) + ", peer '" + serverName + "'");
  Recorded().lastSslContext = sslContext;
  spec = Recorded().lastSpec = Tarnik::MakeRef<Testing::IdleSpec>();
}

}  // namespace SsoClient

namespace Tarnik::Http {

using SsoClient::Testing::Recorded;

Ref<CookieStore> CreateCookieStore(const std::string& name) {
  SsoClient::Testing::Log("cookie store '" + name + "'");
  return Recorded().lastCookies = MakeRef<SsoClient::Testing::EmptyCookieStore>();
}

Ref<UserAgent> CreateHttpUserAgent(ConnectionSpec* spec, CookieStore* cookies,
                                   ConnectionPool* pool) {
  SsoClient::Testing::Log(
      std::string("user agent:") +
      (spec == Recorded().lastSpec.get() ? " the spec," : " another spec,") +
      (cookies == Recorded().lastCookies.get() ? " the cookie store," : " other cookies,") +
      (pool == nullptr ? " no pool" : " a pool"));
  return Recorded().agents.emplace_back(MakeRef<SsoClient::Testing::FakeUserAgent>());
}

void CreateHttpRequest(Method method, const std::string& target, Ref<ClientRequest>& request) {
  SsoClient::Testing::Log((method == Method::POST ? "POST " : "other method ") + target);
  request = MakeRef<SsoClient::Testing::RecordingRequest>();
}

}  // namespace Tarnik::Http

namespace Tarnik::System {

Ref<TCPClientSocket> CreateTCPClientSocket(ThreadPool* pool) {
  SsoClient::Testing::Log(pool == GetThreadPool().get() ? "socket of the pool" : "other socket");
  return SsoClient::Testing::Recorded().lastSocket = MakeRef<SsoClient::Testing::RecordingSocket>();
}

DateTime GetUtcDateTime() {
  constexpr long kSecond = 1'000'000;
  const long first = DateTime::Parse(SsoClient::Testing::kFirstReading).GetUtcTime();
  return DateTimeFromUtc(first + kSecond * SsoClient::Testing::Recorded().clockReadings++, false);
}

}  // namespace Tarnik::System
