#include "end_to_end/situations.h"

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdio>
#include <fstream>
#include <thread>
#include <utility>

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>

#include "end_to_end/silent_resolver.h"
#include "integration/holder_of_key_fixture.h"
#include "support/dead_listener.h"
#include "support/loopback.h"

namespace SsoClient::Access::Testing {

namespace {

using namespace std::chrono_literals;

constexpr std::size_t kMoreThanSocketsBuffer = std::size_t{512} << 10;

TokenSourceConfig PasswordLoginAt(const std::string& url) {
  TokenSourceConfig config = Trusting({});
  config.endpoints = {{url, ""}};
  return config;
}

std::string LoopbackUrl(int port) {
  return "http://127.0.0.1:" + std::to_string(port) + "/sts";
}

/// A connection of this machine to a port of the loopback interface, as in /proc/net/tcp (proc(5)).
struct Connection {
  enum State { kEstablished = 1, kUnanswered = 2 };
  int state = 0;
  long unsent = 0;
};

std::vector<Connection> ConnectionsTo(int port) {
  std::vector<Connection> connections;
  std::ifstream table("/proc/net/tcp");
  for (std::string line; std::getline(table, line);) {
    unsigned peer = 0;
    unsigned peerPort = 0;
    unsigned state = 0;
    unsigned long unsent = 0;
    if (std::sscanf(line.c_str(), " %*d: %*8X:%*4X %8X:%4X %2X %8lX", &peer, &peerPort, &state,
                    &unsent) == 4 &&
        peer == htonl(INADDR_LOOPBACK) && peerPort == static_cast<unsigned>(port)) {
      connections.push_back({static_cast<int>(state), static_cast<long>(unsent)});
    }
  }
  return connections;
}

std::ptrdiff_t UnansweredConnections(int port) {
  const auto connections = ConnectionsTo(port);
  return std::count_if(connections.begin(), connections.end(), [](const Connection& connection) {
    return connection.state == Connection::kUnanswered;
  });
}

template <class Condition>
bool AwaitCondition(const Condition& condition) {
  const auto limit = std::chrono::steady_clock::now() + 1min;
  while (!condition()) {
    if (std::chrono::steady_clock::now() > limit) {
      return false;
    }
    std::this_thread::yield();
  }
  return true;
}

/// A dev STS that is silent at some point.
class SilentSts : public Situation {
 public:
  explicit SilentSts(DevSts::Stall stall, bool isTls = true) : isTls_(isTls) {
    sts_.SetMisbehavior(Stalling(stall));
  }

  TokenSourceConfig Config() override {
    TokenSourceConfig config = Trusting({&sts_});
    config.endpoints = {{isTls_ ? sts_.HttpsUrl() : sts_.HttpUrl(), ""}};
    return config;
  }
  bool Await(const TokenSource& /*source*/, const AwaitingListener& /*listener*/) override {
    return sts_.WaitUntil([](const auto& seen) { return seen.stalled == 1; }, 1min);
  }
  bool AwaitNothingLeft() override {
    return sts_.WaitUntil([](const auto& seen) { return seen.connectionsOpen == 0; }, 1min);
  }

 protected:
  DevSts::Server sts_;

 private:
  const bool isTls_;
};

/// A peer that reads nothing, and whose buffer is small. So is that of the sender, since it is in
/// proportion to the largest segment, which is that of a small network instead of 64 KiB.
class LargeRequest final : public Situation {
 public:
  LargeRequest() {
    const int buffer = 4096;
    setsockopt(listener_.Get(), SOL_SOCKET, SO_RCVBUF, &buffer, sizeof buffer);
    const int segment = 536;
    setsockopt(listener_.Get(), IPPROTO_TCP, TCP_MAXSEG, &segment, sizeof segment);
  }

  TokenSourceConfig Config() override { return PasswordLoginAt(LoopbackUrl(listener_.Port())); }
  TokenSpec Spec() const override {
    TokenSpec spec = Situation::Spec();
    spec.advice.push_back({"test", {{"text", {std::string(kMoreThanSocketsBuffer, 'x')}}}});
    return spec;
  }
  bool Await(const TokenSource& /*source*/, const AwaitingListener& /*listener*/) override {
    return AwaitCondition([this] { return HasConnection(true); });
  }
  bool AwaitNothingLeft() override {
    return AwaitCondition([this] { return !HasConnection(false); });
  }

 private:
  bool HasConnection(bool isWriting) const {
    const auto connections = ConnectionsTo(listener_.Port());
    return std::any_of(connections.begin(), connections.end(), [&](const Connection& connection) {
      return connection.state == Connection::kEstablished && (!isWriting || connection.unsent > 0);
    });
  }

  const Tarnik::Testing::LoopbackListener listener_;
};

class DrippingAnswer final : public SilentSts {
 public:
  DrippingAnswer() : SilentSts(DevSts::Stall::None) {
    DevSts::Misbehavior slow;
    slow.drip = DevSts::Drip{1, 20ms};
    sts_.SetMisbehavior(slow);
  }

  bool Await(const TokenSource& /*source*/, const AwaitingListener& /*listener*/) override {
    return sts_.WaitUntil([](const auto& seen) { return seen.requests == 1; }, 1min);
  }
};

/// Another caller waits for an answer.
class AnotherCaller : public SilentSts {
 public:
  explicit AnotherCaller(TokenSpec spec)
      : SilentSts(DevSts::Stall::BeforeAnswer), spec_(std::move(spec)) {}

  void Prepare(TokenSource& source) override {
    other_.Begin(source, spec_);
    EXPECT_TRUE(SilentSts::Await(source, {}));
  }
  bool Await(const TokenSource& source, const AwaitingListener& /*listener*/) override {
    AwaitCallers(source, 2);
    return true;
  }
  // The other caller still waits.
  bool AwaitNothingLeft() override {
    return other_.Reported() == 0 && sts_.GetCounters().connectionsOpen == 1;
  }

 private:
  const TokenSpec spec_;
  TokenCalls other_;
};

/// Another caller has the only place for an attempt.
class Turn final : public AnotherCaller {
 public:
  Turn() : AnotherCaller(SpecFor("https://stock.example.com")) {}

  TokenSourceConfig Config() override {
    TokenSourceConfig config = BoundConfigFor({&sts_});
    config.login = CertificateLogin{};
    config.retry.attemptsAtOnce = 1;
    return config;
  }
  // Logins wait for each other until one has been accepted.
  void Prepare(TokenSource& source) override {
    sts_.RegisterCertificate(SsoClient::Testing::kMachine,
                             SsoClient::Testing::Holder().certificatePem);
    sts_.ClearMisbehavior();
    EXPECT_NE(Get(source, SpecFor("https://bills.example.com")).token, nullptr);
    sts_.SetMisbehavior(Stalling(DevSts::Stall::BeforeAnswer));
    AnotherCaller::Prepare(source);
  }
};

/// The source of the token to exchange waits for an answer.
class BaseOfAnotherSource final : public SilentSts {
 public:
  BaseOfAnotherSource() : SilentSts(DevSts::Stall::BeforeAnswer) {}

  TokenSourceConfig Config() override {
    TokenSourceConfig config = BoundConfigFor({&sts_});
    TokenSourceConfig base = BoundConfigFor({&sts_});
    base.login = CertificateLogin{};
    config.login = TokenLogin{CreateTokenSource(base), SpecFor("https://base.example.com")};
    return config;
  }
};

class PauseBetweenAttempts final : public Situation {
 public:
  TokenSourceConfig Config() override {
    TokenSourceConfig config = PasswordLoginAt(LoopbackUrl(port_));
    // The pause is random, and at least half of this.
    config.retry.firstDelay = config.retry.longestDelay = std::chrono::hours(1000);
    return config;
  }
  bool Await(const TokenSource& /*source*/, const AwaitingListener& listener) override {
    return listener.Await([](const Records& seen) { return seen.ended.size() == 1; });
  }

 private:
  Tarnik::Testing::Descriptor holder_;
  const int port_ = Tarnik::Testing::RefusingPort(holder_);
};

class LookUp final : public Situation {
 public:
  TokenSourceConfig Config() override {
    return PasswordLoginAt("http://" + std::string(SilentResolver::kSilentHost) + "/sts");
  }
  bool Await(const TokenSource& /*source*/, const AwaitingListener& /*listener*/) override {
    return resolver_.Await(1);
  }

 private:
  const SilentResolver resolver_;
};

class UnansweredConnect final : public Situation {
 public:
  TokenSourceConfig Config() override { return PasswordLoginAt(LoopbackUrl(dead_.Port())); }
  bool Await(const TokenSource& /*source*/, const AwaitingListener& /*listener*/) override {
    return AwaitCondition([this] { return UnansweredConnections(dead_.Port()) > fillers_; });
  }
  bool AwaitNothingLeft() override {
    return AwaitCondition([this] { return UnansweredConnections(dead_.Port()) == fillers_; });
  }

 private:
  const Tarnik::Testing::DeadListener dead_;
  const std::ptrdiff_t fillers_ = UnansweredConnections(dead_.Port());
};

class SlowLoginFunction final : public Situation {
 public:
  ~SlowLoginFunction() override { gate_->Open(); }

  TokenSourceConfig Config() override {
    TokenSourceConfig config = PasswordLoginAt(LoopbackUrl(1));
    config.login = PasswordLogin{kUser, [gate = gate_] {
                                   gate->Pass();
                                   return std::string(kPassword);
                                 }};
    return config;
  }
  bool Await(const TokenSource& /*source*/, const AwaitingListener& /*listener*/) override {
    return gate_->Await(1);
  }
  bool AwaitNothingLeft() override {
    gate_->Open();
    return true;
  }

 private:
  const std::shared_ptr<Gate> gate_ = std::make_shared<Gate>();
};

class SlowHandlerFunction final : public Situation {
 public:
  ~SlowHandlerFunction() override { gate_->Open(); }

  TokenSourceConfig Config() override {
    TokenSourceConfig config = PasswordLoginAt(LoopbackUrl(1));
    config.login = NegotiatedLogin{[gate = gate_](const Endpoint&) {
      gate->Pass();
      return std::shared_ptr<NegotiationHandler>();
    }};
    return config;
  }
  bool Await(const TokenSource& /*source*/, const AwaitingListener& /*listener*/) override {
    return gate_->Await(1);
  }
  bool AwaitNothingLeft() override {
    gate_->Open();
    return true;
  }

 private:
  const std::shared_ptr<Gate> gate_ = std::make_shared<Gate>();
};

template <class Kind, class... Arguments>
std::function<std::unique_ptr<Situation>()> Makes(Arguments... arguments) {
  return [arguments...] { return std::make_unique<Kind>(arguments...); };
}

}  // namespace

std::ostream& operator<<(std::ostream& stream, const Stage& stage) {
  return stream << stage.name;
}

std::vector<Stage> AllStages() {
  return {
      {"RequestOfAnother", "the request of another call, which was waiting for the answer of ",
       Makes<AnotherCaller>(SpecFor("https://orders.example.com"))},
      {"LoginOfAnother", "the login of another call.",
       Makes<AnotherCaller>(SpecFor("https://stock.example.com"))},
      {"Turn", "its turn, since as many attempts as may be are under way.", Makes<Turn>()},
      {"BaseOfAnotherSource", "the token to exchange.", Makes<BaseOfAnotherSource>()},
      {"LoginFunction", "the login's function.", Makes<SlowLoginFunction>()},
      {"HandlerFunction", "the attempt at ", Makes<SlowHandlerFunction>()},
      {"Pause", "the next attempt. The last attempt had failed: ", Makes<PauseBetweenAttempts>()},
      {"LookUp", "the look-up of the host of ", Makes<LookUp>()},
      {"Connect", "the connection to ", Makes<UnansweredConnect>()},
      {"Handshake", "the TLS handshake with ", Makes<SilentSts>(DevSts::Stall::BeforeTlsHandshake)},
      {"Writing", "the request to be sent to ", Makes<LargeRequest>()},
      {"Answer", "the answer of ", Makes<SilentSts>(DevSts::Stall::BeforeAnswer)},
      {"AnswerWithoutTls", "the answer of ", Makes<SilentSts>(DevSts::Stall::BeforeAnswer, false)},
      {"Body", "the rest of the answer of ", Makes<SilentSts>(DevSts::Stall::InMidBody)},
      {"Drip", "the rest of the answer of ", Makes<DrippingAnswer>()},
  };
}

}  // namespace SsoClient::Access::Testing
