#include "http_call.h"

#include <algorithm>
#include <utility>

#include <tarnik/core/exception.h>

#include "input.h"
#include "single_thread.h"
#include "written_request.h"

namespace Fuzz {
namespace {

using namespace Tarnik;
using Tarnik::Testing::ScriptedSpec;
using Tarnik::Testing::ScriptedStream;

// The path of a target in any form (RFC 9112, section 3.2).
std::string PathOf(const std::string& target) {
  if (target.front() == '/') {
    return target;
  }
  const std::size_t scheme = target.find("://");
  const std::size_t path =
      scheme == std::string::npos ? std::string::npos : target.find('/', scheme + 3);
  return path == std::string::npos ? "/" : target.substr(path);
}

}  // namespace

void RunAll() {
  while (RunCompletions()) {
  }
}

Ref<Http::ClientRequest> RequestOf(const HttpCallPlan& plan) {
  Ref<Http::ClientRequest> request;
  try {
    Http::CreateHttpRequest(Http::Method::POST, plan.target, request);
  } catch (const InvalidArgumentException&) {
    Http::CreateHttpRequest(Http::Method::POST, "/sts", request);
  }
  request->BodyWriter()->Write(std::string(plan.bodySize, 'b'));
  return request;
}

void HttpCall::Start(Http::UserAgent& agent, const HttpCallPlan& plan, unsigned long limit) {
  item_ = agent.SendAsync(
      RequestOf(plan).get(),
      [this](Exception* error, Http::ClientResponse* response, Http::PendingRequestItem*) {
        Require(++count_ == 1 && (error == nullptr) != (response == nullptr));
        if (response != nullptr) {
          result_ = AnswerOf(*response);
          return;
        }
        failure_ = error->Message();
        isTimeout_ = dynamic_cast<TimeoutException*>(error) != nullptr;
        isCancelled_ = dynamic_cast<CancelledException*>(error) != nullptr;
      },
      limit);
}

void HttpCall::RequireEnd(const std::optional<ParsedAnswer>& expected) const {
  Require(HasEnded() && result_.has_value() == expected.has_value());
  Require(!expected || (expected->code == result_->code && expected->body == result_->body));
}

HttpCallSetting::HttpCallSetting(const HttpCallPlan& plan) : HttpCallSetting(plan, plan.Script()) {}

HttpCallSetting::HttpCallSetting(const HttpCallPlan& plan, ScriptedSpec::Script script,
                                 Http::ConnectionPool* pool)
    : scripted(MakeRef<ScriptedSpec>(std::move(script))),
      spec(MakeRef<FaultySpec>(scripted, plan)),
      cookies(MakeRef<FaultyCookies>(plan.cookies)),
      limit(Http::CreateCallLimit(Http::CallLimit::Clock::time_point::max())),
      agent(Http::CreateHttpUserAgent(spec.get(), cookies.get(), pool)) {
  if (plan.isBounded) {
    agent = Http::CreateBoundedUserAgent(agent.get(), limit.get());
  }
}

ScriptedStream& HttpCallSetting::Stream() const {
  Require(!scripted->Streams().empty());
  return *scripted->Streams().back();
}

void RequireWritten(std::string& wire, const HttpCallPlan& plan, const HttpCallSetting& setting) {
  const WrittenRequest written = TakeRequest(wire);
  const bool isTarget =
      !plan.target.empty() && std::all_of(plan.target.begin(), plan.target.end(),
                                          [](char c) { return c > 0x20 && c < 0x7F; });
  const std::string target = isTarget ? plan.target : "/sts";
  const std::string origin = (plan.isTls ? "https://" : "http://") + plan.HostField();
  Require(written.method == "POST");
  Require(written.target == (plan.isProxy && target.front() == '/' ? origin + target : target));
  Require(HeaderOf(written, "Host") == plan.HostField());
  Require(HeaderOf(written, "Cookie") == "a=b");
  Require(setting.cookies->RequestedFor() == "cookies.example" + PathOf(target));
  Require(written.body == std::string(plan.bodySize, 'b'));
}

}  // namespace Fuzz
