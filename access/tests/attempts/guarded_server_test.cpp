// The example of a server that accepts callers by their tokens.
#include <cerrno>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <netinet/in.h>
#include <signal.h>
#include <sys/socket.h>
#include <sys/time.h>

#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_response.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/text/base64.h>

#include "guarded_server_process.h"
#include "integration/holder_of_key_fixture.h"
#include "support/child_process.h"
#include "support/holder_of_key.h"
#include "support/loopback.h"
#include "support/temporary_file.h"

namespace SsoClient::Access {
namespace {

using SsoClient::Testing::ConfigOf;
using SsoClient::Testing::Holder;
using SsoClient::Testing::Stranger;
using Testing::GuardedServerProcess;
using testing::HasSubstr;
using testing::StartsWith;

constexpr char kOwnName[] = "https://orders.example.com";
/// A time limit, in milliseconds, that does not end a connection during a test.
constexpr char kTenMinutes[] = "600000";
constexpr char kIssuer[] = "https://sts.example.com/STS";
constexpr char kAlice[] = "alice@EXAMPLE.COM\n";
constexpr char kInvalid[] = "Bearer error=\"invalid_token\"";
constexpr char kMalformed[] = "Bearer error=\"invalid_request\"";

struct Answer {
  int status = 0;
  std::string challenge;
  std::string body;
};

struct Message {
  std::string authorization;
  std::string body;
};

std::string Base64(const std::string& text) {
  const auto* const bytes = reinterpret_cast<const unsigned char*>(text.data());
  std::string result(Tarnik::Base64_EncodedLength(bytes, text.size()), '\0');
  std::size_t written = 0;
  Tarnik::Base64_Encode(bytes, text.size(), result.data(), result.size(), &written);
  return result;
}

/// In the alphabet for URLs, without padding.
std::string Base64Url(const std::string& text) {
  std::string result = Base64(text);
  result.resize(result.find_last_not_of('=') + 1);
  for (char& c : result) {
    c = c == '+' ? '-' : c == '/' ? '_' : c;
  }
  return result;
}

Message InHeader(const std::string& token) {
  return {"Bearer " + Base64(token), ""};
}

Message InMessage(const std::string& security, const std::string& declarations = "") {
  return {"", "<e:Envelope xmlns:e=\"http://schemas.xmlsoap.org/soap/envelope/\"" + declarations +
                  "><e:Header><w:Security xmlns:w=\"" + SsoClient::Testing::kSecext + "\">" +
                  security + "</w:Security></e:Header><e:Body/></e:Envelope>"};
}

const DevSts::Credential& ServerIdentity() {
  static const DevSts::Credential identity = [] {
    DevSts::CertificateSpec spec;
    spec.commonName = "guarded server";
    spec.addresses = {"127.0.0.1"};
    return DevSts::MakeCertificate(spec);
  }();
  return identity;
}

Tarnik::Ref<Tarnik::Http::UserAgent> MakeAgent(int port, const DevSts::Credential* sender) {
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caCertificates = Tarnik::Crypto::CreateCertificatesFromPem(ServerIdentity().certificatePem);
  if (sender != nullptr) {
    tls.clientCertificate = ConfigOf(*sender).certificate;
    tls.clientPrivateKey = ConfigOf(*sender).privateKey;
  }
  const auto context = Tarnik::Ssl::CreateSSLContext(tls);
  const auto spec = Tarnik::Http::CreateTLSConnectionSpec("127.0.0.1", port, context.get(), "");
  return Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
}

Answer Ask(Tarnik::Http::UserAgent& agent, const Message& message) {
  using Tarnik::Http::Method;
  Tarnik::Ref<Tarnik::Http::ClientRequest> request;
  CreateHttpRequest(message.body.empty() ? Method::GET : Method::POST, "/", request);
  if (!message.authorization.empty()) {
    request->SetHeader("Authorization", message.authorization);
  }
  if (!message.body.empty()) {
    request->SetHeader("Content-Type", "text/xml; charset=utf-8");
    request->BodyWriter()->Write(message.body);
  }
  const auto pending = agent.SendAsync(
      request.get(), [](auto&&...) {}, 30'000'000);
  const auto response = agent.Wait(pending.get(), 0);
  std::string body(1024, '\0');
  body.resize(response->Body()->Read(body.data(), body.size()));
  return {response->Status().code, response->Header("WWW-Authenticate").value_or(""), body};
}

/// A TCP connection without TLS.
class RawConnection {
 public:
  explicit RawConnection(int port) : socket_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(static_cast<std::uint16_t>(port));
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    const int result =
        connect(socket_.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof address);
    EXPECT_EQ(result, 0) << "cannot connect";
  }
  void Send(const std::string& bytes) { Tarnik::Testing::SendAll(socket_.Get(), bytes); }
  /// Waits until the server closes the connection; false after half a minute.
  bool IsClosedByServer() {
    const timeval limit{30, 0};
    setsockopt(socket_.Get(), SOL_SOCKET, SO_RCVTIMEO, &limit, sizeof limit);
    char bytes[512];
    ssize_t count = 0;
    while ((count = recv(socket_.Get(), bytes, sizeof bytes, 0)) > 0) {
    }
    return count == 0 || errno == ECONNRESET;
  }
  void Reset() {
    Tarnik::Testing::ResetOnClose(socket_.Get());
    socket_.Close();
  }

 private:
  Tarnik::Testing::Descriptor socket_;
};

class GuardedServerThreadTest : public SsoClient::Testing::HolderOfKeyTest {
 protected:
  void SetUp() override {
    if (!EXAMPLES_GUARDED_SERVER) {
      GTEST_SKIP() << "The example needs Boost.Beast.";
    }
  }
  GuardedServerProcess& Server(const std::string& bearer = "refuse",
                               const std::vector<std::string>& more = {}) {
    std::vector<std::string> arguments = {certificate_, key_, kIssuer, trust_, kOwnName, bearer};
    arguments.insert(arguments.end(), more.begin(), more.end());
    return server_.emplace(arguments);
  }
  Answer Send(const Message& message, const DevSts::Credential* sender = &Holder()) {
    return Ask(*MakeAgent(server_->Port(), sender), message);
  }
  /// The server's answer to what is no request, by another client.
  std::string SendText(const std::string& text) {
    return Tarnik::Testing::RunInShell(Client() + " <" + folder_.Write("text", text)).output;
  }
  /// The command of a client that sends its input, and prints the answer until the server closes
  /// the connection.
  std::string Client() const {
    return "openssl s_client -quiet -connect 127.0.0.1:" + std::to_string(server_->Port()) +
           " 2>&1";
  }
  std::string HolderToken() const {
    TokenSpec spec = SsoClient::Testing::TenMinutes();
    spec.audienceRestriction = {kOwnName};
    return AcquireBound(spec)->Xml();
  }
  std::string BearerToken() const {
    TokenSpec spec = SsoClient::Testing::Bearer();
    spec.audienceRestriction = {kOwnName};
    return Acquire(spec)->Xml();
  }
  void ReplaceTrust(const std::string& content) const {
    std::filesystem::rename(folder_.Write("new", content), trust_);
  }

  const Tarnik::Testing::TemporaryFolder folder_;
  const std::string certificate_ = folder_.Write("server.pem", ServerIdentity().certificatePem);
  const std::string key_ = folder_.Write("server-key.pem", ServerIdentity().privateKeyPem);
  const std::string trust_ = folder_.Write("signing.pem", Sts().SigningCertificatePem());
  std::optional<GuardedServerProcess> server_;
};

TEST_F(GuardedServerThreadTest, AcceptsATokenFromItsOwner) {
  Server();
  const std::string token = HolderToken();
  const auto agent = MakeAgent(server_->Port(), &Holder());
  // Several requests on one connection
  for (const std::string& text : {Base64(token), Base64Url(token)}) {
    const Answer answer = Ask(*agent, {"bearer " + text, ""});
    EXPECT_EQ(answer.status, 200);
    EXPECT_EQ(answer.body, kAlice);
  }
}

TEST_F(GuardedServerThreadTest, RefusesATokenFromSomebodyElse) {
  Server();
  const std::string token = HolderToken();
  for (const DevSts::Credential* sender :
       {&Stranger(), static_cast<const DevSts::Credential*>(nullptr)}) {
    const Answer answer = Send(InHeader(token), sender);
    EXPECT_EQ(answer.status, 401);
    EXPECT_EQ(answer.challenge, kInvalid);
    EXPECT_EQ(answer.body, "");
  }
  server_->AwaitInLog(": refused (wrong-proof): ");
  const std::string log = server_->AwaitInLog(": refused (no-proof): ");
  EXPECT_THAT(log, HasSubstr("\n127.0.0.1:"));
  EXPECT_THAT(log, HasSubstr("\n  possession: failed: "));
  EXPECT_EQ(log.find("<saml2"), std::string::npos) << "the log contains a token";
  EXPECT_EQ(Send(InHeader(token)).status, 200);
}

TEST_F(GuardedServerThreadTest, AcceptsBearerTokensByOption) {
  const std::string token = BearerToken();
  Server("refuse");
  EXPECT_EQ(Send(InHeader(token)).challenge, kInvalid);
  server_->AwaitInLog(": refused (bearer-refused): ");
  Server("accept");
  EXPECT_EQ(Send(InHeader(token), nullptr).body, kAlice);
}

TEST_F(GuardedServerThreadTest, AcceptsATokenInASecurityHeader) {
  Server();
  const std::string token = HolderToken();
  EXPECT_EQ(Send(InMessage(token)).body, kAlice);
  EXPECT_EQ(Send(InMessage(token), &Stranger()).challenge, kInvalid);

  // A namespace that only a value uses is declared by the message.
  const std::string declaration = " xmlns:xs=\"http://www.w3.org/2001/XMLSchema\"";
  std::string inheriting = token;
  ASSERT_THAT(inheriting, HasSubstr(declaration));
  inheriting.erase(inheriting.find(declaration), declaration.size());
  EXPECT_EQ(Send(InMessage(inheriting, declaration)).body, kAlice);
}

TEST_F(GuardedServerThreadTest, RefusesRequestsWithoutOneToken) {
  Server();
  const std::string token = HolderToken();
  EXPECT_EQ(Send({}).challenge, "Bearer");
  EXPECT_EQ(Send(InMessage("")).challenge, "Bearer");
  Message both = InMessage(token);
  both.authorization = InHeader(token).authorization;
  for (const Message& message :
       {both, InMessage(token + token), Message{"", "<e:Envelope"}, Message{"Basic YTpi", ""},
        Message{"Bearer " + Base64(token) + "!", ""},
        Message{"Bearer " + Base64(token) + "=", ""}}) {
    const Answer answer = Send(message);
    EXPECT_EQ(answer.status, 400);
    EXPECT_EQ(answer.challenge, kMalformed);
  }
  EXPECT_EQ(Send({"Bearer " + Base64("no token"), ""}).challenge, kInvalid);
}

TEST_F(GuardedServerThreadTest, FollowsTheTrustedCertificates) {
  Server();
  const std::string token = HolderToken();
  EXPECT_EQ(Send(InHeader(token)).status, 200);
  const auto begin = std::chrono::steady_clock::now();
  ReplaceTrust(Stranger().certificatePem);
  server_->AwaitInLog("the trust is that of the files: 1 signer, 1 added, 1 removed");
  EXPECT_EQ(Send(InHeader(token)).challenge, kInvalid);
  server_->AwaitInLog(": refused (unknown-signer): ");
  // Within a second, unless the machine is busy.
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(5));
}

TEST_F(GuardedServerThreadTest, ReadsTheTrustedCertificatesAfterASignal) {
  Server();
  const std::string token = HolderToken();
  ReplaceTrust("neither a certificate nor anything else");
  server_->Signal(SIGHUP);
  server_->AwaitInLog("the trust stays as it was: ");
  EXPECT_EQ(Send(InHeader(token)).status, 200);
  ReplaceTrust(Stranger().certificatePem);
  server_->Signal(SIGHUP);
  server_->AwaitInLog("the trust was read");
  EXPECT_EQ(Send(InHeader(token)).challenge, kInvalid);
}

TEST_F(GuardedServerThreadTest, SurvivesGarbage) {
  Server();
  for (const std::string& garbage :
       {std::string("GET / HTTP/1.1\r\nHost: a\r\n\r\n"), std::string("\x16\x03\x01\xff\xff"),
        std::string(70'000, 'x')}) {
    RawConnection connection(server_->Port());
    connection.Send(garbage);
    connection.Reset();
  }
  RawConnection plain(server_->Port());
  plain.Send("GET / HTTP/1.1\r\nHost: a\r\n\r\n");
  EXPECT_TRUE(plain.IsClosedByServer());
  EXPECT_THAT(SendText("garbage\r\n\r\n"), HasSubstr("HTTP/1.1 400 "));
  EXPECT_THAT(SendText("GET / HTTP/1.1\r\nAuthorization: Bearer " + std::string(70'000, 'a')),
              HasSubstr("HTTP/1.1 431 "));
  EXPECT_THAT(SendText("POST / HTTP/1.1\r\nHost: a\r\nContent-Length: 9999999\r\n\r\n"),
              HasSubstr("HTTP/1.1 413 "));
  EXPECT_THAT(SendText("HEAD / HTTP/1.1\r\nConnection: close\r\n\r\n"), HasSubstr("HTTP/1.1 405 "));
  EXPECT_THAT(SendText("GET / HTTP/1.1\r\nAuthorization: Bearer YQ\r\n"
                       "Authorization: Bearer YQ\r\nConnection: close\r\n\r\n"),
              HasSubstr("HTTP/1.1 400 "));
  EXPECT_EQ(Send(InHeader(HolderToken())).status, 200);
}

// Others may be able to compute such a key from its certificate.
TEST_F(GuardedServerThreadTest, RefusesClientsWithShortKeys) {
  Server();
  const std::string request =
      folder_.Write("request", "GET / HTTP/1.1\r\nConnection: close\r\n\r\n");
  for (const auto& [bits, isAnswered] : {std::pair{"1024", false}, std::pair{"2048", true}}) {
    const std::string key = folder_.Path() + "/client.pem";
    const auto made = Tarnik::Testing::RunInShell(
        "openssl req -x509 -nodes -subj /CN=a -newkey rsa:" + std::string(bits) + " -keyout " +
        key + " -out " + key + ".crt 2>&1");
    ASSERT_EQ(made.status, 0) << made.output;
    const auto run = Tarnik::Testing::RunInShell(Client() + " -cipher DEFAULT@SECLEVEL=0 -key " +
                                                 key + " -cert " + key + ".crt <" + request);
    EXPECT_EQ(run.output.find("HTTP/1.1 401 ") != std::string::npos, isAnswered) << run.output;
  }
}

TEST_F(GuardedServerThreadTest, ReadsNoTokenFromATrailer) {
  Server("accept");
  const std::string field = "Authorization: Bearer " + Base64(BearerToken()) + "\r\n";
  const std::string begin =
      "POST / HTTP/1.1\r\nConnection: close\r\nTransfer-Encoding: chunked\r\n";
  EXPECT_THAT(SendText(begin + field + "\r\n0\r\n\r\n"), HasSubstr("HTTP/1.1 200 "));
  const std::string answer = SendText(begin + "\r\n0\r\n" + field + "\r\n");
  EXPECT_THAT(answer, HasSubstr("HTTP/1.1 401 "));
  EXPECT_THAT(answer, HasSubstr("WWW-Authenticate: Bearer\r\n"));
}

// Others could find another request, or none, in what follows.
TEST_F(GuardedServerThreadTest, RefusesRequestsWithoutAClearEnd) {
  Server();
  const std::string next = "\r\n\r\nGET / HTTP/1.1\r\nConnection: close\r\n\r\n";
  for (const char* const header :
       {"1.1\r\nTransfer-Encoding: gzip", "1.1\r\nTransfer-Encoding: identity",
        "1.1\r\nTransfer-Encoding: chunked, gzip",
        "1.1\r\nTransfer-Encoding: gzip, chunked\r\n\r\n0",
        "1.1\r\nTransfer-Encoding: gzip\r\nContent-Length: 0",
        "1.1\r\nTransfer-Encoding: gzip\r\nTransfer-Encoding: chunked\r\n\r\n0",
        "1.1\r\nTransfer-Encoding: chunked\r\nContent-Length: 0",
        "1.0\r\nConnection: keep-alive\r\nTransfer-Encoding: chunked\r\n\r\n0"}) {
    const std::string answer = SendText(std::string("POST / HTTP/") + header + next);
    EXPECT_THAT(answer, HasSubstr(" 400 Bad Request\r\n")) << header;
    EXPECT_EQ(answer.find(" 401 "), std::string::npos) << header;
  }
}

TEST_F(GuardedServerThreadTest, EndsSlowConnections) {
  Server("refuse", {"300"});
  RawConnection silent(server_->Port());
  RawConnection slow(server_->Port());
  slow.Send("\x16");
  EXPECT_TRUE(silent.IsClosedByServer());
  EXPECT_TRUE(slow.IsClosedByServer());
  // A client that sends a part of its request, and keeps its side open
  const std::string pipe = folder_.Path() + "/pipe";
  const auto run =
      Tarnik::Testing::RunInShell("mkfifo " + pipe + " && exec 0<>" + pipe +
                                  " && printf 'GET / HTTP/1.1\\r\\n' >&0 && " + Client());
  EXPECT_EQ(run.output.find("HTTP/1.1 "), std::string::npos) << run.output;
}

TEST_F(GuardedServerThreadTest, LimitsConnections) {
  Server("refuse", {kTenMinutes});
  std::vector<std::unique_ptr<RawConnection>> connections;
  for (int i = 0; i < 256; ++i) {
    connections.push_back(std::make_unique<RawConnection>(server_->Port()));
  }
  EXPECT_TRUE(RawConnection(server_->Port()).IsClosedByServer());
  connections.clear();
  // The server sees one by one that they have been closed.
  const std::string token = HolderToken();
  int status = 0;
  while (status == 0) {
    try {
      status = Send(InHeader(token)).status;
    } catch (const Tarnik::Exception&) {
    }
  }
  EXPECT_EQ(status, 200);
}

TEST_F(GuardedServerThreadTest, EndsWithASignal) {
  for (const int signal : {SIGTERM, SIGINT}) {
    Server("refuse", {kTenMinutes});
    // A connection in its handshake, and an idle one
    RawConnection connecting(server_->Port());
    connecting.Send("\x16");
    const auto idle = MakeAgent(server_->Port(), &Holder());
    EXPECT_EQ(Ask(*idle, {}).status, 401);
    server_->Signal(signal);
    EXPECT_EQ(server_->WaitForEnd(), 0);
  }
}

TEST_F(GuardedServerThreadTest, DoesNotStartWithoutTrust) {
  const std::string command = EXAMPLES_FOLDER "/guarded_server/guarded_server " + certificate_ +
                              " " + key_ + " " + kIssuer + " /nonexistent.pem " + kOwnName;
  const auto run = Tarnik::Testing::RunInShell(command + " refuse 2>&1");
  EXPECT_EQ(run.status, 1);
  EXPECT_THAT(run.output, HasSubstr("/nonexistent.pem"));
  EXPECT_EQ(Tarnik::Testing::RunInShell(command + " 2>&1").status, 2);
}

}  // namespace
}  // namespace SsoClient::Access
