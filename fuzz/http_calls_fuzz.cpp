// The lines of an input describe calls of user agents to a peer in memory: how an endpoint is
// reached, in which order the answer arrives and the request is sent, what fails and when, and how
// long a call may take. A model says what is written, how each call ends and in which words, and
// which connections stay open. The lines are those of http_call_plan.h. The scenarios:
//   exchange     one call; the stream or the cookie store may fail
//   early        the answer arrives before the request is sent
//   late         a call is cancelled when its connection has been opened
//   inline       the connection is opened before the start of the connect returns
//   slow         the time of a call passes before the start of the connect returns
//   no-stream    the connection is opened without a stream
//   interleaved  the answer arrives on an idle connection while the next request is made
//   timeout      the peer is silent and the time of a call passes
//   wait         the same for a caller that waits
//   many         more calls at a time than connections may stay idle
//   misuse       calls that cannot be made
#include <algorithm>
#include <chrono>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_user_agent.h>

#include "fixed_clock.h"
#include "host_model.h"
#include "http_call.h"
#include "http_call_plan.h"
#include "input.h"
#include "parsed_answer.h"
#include "single_thread.h"

namespace {

using namespace Tarnik;
using Fuzz::HttpCallPlan;
using Fuzz::RunAll;
using Tarnik::Testing::ScriptedSpec;
using Tarnik::Testing::ScriptedStream;
using Call = Fuzz::HttpCall;
using Setting = Fuzz::HttpCallSetting;

template <class Refusal, class Action>
void RequireThrows(const Action& act) {
  bool isThrown = false;
  try {
    act();
  } catch (const Refusal&) {
    isThrown = true;
  }
  Fuzz::Require(isThrown);
}

// How many bytes of the answer have arrived before the read that ends instead.
std::size_t SizeBefore(const HttpCallPlan& plan) {
  const auto reads = static_cast<std::size_t>(plan.fault.operation) - 1;
  return std::min(plan.answer.size(), reads * plan.pieceSize);
}

// How a call ends whose peer has sent everything and has closed its side.
void RequireExchanged(const HttpCallPlan& plan, const Setting& setting, const Call& call) {
  if (setting.HasFaulted() && plan.fault.kind == Fuzz::StreamFault::Kind::kEnds) {
    call.RequireEnd(Fuzz::ParseAnswer(plan.answer.substr(0, SizeBefore(plan)), true));
  } else if (setting.HasFaulted() && call.HasFailed()) {
    Fuzz::Require(call.Says(setting.spec->Last()->FaultText()) && setting.Stream().IsClosed());
  } else if (setting.cookies->HasFailed()) {
    Fuzz::Require(call.HasFailed() && call.Says(setting.cookies->FailureText()));
    Fuzz::Require(setting.Stream().IsClosed());
  } else {
    // A fault that has not ended the call is one of the watch over the idle connection.
    call.RequireEnd(Fuzz::ParseAnswer(plan.answer, !setting.HasFaulted()));
  }
}

void Exchange(const HttpCallPlan& plan) {
  const Setting setting(plan);
  Call call;
  call.Start(*setting.agent, plan);
  RunAll();
  std::string wire = setting.Stream().Written();
  if (setting.cookies->HasFailed()) {
    Fuzz::Require(wire.empty());
  } else if (!setting.HasFaulted()) {
    Fuzz::RequireWritten(wire, plan, setting);
    Fuzz::Require(wire.empty() && !call.HasEnded());
  }
  setting.Stream().Push(plan.answer);
  RunAll();
  if (!call.HasEnded()) {
    setting.Stream().PushEnd();
    RunAll();
  }
  RequireExchanged(plan, setting, call);
}

void Early(const HttpCallPlan& plan) {
  auto script = plan.Script();
  script.stream.holdWrites = true;
  const Setting setting(plan, script);
  Call call;
  call.Start(*setting.agent, plan);
  RunAll();
  setting.Stream().Push(plan.answer);
  RunAll();
  const auto answer = Fuzz::ParseAnswer(plan.answer, false);
  // Nothing more of the request is sent to a peer that closes.
  Fuzz::Require(!answer || call.HasEnded() != answer->mayBeFollowed);
  if (!answer) {
    setting.Stream().PushEnd();
    RunAll();
    call.RequireEnd(Fuzz::ParseAnswer(plan.answer, true));
    return;
  }
  if (plan.isTls) {
    setting.Stream().Close();  // the rest of the request is not sent
  } else if (!call.HasEnded()) {
    setting.Stream().ReleaseWrite();
  }
  RunAll();
  call.RequireEnd(answer);
  Fuzz::Require(setting.Stream().IsClosed() == (plan.isTls || !answer->mayBeFollowed));
}

void Late(const HttpCallPlan& plan) {
  auto script = plan.Script();
  script.holdConnects = true;
  const Setting setting(plan, script);
  Call call;
  call.Start(*setting.agent, plan);
  RunAll();
  Fuzz::Require(!call.HasEnded());
  setting.scripted->ReleaseConnect();
  if (plan.isBounded) {
    setting.limit->Cancel();
  } else {
    Fuzz::Require(call.Item()->Cancel() && !call.Item()->Cancel());
  }
  RunAll();
  Fuzz::Require(call.IsCancelled());
  Fuzz::Require(setting.Stream().IsClosed() && setting.Stream().Written().empty());
}

void Inline(const HttpCallPlan& plan) {
  auto script = plan.Script();
  script.beforeStartReturns = RunAll;
  const Setting setting(plan, script);
  Call call;
  call.Start(*setting.agent, plan);
  setting.Stream().Push(plan.answer);
  RunAll();
  if (!call.HasEnded()) {
    setting.Stream().PushEnd();
    RunAll();
  }
  call.RequireEnd(Fuzz::ParseAnswer(plan.answer, true));
  Fuzz::Require(setting.scripted->CancelCount() == 0);
}

// As messages have it.
std::string LimitText(unsigned long microseconds) {
  return microseconds % 1000 == 0 ? std::to_string(microseconds / 1000) + " milliseconds"
                                  : std::to_string(microseconds) + " microseconds";
}

std::string ConnectText(const HttpCallPlan& plan) {
  switch (plan.stage) {
    case System::ConnectStage::kLookUp:
      return "the host look-up";
    case System::ConnectStage::kConnection:
      return "the connection";
    default:
      return "the TLS handshake";
  }
}

// What a call waits for in the end.
std::string StageText(const HttpCallPlan& plan) {
  if (plan.held == "connect") {
    return ConnectText(plan);
  }
  return plan.held == "write" ? "the request to be sent" : "the answer";
}

std::string TimeoutText(const HttpCallPlan& plan, const std::string& stage) {
  return "No answer from " + plan.EndpointKey() + " within " + LimitText(plan.limit) +
         ": waiting for " + stage + ".";
}

void RequireTimeout(const HttpCallPlan& plan, const Call& call, const std::string& stage) {
  Fuzz::Require(call.IsTimeout() && call.Failure() == TimeoutText(plan, stage));
}

void Slow(const HttpCallPlan& plan) {
  auto script = plan.Script();
  script.holdConnects = true;
  Call call;
  script.beforeStartReturns = [&call] {
    while (!call.HasEnded()) {
      RunAll();
    }
  };
  const Setting setting(plan, script);
  call.Start(*setting.agent, plan, plan.limit);
  RunAll();
  RequireTimeout(plan, call, "the connection");
  Fuzz::Require(setting.scripted->CancelCount() == 1);
}

void NoStream(const HttpCallPlan& plan) {
  auto script = plan.Script();
  script.omitsStream = true;
  const Setting setting(plan, script);
  Call call;
  call.Start(*setting.agent, plan);
  RunAll();
  Fuzz::Require(call.HasFailed() && call.Failure() == "The connection to " + plan.EndpointKey() +
                                                          " was opened without a stream.");
}

void Interleaved(const HttpCallPlan& plan) {
  const Setting setting(plan);
  const std::string first = "HTTP/1.1 204 First\r\n\r\n";
  Call calls[2];
  calls[0].Start(*setting.agent, plan);
  RunAll();
  setting.Stream().Push(first);
  RunAll();
  calls[0].RequireEnd(Fuzz::ParseAnswer(first, false));
  setting.cookies->OnRequest([&] {
    setting.Stream().Push(plan.answer);
    RunAll();
  });
  calls[1].Start(*setting.agent, plan);
  RunAll();
  if (!calls[1].HasEnded()) {
    setting.Stream().PushEnd();
    RunAll();
  }
  Fuzz::Require(setting.scripted->ConnectCount() == 1);
  calls[1].RequireEnd(Fuzz::ParseAnswer(plan.answer, true));
}

void Timeout(const HttpCallPlan& plan) {
  const Setting setting(plan);
  Call call;
  call.Start(*setting.agent, plan, plan.limit);
  while (!call.HasEnded()) {
    RunAll();
  }
  // The time may pass before the call has come to its last stage.
  const bool isEarly =
      plan.held != "connect" && (call.Failure() == TimeoutText(plan, ConnectText(plan)) ||
                                 call.Failure() == TimeoutText(plan, "the request to be sent"));
  Fuzz::Require(call.IsTimeout());
  Fuzz::Require(isEarly || call.Failure() == TimeoutText(plan, StageText(plan)));
}

void Wait(const HttpCallPlan& plan) {
  const Setting setting(plan);
  Call call;
  call.Start(*setting.agent, plan);
  RunAll();
  std::string failure;
  Fuzz::RunCompletionsDuring([&] {
    try {
      setting.agent->Wait(call.Item(), plan.limit);
    } catch (const TimeoutException& error) {
      failure = error.Message();
    }
  });
  RequireTimeout(plan, call, StageText(plan));
  Fuzz::Require(failure == call.Failure());
}

/// The idle connections that http_user_agent.h describes: at most 8 to one endpoint, 64 in total.
class IdleModel {
 public:
  void Put(std::size_t endpoint, Ref<ScriptedStream> stream) {
    const auto isSame = [&](const auto& each) { return each.first == endpoint; };
    if (std::count_if(idle_.begin(), idle_.end(), isSame) == 8) {
      idle_.erase(std::find_if(idle_.begin(), idle_.end(), isSame));
    } else if (idle_.size() == 64) {
      idle_.erase(idle_.begin());
    }
    idle_.emplace_back(endpoint, std::move(stream));
  }
  bool Has(const ScriptedStream* stream) const {
    return std::any_of(idle_.begin(), idle_.end(),
                       [&](const auto& each) { return each.second.get() == stream; });
  }

 private:
  std::vector<std::pair<std::size_t, Ref<ScriptedStream>>> idle_;  // the oldest first
};

// Starts the calls to one endpoint at a time and then answers them.
void CallEndpoint(const HttpCallPlan& plan, const Setting& setting) {
  std::vector<Call> calls(plan.count);
  for (Call& call : calls) {
    call.Start(*setting.agent, plan);
  }
  RunAll();
  for (const auto& stream : setting.scripted->Streams()) {
    stream->Push(plan.answer);
    RunAll();
  }
  const auto answer = Fuzz::ParseAnswer(plan.answer, false);
  for (const auto& stream : setting.scripted->Streams()) {
    if (!answer) {
      stream->PushEnd();
    }
  }
  RunAll();
  for (const Call& call : calls) {
    call.RequireEnd(answer ? answer : Fuzz::ParseAnswer(plan.answer, true));
  }
}

void Many(const HttpCallPlan& plan) {
  auto pool = Http::CreateConnectionPool();
  const auto answer = Fuzz::ParseAnswer(plan.answer, false);
  IdleModel idle;
  std::vector<std::unique_ptr<Setting>> settings;
  std::vector<Ref<ScriptedStream>> streams;
  for (std::size_t i = 0; i < plan.endpoints; ++i) {
    settings.push_back(std::make_unique<Setting>(plan, plan.Script(), pool.get()));
    CallEndpoint(plan, *settings.back());
    for (const auto& stream : settings.back()->scripted->Streams()) {
      streams.push_back(stream);
      if (answer && answer->mayBeFollowed) {
        idle.Put(i, stream);
      }
    }
  }
  for (const auto& stream : streams) {
    Fuzz::Require(stream->IsClosed() != idle.Has(stream.get()));
  }
  settings.clear();
  pool = nullptr;
  Fuzz::Require(std::all_of(streams.begin(), streams.end(),
                            [](const auto& stream) { return stream->IsClosed(); }));
}

void Misuse(const HttpCallPlan& plan) {
  const Setting setting(plan);
  const auto unused = [](Exception*, Http::ClientResponse*, Http::PendingRequestItem*) {
    Fuzz::Require(false);
  };
  Ref<Http::ClientRequest> request = Fuzz::RequestOf(plan);
  RequireThrows<InvalidArgumentException>([&] { setting.agent->SendAsync(nullptr, unused, 0); });
  RequireThrows<InvalidArgumentException>([&] { setting.agent->SendAsync(request.get(), {}, 0); });
  RequireThrows<InvalidArgumentException>(
      [&] { Http::CreateBoundedUserAgent(nullptr, setting.limit.get()); });
  RequireThrows<InvalidArgumentException>(
      [&] { Http::CreateBoundedUserAgent(setting.agent.get(), nullptr); });
  RequireThrows<InvalidArgumentException>(
      [&] { Http::CreateHttpRequest(Http::Method::GET, "", request); });
  for (const char* owned :
       {"host", "Content-Length", "transfer-encoding", "CONNECTION", "Cookie"}) {
    RequireThrows<InvalidArgumentException>([&] { request->SetHeader(owned, "x"); });
  }
  Fuzz::Require(setting.limit->Deadline() == Http::CallLimit::Clock::time_point::max());
  Fuzz::Require(setting.limit->ToString() == "<CallLimit>");
  RunAll();
  Fuzz::Require(setting.scripted->ConnectCount() == 0);
  // Sent once, it cannot be sent again.
  const auto ignored = [](Exception*, Http::ClientResponse*, Http::PendingRequestItem*) {};
  const auto item = setting.agent->SendAsync(request.get(), ignored, 0);
  RequireThrows<InvalidStateException>([&] { setting.agent->SendAsync(request.get(), unused, 0); });
  item->Cancel();
  RunAll();
}

// No call can be made to such an endpoint.
void RequireRefused(const HttpCallPlan& plan) {
  const Setting setting(plan);
  Call call;
  RequireThrows<InvalidArgumentException>([&] { call.Start(*setting.agent, plan); });
  RunAll();
  Fuzz::Require(!call.HasEnded() && setting.scripted->ConnectCount() == 0);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  static const std::map<std::string, void (*)(const HttpCallPlan&)> scenarios = {
      {"exchange", Exchange},
      {"early", Early},
      {"late", Late},
      {"inline", Inline},
      {"slow", Slow},
      {"no-stream", NoStream},
      {"interleaved", Interleaved},
      {"timeout", Timeout},
      {"wait", Wait},
      {"many", Many},
      {"misuse", Misuse}};
  Fuzz::RunOnOneThread();
  Fuzz::FixClock(System::DateTime::Parse("2024-03-05T07:08:09Z"));
  HttpCallPlan plan(Fuzz::TextOf(data, size));
  const auto scenario = scenarios.find(plan.scenario);
  if (scenario == scenarios.end()) {
    return 0;
  }
  if (!Fuzz::IsHostToCall(plan.host)) {
    RequireRefused(plan);
    return 0;
  }
  // Where the peer's answer counts, the request and the streams are sound.
  const bool isFaulty = scenario->second == Exchange;
  const bool isSilent = scenario->second == Timeout || scenario->second == Wait;
  if (!isFaulty) {
    plan.fault = {};
    plan.cookies = "keep";
  }
  if (!isSilent) {
    plan.held = "answer";
  }
  scenario->second(plan);
  return 0;
}
