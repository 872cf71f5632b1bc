#ifndef FUZZ_HTTP_CALL_PLAN_H
#define FUZZ_HTTP_CALL_PLAN_H

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/cookie_store.h>

#include "faulty_stream.h"
#include "support/scripted_spec.h"
#include "system/connect_stage.h"

namespace Fuzz {

/// What the lines of an input say about calls of a user agent; what follows the first empty line
/// is the answer of the peer. Other lines are skipped:
///   scenario NAME             see http_calls_fuzz.cpp
///   tls, proxy, bounded       the connections, the endpoint, the agent
///   host NAME, port NUMBER    of the endpoint
///   target TEXT, body SIZE    of the request
///   pieces SIZE               the most bytes of one read
///   count NUMBER              of calls at a time
///   endpoints NUMBER          that share one pool
///   limit MICROSECONDS        how long a call may take
///   holds connect|write|answer, stage look-up|connection|handshake    what a call waits for
///   cookies keep|fail|fail-memory|refuse     what the cookie store does
///   fault ...                 see faulty_stream.h
struct HttpCallPlan {
  explicit HttpCallPlan(std::string_view input);

  /// The script of a connection spec.
  Tarnik::Testing::ScriptedSpec::Script Script() const;
  std::string EndpointKey() const { return host + ":" + port; }
  /// What the Host header must be.
  std::string HostField() const;

  std::string scenario = "exchange";
  bool isTls = false;
  bool isProxy = false;
  bool isBounded = false;
  std::string host = "sts.example";
  std::string port = "443";
  std::string target = "/sts";
  std::size_t bodySize = 0;
  std::size_t pieceSize = 100'000;
  std::size_t count = 1;
  std::size_t endpoints = 1;
  unsigned long limit = 1000;
  std::string held = "answer";
  Tarnik::System::ConnectStage stage = Tarnik::System::ConnectStage::kConnection;
  std::string cookies = "keep";
  StreamFault fault;
  std::string answer;

 private:
  void Take(const Words& line);
};

/// A scripted spec whose streams have a fault and whose connects are in a stage.
class FaultySpec final : public Tarnik::Http::CustomConnectionSpec, public Tarnik::ObjectImpl {
 public:
  FaultySpec(Tarnik::Ref<Tarnik::Testing::ScriptedSpec> scripted, const HttpCallPlan& plan)
      : scripted_(std::move(scripted)), fault_(plan.fault), stage_(plan.stage) {}

  std::string Host() const override { return scripted_->Host(); }
  std::string CookieHost() const override { return scripted_->CookieHost(); }
  std::string EndpointKey() const override { return scripted_->EndpointKey(); }
  bool IsProxy() const override { return scripted_->IsProxy(); }
  Tarnik::Ref<Tarnik::System::CancellableItem> StartConnect(ConnectCompletion completion) override;

  /// Null before a connect; with TLS, streams are not wrapped.
  const Tarnik::Ref<FaultyStream>& Last() const { return last_; }

 private:
  const Tarnik::Ref<Tarnik::Testing::ScriptedSpec> scripted_;
  const StreamFault fault_;
  const Tarnik::System::ConnectStage stage_;
  Tarnik::Ref<FaultyStream> last_;
};

/// A cookie store that fails as the plan says.
class FaultyCookies final : public Tarnik::Http::CookieStore, public Tarnik::ObjectImpl {
 public:
  explicit FaultyCookies(std::string kind) : kind_(std::move(kind)) {}

  void Store(std::string_view host, std::string_view path, bool isSecure,
             std::string_view setCookie, const Tarnik::System::DateTime& now) override;
  std::string HeaderFor(std::string_view host, std::string_view path, bool isSecure,
                        const Tarnik::System::DateTime& now) override;

  /// Runs while a request is made.
  void OnRequest(std::function<void()> hook) { hook_ = std::move(hook); }
  bool HasFailed() const { return hasFailed_; }
  /// What the failure says.
  std::string FailureText() const { return kind_ == "fail-memory" ? "memory" : "a broken store"; }
  /// The host and the path of the latest request.
  const std::string& RequestedFor() const { return requestedFor_; }

 private:
  [[noreturn]] void Fail();

  const std::string kind_;
  std::function<void()> hook_;
  bool hasFailed_ = false;
  std::string requestedFor_;
};

}  // namespace Fuzz

#endif
