// Attempts that fail, at services that really fail so.
#include <chrono>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include "attempts/endpoint_fixture.h"

namespace SsoClient::Access {
namespace {

using namespace std::chrono_literals;
using SsoClient::Testing::kSecext;
using SsoClient::Testing::kTrust;
using SsoClient::Testing::TenMinutes;
using testing::EndsWith;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::StartsWith;

/// A TCP port of the loopback interface that nobody serves.
class Port {
 public:
  Port() : socket_(Socket()) {
    sockaddr_in address = Loopback();
    socklen_t size = sizeof address;
    auto* generic = reinterpret_cast<sockaddr*>(&address);
    if (bind(socket_, generic, size) != 0 || getsockname(socket_, generic, &size) != 0) {
      throw std::runtime_error("no port");
    }
    number_ = ntohs(address.sin_port);
  }
  ~Port() {
    for (const int queued : queued_) {
      close(queued);
    }
    close(socket_);
  }
  Port(const Port&) = delete;
  Port& operator=(const Port&) = delete;

  std::string Url() const { return "http://127.0.0.1:" + std::to_string(number_) + "/sts"; }

  /// Drops new connections from now on: the queue of those that wait to be accepted is full.
  void FillQueue() {
    listen(socket_, 0);
    const sockaddr_in address = [this] {
      sockaddr_in own = Loopback();
      own.sin_port = htons(number_);
      return own;
    }();
    for (int i = 0; i < 4; ++i) {
      queued_.push_back(Socket(SOCK_NONBLOCK));
      connect(queued_.back(), reinterpret_cast<const sockaddr*>(&address), sizeof address);
    }
  }

 private:
  static int Socket(int flags = 0) {
    return socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC | flags, 0);
  }
  static sockaddr_in Loopback() {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    return address;
  }

  const int socket_;
  std::uint16_t number_ = 0;
  std::vector<int> queued_;
};

DevSts::FaultAnswer Fault(const char* codeNamespace, const char* name, int status = 500) {
  DevSts::FaultAnswer fault;
  fault.codeNamespace = codeNamespace;
  fault.codeName = name;
  fault.faultString = "why";
  fault.httpStatus = status;
  return fault;
}

class AttemptFailureTest : public EndpointTest {
 protected:
  static void Misbehave(const DevSts::Misbehavior& misbehavior) {
    Sts().SetMisbehavior(misbehavior);
  }
  static void AnswerWith(const DevSts::FaultAnswer& fault) {
    DevSts::Misbehavior misbehavior;
    misbehavior.fault = fault;
    Misbehave(misbehavior);
  }
  static void AnswerWith(const DevSts::HttpAnswer& answer) {
    DevSts::Misbehavior misbehavior;
    misbehavior.httpAnswer = answer;
    Misbehave(misbehavior);
  }
  static void CutOff(DevSts::CutStyle style) {
    DevSts::Misbehavior misbehavior;
    misbehavior.cutOff = DevSts::CutOff{100, style};
    Misbehave(misbehavior);
  }
  static AttemptOutcome AttemptPlainly() { return AttemptAt(Config(), Sts().HttpUrl()); }
  static AttemptOutcome AttemptWithin(std::chrono::milliseconds time, const std::string& url) {
    const TokenSpec spec = TenMinutes();
    const std::string password = kPassword;
    const auto limit = Tarnik::Http::CreateCallLimit(std::chrono::steady_clock::now() + time);
    return CreateEndpointClient(Config(), {url, ""})
        ->Attempt({AttemptOperation::kLogin, spec, nullptr, password}, *limit);
  }
  static AttemptOutcome AttemptWith(const DevSts::TlsOptions& tls) {
    DevSts::ServerOptions options;
    options.tls = tls;
    const DevSts::Server server(options);
    return AttemptAt(ConfigFor(server), server.HttpsUrlFor("localhost"));
  }
};

TEST_F(AttemptFailureTest, ARefusedConnectionIsUnreachable) {
  const Port port;
  EXPECT_THAT(ExpectFailure<CommunicationException>(AttemptAt(Config(), port.Url()),
                                                    FailureKind::kUnreachable),
              HasSubstr("refused"));
}

TEST_F(AttemptFailureTest, AnUnknownHostIsUnreachable) {
  ExpectFailure<CommunicationException>(AttemptAt(Config(), "http://sts.invalid/sts"),
                                        FailureKind::kUnreachable);
}

TEST_F(AttemptFailureTest, AResetIsUnreachable) {
  CutOff(DevSts::CutStyle::Reset);
  ExpectFailure<CommunicationException>(AttemptPlainly(), FailureKind::kUnreachable);
}

TEST_F(AttemptFailureTest, CertificatesThatAreNotTrusted) {
  for (const auto certificate :
       {DevSts::ServerCertificate::Expired, DevSts::ServerCertificate::NotYetValid,
        DevSts::ServerCertificate::SelfSigned, DevSts::ServerCertificate::MissingIntermediate}) {
    DevSts::TlsOptions tls;
    tls.certificate = certificate;
    ExpectFailure<CommunicationException>(AttemptWith(tls), FailureKind::kTlsTrust);
  }
}

TEST_F(AttemptFailureTest, CertificatesForOtherNames) {
  for (const auto certificate :
       {DevSts::ServerCertificate::WrongHost, DevSts::ServerCertificate::NulInName}) {
    DevSts::TlsOptions tls;
    tls.certificate = certificate;
    ExpectFailure<CommunicationException>(AttemptWith(tls), FailureKind::kTlsName);
  }
}

TEST_F(AttemptFailureTest, OtherFailuresOfTls) {
  DevSts::TlsOptions old;
  old.protocol = DevSts::TlsProtocol::Tls11Only;
  ExpectFailure<CommunicationException>(AttemptWith(old), FailureKind::kTls);
  const std::string plainAsHttps = "https://127.0.0.1:" + std::to_string(Sts().HttpPort()) + "/sts";
  EXPECT_THAT(
      ExpectFailure<CommunicationException>(AttemptAt(Config(), plainAsHttps), FailureKind::kTls),
      StartsWith("TLS handshake with "));
}

TEST_F(AttemptFailureTest, ASilentServiceTimesOut) {
  DevSts::Misbehavior silent;
  silent.stall = DevSts::Stall::BeforeAnswer;
  Misbehave(silent);
  EXPECT_THAT(ExpectFailure<CommunicationException>(AttemptWithin(100ms, Sts().HttpUrl()),
                                                    FailureKind::kTimedOut),
              MatchesRegex("No answer from 127.0.0.1:[0-9]+ within [0-9]+ milliseconds: waiting "
                           "for the answer\\."));
}

TEST_F(AttemptFailureTest, AServiceThatDropsConnectionsTimesOut) {
  Port port;
  port.FillQueue();
  EXPECT_THAT(ExpectFailure<CommunicationException>(AttemptWithin(50ms, port.Url()),
                                                    FailureKind::kTimedOut),
              EndsWith(" milliseconds: waiting for the connection."));
}

TEST_F(AttemptFailureTest, AnAttemptAfterItsLimitTimesOut) {
  EXPECT_EQ(ExpectFailure<CommunicationException>(AttemptWithin(-1ms, Sts().HttpUrl()),
                                                  FailureKind::kTimedOut),
            "The time of the attempt is over.");
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(AttemptFailureTest, AnswersThatAreCutOff) {
  for (const auto style : {DevSts::CutStyle::Orderly, DevSts::CutStyle::WithoutNotice}) {
    CutOff(style);
    ExpectFailure<CommunicationException>(AttemptHere(), FailureKind::kCutOff);
    ExpectFailure<CommunicationException>(AttemptPlainly(), FailureKind::kCutOff);
  }
}

TEST_F(AttemptFailureTest, AStatusWithoutAFault) {
  AnswerWith(DevSts::HttpAnswer{503, "Busy", {{"Retry-After", "17"}}, "later"});
  const AttemptOutcome busy = AttemptHere();
  EXPECT_EQ(ExpectFailure<CommunicationException>(busy, FailureKind::kHttpStatus),
            "Server returned error: 503 Busy");
  EXPECT_EQ(busy.httpStatus, 503);
  EXPECT_EQ(busy.retryAfter, 17s);
  for (const char* body : {"", "down", "<html><body>down</body></html>"}) {
    AnswerWith(DevSts::HttpAnswer{500, "Internal Server Error", {}, body});
    const AttemptOutcome failed = AttemptHere();
    ExpectFailure<SsoException>(failed, FailureKind::kHttpStatus);
    EXPECT_EQ(failed.httpStatus, 500);
  }
}

TEST_F(AttemptFailureTest, FaultsAreDecisions) {
  for (const int status : {200, 500}) {
    AnswerWith(Fault(kTrust, "RequestFailed", status));
    const AttemptOutcome outcome = AttemptHere();
    EXPECT_THAT(ExpectFailure<SsoException>(outcome, FailureKind::kFault),
                StartsWith("Unexpected SOAP fault: "));
    EXPECT_EQ(outcome.httpStatus, status);
  }
}

TEST_F(AttemptFailureTest, FaultsWithAStatusThatTheClientDoesNotRead) {
  AnswerWith(Fault(kTrust, "RequestFailed", 400));
  EXPECT_EQ(ExpectFailure<CommunicationException>(AttemptHere(), FailureKind::kFault),
            "Server returned error: 400 Internal Server Error");
  for (const char* code : {"FailedAuthentication", "InvalidSecurityToken"}) {
    AnswerWith(Fault(kTrust, code, 403));
    ExpectFailure<CommunicationException>(AttemptHere(), FailureKind::kRefusedLogin);
  }
}

TEST_F(AttemptFailureTest, RefusalsWithCodesOfOtherNamespacesAreRefusedLogins) {
  constexpr char kSecurity[] =
      "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
  for (const char* codeNamespace : {kSecurity, "urn:other"}) {
    for (const int status : {200, 500}) {
      AnswerWith(Fault(codeNamespace, "FailedAuthentication", status));
      const AttemptOutcome outcome = AttemptHere();
      EXPECT_THAT(ExpectFailure<SsoException>(outcome, FailureKind::kRefusedLogin),
                  StartsWith("Unexpected SOAP fault: "));
      EXPECT_TRUE(outcome.isAuthenticationRefused);
    }
  }
  AnswerWith(DevSts::HttpAnswer{
      500,
      "Error",
      {},
      "<e:Envelope xmlns:e='http://schemas.xmlsoap.org/soap/envelope/'><e:Body><e:Fault>"
      "<faultcode>undeclared:FailedAuthentication</faultcode></e:Fault></e:Body></e:Envelope>"});
  ExpectFailure<ParseException>(AttemptHere(), FailureKind::kRefusedLogin);
}

TEST_F(AttemptFailureTest, WhiteSpaceAroundACodeDoesNotCount) {
  const std::string begin =
      "<e:Envelope xmlns:e='http://schemas.xmlsoap.org/soap/envelope/'><e:Body><e:Fault>"
      "<faultcode xmlns:f='";
  const std::string end = "\n</faultcode></e:Fault></e:Body></e:Envelope>";
  for (const char* code : {"'>\n\tf:FailedAuthentication ", "'>\r\n FailedAuthentication"}) {
    AnswerWith(DevSts::HttpAnswer{500, "Error", {}, begin + "urn:other" + code + end});
    const AttemptOutcome outcome = AttemptHere();
    EXPECT_EQ(outcome.kind, FailureKind::kRefusedLogin);
    EXPECT_TRUE(outcome.isAuthenticationRefused);
  }
  AnswerWith(
      DevSts::HttpAnswer{500, "Error", {}, begin + kTrust + "'>\n f:InvalidSecurityToken" + end});
  EXPECT_FALSE(AttemptHere().isAuthenticationRefused);
}

TEST_F(AttemptFailureTest, ARefusedTokenIsNotARefusedSecret) {
  for (const int status : {200, 403, 500}) {
    AnswerWith(Fault(kTrust, "InvalidSecurityToken", status));
    EXPECT_FALSE(AttemptHere().isAuthenticationRefused) << status;
    AnswerWith(Fault(kTrust, "FailedAuthentication", status));
    EXPECT_TRUE(AttemptHere().isAuthenticationRefused) << status;
  }
  AnswerWith(DevSts::HttpAnswer{401, "Unauthorized", {}, "who are you?"});
  EXPECT_TRUE(AttemptHere().isAuthenticationRefused);
}

TEST_F(AttemptFailureTest, AnUnauthorizedRequestIsARefusedLogin) {
  AnswerWith(DevSts::HttpAnswer{401, "Unauthorized", {}, "who are you?"});
  ExpectFailure<CommunicationException>(AttemptHere(), FailureKind::kRefusedLogin);
  AnswerWith(DevSts::HttpAnswer{403, "Forbidden", {}, "not here"});
  ExpectFailure<CommunicationException>(AttemptHere(), FailureKind::kHttpStatus);
}

TEST_F(AttemptFailureTest, RefusedLogins) {
  EXPECT_THAT(ExpectFailure<InvalidCredentialsException>(AttemptHere(TenMinutes(), "wrong"),
                                                         FailureKind::kRefusedLogin),
              StartsWith("Authentication failed"));
  TokenSourceConfig config = Config();
  config.login = PasswordLogin{"expired@EXAMPLE.COM", nullptr};
  ExpectFailure<PasswordExpiredException>(
      AttemptAt(config, Sts().HttpsUrl(), TenMinutes(), "expired-secret"),
      FailureKind::kExpiredPassword);
}

TEST_F(AttemptFailureTest, RecordsDoNotRepeatAPasswordThatTheServiceRepeats) {
  DevSts::FaultAnswer fault = Fault(kTrust, "FailedAuthentication");
  fault.faultString = "no user with 'hunter2',\n'hunter2'";
  AnswerWith(fault);
  EXPECT_EQ(AttemptHere(TenMinutes(), "hunter2").message,
            "Authentication failed: no user with '***',?'***'");
}

TEST_F(AttemptFailureTest, RecordsDoNotRepeatPasswordsOfAnySizeOrForm) {
  for (const std::size_t size : {2U, 7U, 300U, 65536U}) {
    std::string password;
    while (password.size() < size) {
      password += "&Q;7<\"#>'";
    }
    password.resize(size);
    std::string escaped;
    for (const char character : password) {
      escaped += "&#" + std::to_string(static_cast<int>(character)) + ";";
    }
    for (const std::string& form : {password, escaped}) {
      DevSts::FaultAnswer fault = Fault(kTrust, "FailedAuthentication");
      fault.faultString = "no user with [" + form + "]";
      AnswerWith(fault);
      const AttemptOutcome outcome = AttemptHere(TenMinutes(), password);
      EXPECT_EQ(outcome.message, "Authentication failed: no user with [***]") << size;
    }
    // The client cuts the reason of a status.
    AnswerWith(DevSts::HttpAnswer{503, password, {}, ""});
    const AttemptOutcome outcome = AttemptHere(TenMinutes(), password);
    EXPECT_EQ(outcome.message.find(password.substr(0, 4)), std::string::npos) << outcome.message;
  }
}

TEST_F(AttemptFailureTest, AnswersThatAreNotAsSpecified) {
  AnswerWith(DevSts::HttpAnswer{200, "OK", {}, "<html/>"});
  ExpectFailure<SsoException>(AttemptHere(), FailureKind::kBadAnswer);
  AnswerWith(DevSts::HttpAnswer{200, "OK", {}, "hello"});
  ExpectFailure<SsoException>(AttemptHere(), FailureKind::kBadAnswer);
  DevSts::Misbehavior raw;
  raw.rawAnswer = "HTTP/1.1 200 OK\r\nContent-Length: many\r\n\r\n";
  Misbehave(raw);
  ExpectFailure<CommunicationException>(AttemptHere(), FailureKind::kBadAnswer);
}

TEST_F(AttemptFailureTest, FaultsThatAreMalformedAreDecisions) {
  const std::string envelope =
      "<e:Envelope xmlns:e='http://schemas.xmlsoap.org/soap/envelope/'><e:Body><e:Fault>";
  const std::string end = "</e:Fault></e:Body></e:Envelope>";
  AnswerWith(DevSts::HttpAnswer{500, "Error", {}, envelope + "<faultstring>x</faultstring>" + end});
  ExpectFailure<SsoException>(AttemptHere(), FailureKind::kBadAnswer);
  AnswerWith(DevSts::HttpAnswer{500, "Error", {}, envelope + "<faultcode>x:y</faultcode>" + end});
  ExpectFailure<ParseException>(AttemptHere(), FailureKind::kBadAnswer);
}

TEST_F(AttemptFailureTest, TokensThatAreNotAccepted) {
  TokenSourceConfig config = Config();
  config.tokenFactory = CreateSamlTokenFactory(
      SsoClient::Testing::TrustSigner(Sts().StrangerCredential().certificatePem).get());
  ExpectFailure<InvalidSignatureException>(AttemptAt(config, Sts().HttpsUrl()),
                                           FailureKind::kBadToken);
  DevSts::AssertionOptions options;
  options.afterSigning = [](std::string& assertion) {
    assertion.replace(assertion.find("alice"), 5, "admin");
  };
  Sts().SetAssertionOptions(options);
  ExpectFailure<InvalidSignatureException>(AttemptHere(), FailureKind::kBadToken);
  Sts().SetAssertionOptions(SsoClient::Testing::ValidBetween(-2h, -1h));
  ExpectFailure<ParseException>(AttemptHere(), FailureKind::kBadToken);
}

TEST_F(AttemptFailureTest, ARequestThatCannotBeSentIsALocalFailure) {
  ExpectFailure<Tarnik::InvalidArgumentException>(AttemptHere(TokenSpec{}), FailureKind::kLocal);
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(AttemptFailureTest, ACancelledAttemptIsAbandonedAsync) {
  DevSts::Server server;
  DevSts::Misbehavior silent;
  silent.stall = DevSts::Stall::BeforeAnswer;
  server.SetMisbehavior(silent);
  const TokenSpec spec = TenMinutes();
  const std::string password = kPassword;
  const auto limit = AMinute();
  const auto client = CreateEndpointClient(ConfigFor(server), {server.HttpUrl(), ""});
  std::thread canceller([&server, limit] {
    EXPECT_TRUE(server.WaitUntil([](const DevSts::Counters& seen) { return seen.stalled == 1; }));
    limit->Cancel();
  });
  const AttemptOutcome underWay =
      client->Attempt({AttemptOperation::kLogin, spec, nullptr, password}, *limit);
  canceller.join();
  EXPECT_THAT(ExpectFailure<CommunicationException>(underWay, FailureKind::kAbandoned),
              EndsWith(" was cancelled."));
  ExpectFailure<CommunicationException>(
      client->Attempt({AttemptOperation::kLogin, spec, nullptr, password}, *limit),
      FailureKind::kAbandoned);
  EXPECT_EQ(server.GetCounters().requests, 1U);
}

}  // namespace
}  // namespace SsoClient::Access
