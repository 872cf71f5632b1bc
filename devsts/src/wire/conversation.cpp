#include "wire/conversation.h"

#include <algorithm>
#include <chrono>

namespace DevSts {

void Conversation::Run() {
  if (!Begin()) {
    return;
  }
  while (ServeOne()) {
  }
}

bool Conversation::Begin() {
  const Stall stall = parts_.plan.TakeForConnection();
  if (stall == Stall::BeforeTlsHandshake) {
    StallHere();
    return false;
  }
  const bool done = connection_.Handshake();
  if (connection_.OverTls()) {
    parts_.observation.Count([&](Counters& counters) {
      ++(done ? counters.handshakesDone : counters.handshakesFailed);
      counters.handshakesResumed += done && connection_.SessionReused() ? 1 : 0;
    });
  }
  if (done && stall == Stall::BeforeRequest) {
    StallHere();
    return false;
  }
  return done;
}

bool Conversation::ServeOne() {
  ReceivedRequest request;
  bool keepAlive = false;
  const HttpReader::Outcome outcome = reader_.Next(request, keepAlive);
  if (outcome == HttpReader::Outcome::Malformed) {
    parts_.observation.Count([](Counters& counters) { ++counters.malformedRequests; });
  }
  if (outcome != HttpReader::Outcome::Request) {
    return false;
  }
  Describe(request);
  const Misbehavior misbehavior = parts_.plan.TakeForRequest();
  const Time now = Now() + misbehavior.clockOffset;
  const SoapReply reply = Decide(request, misbehavior, now);
  const WireAnswer wire =
      MakeWireAnswer(reply, misbehavior, keepAlive, std::chrono::system_clock::to_time_t(now));
  Record(request, reply, wire, misbehavior);
  return Delay(misbehavior.delayBeforeAnswer) && Send(wire, misbehavior);
}

SoapReply Conversation::Decide(const ReceivedRequest& request, const Misbehavior& misbehavior,
                               Time now) const {
  if (misbehavior.rawAnswer || misbehavior.httpAnswer) {
    return {};
  }
  if (misbehavior.fault) {
    return Service::AnswerFault(*misbehavior.fault);
  }
  return parts_.service.Answer(request, misbehavior.leg, now);
}

void Conversation::Describe(ReceivedRequest& request) {
  request.connectionId = id_;
  request.ordinalOnConnection = ++ordinal_;
  request.overTls = connection_.OverTls();
  request.tlsSessionReused = connection_.SessionReused();
  request.tlsVersion = connection_.TlsVersion();
  request.serverName = connection_.ServerName();
  request.peerCertificatePem = connection_.PeerCertificatePem();
}

void Conversation::Record(ReceivedRequest& request, const SoapReply& reply, const WireAnswer& wire,
                          const Misbehavior& misbehavior) {
  request.signature = reply.signature;
  request.leg = reply.leg;
  request.answeredStatus = wire.status;
  request.answeredFault = reply.faultString;
  if (parts_.onRequest) {
    parts_.onRequest(request);
  }
  parts_.observation.Add(request, [&](Counters& counters) {
    ++counters.requests;
    counters.tokensIssued += reply.holdsToken ? 1 : 0;
    counters.faults += reply.isFault ? 1 : 0;
    counters.negotiations += request.leg && request.leg->ordinal == 1 ? 1 : 0;
    counters.negotiationLegs += request.leg && request.leg->ordinal > 0 ? 1 : 0;
    counters.negotiatedTokens += request.leg && reply.holdsToken ? 1 : 0;
    counters.delayed += misbehavior.delayBeforeAnswer.count() > 0 ? 1 : 0;
  });
}

void Conversation::StallHere() {
  parts_.observation.Count([](Counters& counters) {
    ++counters.stalls;
    ++counters.stalled;
  });
  connection_.WaitForEnd(std::nullopt);
  parts_.observation.Count([](Counters& counters) { --counters.stalled; });
}

bool Conversation::Delay(std::chrono::milliseconds time) {
  if (time.count() <= 0) {
    return true;
  }
  const bool ended = connection_.WaitForEnd(time);
  parts_.observation.Count([](Counters& counters) { --counters.delayed; });
  return !ended;
}

bool Conversation::Send(const WireAnswer& wire, const Misbehavior& misbehavior) {
  const std::size_t size = wire.octets.size();
  const std::size_t end =
      misbehavior.cutOff ? std::min(size, misbehavior.cutOff->afterBytes) : size;
  std::optional<std::size_t> stallAt;
  if (misbehavior.stall == Stall::BeforeAnswer) {
    stallAt = 0;
  }
  if (misbehavior.stall == Stall::AfterHeaders) {
    stallAt = wire.headSize;
  }
  if (misbehavior.stall == Stall::InMidBody) {
    stallAt = wire.headSize + (size - wire.headSize) / 2;
  }
  const bool stalls = stallAt && *stallAt <= end;
  const std::string_view octets(wire.octets.data(), stalls ? *stallAt : end);
  if (!SendPaced(octets, misbehavior.drip)) {
    return false;
  }
  if (stalls) {
    StallHere();
    return false;
  }
  if (misbehavior.cutOff) {
    connection_.Finish(misbehavior.cutOff->style);
    return false;
  }
  if (wire.closes) {
    connection_.Finish(CutStyle::Orderly);
  }
  return !wire.closes;
}

bool Conversation::SendPaced(std::string_view octets, const std::optional<Drip>& drip) {
  if (!drip) {
    return connection_.Write(octets);
  }
  const std::size_t step = std::max<std::size_t>(1, drip->bytes);
  for (std::size_t at = 0; at < octets.size(); at += step) {
    if (!connection_.Write(octets.substr(at, step)) || connection_.WaitForEnd(drip->interval)) {
      return false;
    }
  }
  return true;
}

}  // namespace DevSts
