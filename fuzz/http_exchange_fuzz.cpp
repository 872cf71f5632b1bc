// The input determines two requests of an agent and the answers to them. What is written is exactly
// the requests, in a form that cannot be taken for others. Each exchange ends once: with the answer
// that the parser finds in the same bytes, or with a documented exception if it finds no answer. A
// connection is used again only if the answer allows it.
#include <algorithm>
#include <chrono>
#include <limits>
#include <optional>
#include <string>
#include <vector>

#include <fuzzer/FuzzedDataProvider.h>

#include <tarnik/core/exception.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_exception.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/ssl/ssl_context.h>

#include "fixed_clock.h"
#include "input.h"
#include "parsed_answer.h"
#include "single_thread.h"
#include "support/scripted_spec.h"
#include "written_request.h"

namespace {

using namespace Tarnik;
using Tarnik::Testing::ScriptedSpec;
using Tarnik::Testing::ScriptedStream;

std::string AnswerText(FuzzedDataProvider& input) {
  static const char* const kHeads[] = {
      "HTTP/1.1 200 OK\r\nContent-Length: 3\r\nSet-Cookie: a=b; Path=/\r\n\r\nabc",
      "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n2\r\nab\r\n0\r\n\r\n",
      "HTTP/1.1 100 Continue\r\n\r\nHTTP/1.1 500 No\r\nContent-Length: 0\r\n\r\n",
      "HTTP/1.1 200 OK\r\nConnection: close\r\n\r\nto the end",
      "HTTP/1.0 200 OK\r\nSet-Cookie: c=d; Max-Age=0\r\n\r\n",
      ""};
  return input.PickValueInArray(kHeads) + input.ConsumeRandomLengthString(60);
}

/// One exchange of the agent.
class Exchange {
 public:
  Exchange(FuzzedDataProvider& input, const std::string& answer) : answer_(answer) {
    const auto method = input.ConsumeBool() ? Http::Method::POST : Http::Method::GET;
    method_ = method == Http::Method::POST ? "POST" : "GET";
    target_ = "/" + input.ConsumeRandomLengthString(10);
    try {
      Http::CreateHttpRequest(method, target_, request_);
    } catch (const InvalidArgumentException&) {
      target_ = "/sts";
      Http::CreateHttpRequest(method, target_, request_);
    }
    for (int headers = input.ConsumeIntegralInRange(0, 3); headers > 0; --headers) {
      const std::string name =
          input.ConsumeBool() ? "SOAPAction" : input.ConsumeRandomLengthString(8);
      const std::string value = input.ConsumeRandomLengthString(12);
      try {
        request_->SetHeader(name, value);
        std::erase_if(headers_, [&](const auto& old) {
          return Fuzz::LowerCase(old.first) == Fuzz::LowerCase(name);
        });
        headers_.emplace_back(name, value);
      } catch (const InvalidArgumentException&) {
      }
    }
    body_ = input.ConsumeRandomLengthString(40);
    request_->BodyWriter()->Write(body_);
  }

  void Start(Http::UserAgent& agent, unsigned long timeout) {
    item_ = agent.SendAsync(
        request_.get(),
        [this](Exception* error, Http::ClientResponse* response, Http::PendingRequestItem*) {
          Fuzz::Require(++count_ == 1 && (error == nullptr) != (response == nullptr));
          if (response != nullptr) {
            result_ = Fuzz::AnswerOf(*response);
          }
          Fuzz::Require(error == nullptr || dynamic_cast<Http::HttpException*>(error) != nullptr ||
                        dynamic_cast<IOException*>(error) != nullptr ||
                        dynamic_cast<TimeoutException*>(error) != nullptr ||
                        dynamic_cast<CancelledException*>(error) != nullptr);
        },
        timeout);
  }

  /// What a caller that waits for the end receives.
  void CheckWait(Http::UserAgent& agent) {
    try {
      const auto response = agent.Wait(item_.get(), 0);
      Fuzz::Require(result_ && response->Status().code == result_->code);
    } catch (const Exception&) {
      Fuzz::Require(!result_);
    }
  }

  bool HasEnded() const { return count_ == 1; }
  void Cancel() { item_->Cancel(); }
  const std::string& AnswerBytes() const { return answer_; }
  const std::optional<Fuzz::ParsedAnswer>& Result() const { return result_; }

  void CheckWritten(std::string& wire, const std::string& host) const {
    const Fuzz::WrittenRequest written = Fuzz::TakeRequest(wire);
    Fuzz::Require(written.method == method_ && written.target == target_);
    Fuzz::Require(written.body == body_ && Fuzz::HeaderOf(written, "Host") == host);
    for (const auto& [name, value] : headers_) {
      Fuzz::Require(Fuzz::HeaderOf(written, name) == value);
    }
    const std::string cookies = Fuzz::HeaderOf(written, "Cookie").value_or("");
    Fuzz::Require(std::all_of(cookies.begin(), cookies.end(),
                              [](unsigned char c) { return c >= 0x20 && c != 0x7F; }));
  }

 private:
  const std::string answer_;
  std::string method_;
  std::string target_;
  std::string body_;
  std::vector<std::pair<std::string, std::string>> headers_;
  Ref<Http::ClientRequest> request_;
  Ref<Http::PendingRequestItem> item_;
  int count_ = 0;
  std::optional<Fuzz::ParsedAnswer> result_;
};

void RunAll() {
  while (Fuzz::RunCompletions()) {
  }
}

/// Sends the bytes of the answer and, if they are not enough, ends the connection.
void Finish(Exchange& exchange, ScriptedStream& stream, Http::CallLimit& limit,
            FuzzedDataProvider& input) {
  stream.Push(exchange.AnswerBytes());
  RunAll();
  const bool isPending = !exchange.HasEnded();
  const int ending = isPending ? input.ConsumeIntegralInRange(0, 2) : 0;
  if (isPending && ending == 0) {
    stream.PushEnd();
  } else if (ending == 1) {
    stream.PushError("reset");
  } else if (ending == 2) {
    limit.Cancel();
    exchange.Cancel();
  }
  RunAll();
  Fuzz::Require(exchange.HasEnded());
  const auto parsed = Fuzz::ParseAnswer(exchange.AnswerBytes(), isPending && ending == 0);
  Fuzz::Require(exchange.Result().has_value() == parsed.has_value());
  Fuzz::Require(!parsed || (parsed->code == exchange.Result()->code &&
                            parsed->body == exchange.Result()->body));
}

/// The spec cannot begin to connect.
void RequireRefused(Exchange& exchange, Http::UserAgent& agent) {
  bool isRefused = false;
  try {
    exchange.Start(agent, 0);
  } catch (const InvalidArgumentException&) {
    isRefused = true;
  }
  RunAll();
  Fuzz::Require(isRefused && !exchange.HasEnded());
}

/// The peer is silent in one of the stages, and the time of the exchange or of its limit passes.
void RequireTimeout(FuzzedDataProvider& input) {
  ScriptedSpec::Script script;
  const int stage = input.ConsumeIntegralInRange(0, 2);
  script.holdConnects = stage == 0;
  script.stream.holdWrites = stage == 1;
  const auto spec = MakeRef<ScriptedSpec>(script);
  auto agent = Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  const auto limit = Http::CreateCallLimit(Http::CallLimit::Clock::now() +
                                           std::chrono::milliseconds(input.ConsumeBool() ? 1 : 0));
  const bool isLimited = input.ConsumeBool();
  if (isLimited) {
    agent = Http::CreateBoundedUserAgent(agent.get(), limit.get());
  }
  Exchange exchange(input, "");
  constexpr unsigned long kMillisecond = 1000;
  exchange.Start(*agent, isLimited ? 0 : kMillisecond);
  while (!exchange.HasEnded()) {
    RunAll();
  }
  exchange.CheckWait(*agent);
  Fuzz::Require(!exchange.Result());
}

/// Nobody listens on the first port of this machine.
void RequireUnreachable(FuzzedDataProvider& input) {
  const auto context = Ssl::CreateSSLContext({});
  const auto spec = input.ConsumeBool() ? Http::CreateTLSConnectionSpec(
                                              "127.0.0.1", 1, context.get(), "sts.example")
                                        : Http::CreateTCPConnectionSpec("127.0.0.1", 1);
  const auto agent = Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  Exchange exchange(input, "");
  exchange.Start(*agent, 0);
  while (!exchange.HasEnded()) {
    RunAll();
  }
  Fuzz::Require(!exchange.Result());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  Fuzz::RunOnOneThread();
  Fuzz::FixClock(System::DateTime::Parse("2024-03-05T07:08:09Z"));
  FuzzedDataProvider input(data, size);
  const int kind = input.ConsumeIntegralInRange(0, 15);
  if (kind >= 14) {
    kind == 15 ? RequireUnreachable(input) : RequireTimeout(input);
    return 0;
  }
  ScriptedSpec::Script script;
  script.isTls = input.ConsumeBool();
  script.stream.pieceSize = input.ConsumeIntegralInRange<std::size_t>(1, 64);
  script.connectError = input.ConsumeIntegralInRange(0, 9) == 9 ? "refused" : "";
  script.startError = input.ConsumeIntegralInRange(0, 9) == 9 ? "not now" : "";
  script.stream.failWriteAt = input.ConsumeIntegralInRange(0, 9) == 9
                                  ? input.ConsumeIntegralInRange<std::size_t>(0, 200)
                                  : std::numeric_limits<std::size_t>::max();
  const auto spec = MakeRef<ScriptedSpec>(script);
  const auto cookies = Http::CreateCookieStore("");
  auto agent = Http::CreateHttpUserAgent(spec.get(), cookies.get(), nullptr);
  const auto limit = Http::CreateCallLimit(Http::CallLimit::Clock::time_point::max());
  if (input.ConsumeBool()) {
    agent = Http::CreateBoundedUserAgent(agent.get(), limit.get());
  }
  bool mayReuse = false;
  for (int exchanges = 0; exchanges < 2; ++exchanges) {
    Exchange exchange(input, AnswerText(input));
    const std::size_t before = spec->Streams().size();
    if (!script.startError.empty()) {
      RequireRefused(exchange, *agent);
      continue;
    }
    // Nothing takes that long.
    constexpr unsigned long kHour = 3'600'000'000;
    exchange.Start(*agent, input.ConsumeBool() ? kHour : 0);
    RunAll();
    // Before any answer it can only fail.
    if (!script.connectError.empty() || exchange.HasEnded()) {
      Fuzz::Require(exchange.HasEnded() && !exchange.Result());
      mayReuse = false;
      continue;
    }
    const bool isNew = spec->Streams().size() > before;
    Fuzz::Require(isNew || mayReuse);
    const auto stream = spec->Streams().back();
    std::string wire = stream->Written();
    if (!isNew) {
      Fuzz::TakeRequest(wire);
    }
    // The port of the endpoint is the default port of HTTPS.
    exchange.CheckWritten(wire, script.isTls ? "sts.example" : "sts.example:443");
    Fuzz::Require(wire.empty());
    Finish(exchange, *stream, *limit, input);
    exchange.CheckWait(*agent);
    const auto parsed = Fuzz::ParseAnswer(exchange.AnswerBytes(), false);
    mayReuse = isNew && parsed && parsed->mayBeFollowed;
  }
  return 0;
}
