// Attempts that succeed, and what all attempts have in common.
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include <tarnik/core/exception.h>

#include "attempts/endpoint_fixture.h"
#include "calls/freed_memory.h"
#include "secret.h"
#include "secret_text.h"
#include "support/holder_of_key.h"

namespace SsoClient::Access {
namespace {

using SsoClient::Testing::Holder;
using SsoClient::Testing::IsBoundTo;
using SsoClient::Testing::TenMinutes;
using testing::IsEmpty;

const std::string kNoSecret;

class EndpointClientTest : public EndpointTest {
 protected:
  static AttemptOutcome Attempt(const TokenSourceConfig& config, AttemptOperation operation,
                                const TokenSpec& spec,
                                const std::shared_ptr<const SamlToken>& base = nullptr) {
    const auto client = CreateEndpointClient(config, {Sts().HttpsUrl(), ""});
    return client->Attempt({operation, spec, base, kNoSecret}, *AMinute());
  }
};

TEST_F(EndpointClientTest, LogsInByPassword) {
  const AttemptOutcome outcome = AttemptHere();
  ASSERT_NE(outcome.token, nullptr) << outcome.message;
  EXPECT_EQ(outcome.token->Subject().name, "alice");
  EXPECT_EQ(outcome.kind, FailureKind::kNone);
  EXPECT_EQ(outcome.failure, nullptr);
  EXPECT_EQ(outcome.message, "");
  EXPECT_EQ(outcome.httpStatus, 200);
  EXPECT_EQ(outcome.retryAfter.count(), 0);
  EXPECT_TRUE(outcome.clockOffset.has_value());
  EXPECT_THAT(outcome.deviations, IsEmpty());
}

TEST_F(EndpointClientTest, LogsInByPasswordWithAKey) {
  const AttemptOutcome outcome = AttemptAt(BoundConfig(), Sts().HttpsUrl());
  ASSERT_NE(outcome.token, nullptr) << outcome.message;
  EXPECT_TRUE(IsBoundTo(*outcome.token, Holder()));
  EXPECT_THAT(outcome.deviations, IsEmpty());
}

TEST_F(EndpointClientTest, LogsInByCertificateRenewsAndExchanges) {
  TokenSourceConfig config = BoundConfig();
  config.login = CertificateLogin{};
  TokenSpec spec = TenMinutes();
  spec.renewable = spec.delegable = true;
  const AttemptOutcome login = Attempt(config, AttemptOperation::kLogin, spec);
  ASSERT_NE(login.token, nullptr) << login.message;
  EXPECT_THAT(login.deviations, IsEmpty());

  const AttemptOutcome renewal = Attempt(config, AttemptOperation::kRenewal, spec, login.token);
  ASSERT_NE(renewal.token, nullptr) << renewal.message;
  EXPECT_NE(renewal.token->Id(), login.token->Id());
  EXPECT_THAT(renewal.deviations, IsEmpty());

  TokenSpec forOrders = TenMinutes();
  forOrders.audienceRestriction = {"https://orders.example.com"};
  const AttemptOutcome exchange =
      Attempt(config, AttemptOperation::kExchange, forOrders, renewal.token);
  ASSERT_NE(exchange.token, nullptr) << exchange.message;
  EXPECT_EQ(exchange.token->Subject().name, "machine");
  EXPECT_THAT(exchange.deviations, IsEmpty());
}

TEST_F(EndpointClientTest, ExchangesOnBehalfOfAnotherSubject) {
  TokenSpec spec = TenMinutes();
  spec.actAsToken = DelegableBearer();
  const auto base = AcquireBound();
  const AttemptOutcome outcome = Attempt(BoundConfig(), AttemptOperation::kExchange, spec, base);
  ASSERT_NE(outcome.token, nullptr) << outcome.message;
  EXPECT_EQ(outcome.token->Subject().name, "alice");
  EXPECT_THAT(outcome.deviations, IsEmpty());
}

TEST_F(EndpointClientTest, KeepsItsConnections) {
  const DevSts::Server server;
  const auto client = CreateEndpointClient(ConfigFor(server), {server.HttpsUrl(), ""});
  const std::string password = kPassword;
  for (int i = 0; i < 3; ++i) {
    const TokenSpec spec = TenMinutes();
    EXPECT_NE(
        client->Attempt({AttemptOperation::kLogin, spec, nullptr, password}, *AMinute()).token,
        nullptr);
  }
  EXPECT_EQ(server.GetCounters().connectionsAccepted, 1U);
  EXPECT_EQ(server.GetCounters().requests, 3U);
}

TEST_F(EndpointClientTest, AttemptsShareNoCookies) {
  DevSts::Misbehavior cookie;
  cookie.setCookies = {"session=1"};
  Sts().SetMisbehavior(cookie);
  const auto client = CreateEndpointClient(Config(), {Sts().HttpsUrl(), ""});
  const TokenSpec spec = TenMinutes();
  const std::string password = kPassword;
  for (int i = 0; i < 2; ++i) {
    client->Attempt({AttemptOperation::kLogin, spec, nullptr, password}, *AMinute());
  }
  EXPECT_EQ(Sts().Requests().size(), 2U);
  EXPECT_EQ(Sts().LastRequest().Header("Cookie"), "");
}

TEST_F(EndpointClientTest, ComparesTheNameOfThePeerAsConfigured) {
  const TokenSpec spec = TenMinutes();
  const std::string password = kPassword;
  const auto attempt = [&](const std::string& name) {
    return CreateEndpointClient(Config(), {Sts().HttpsUrl(), name})
        ->Attempt({AttemptOperation::kLogin, spec, nullptr, password}, *AMinute());
  };
  EXPECT_EQ(attempt("localhost").kind, FailureKind::kNone);
  EXPECT_EQ(attempt("elsewhere.example").kind, FailureKind::kTlsName);
}

TEST_F(EndpointClientTest, KnowsWhereItIs) {
  const auto client = CreateEndpointClient(Config(), {"https://sts.example/sts", "sts"});
  EXPECT_EQ(client->Where().url, "https://sts.example/sts");
  EXPECT_EQ(client->Where().sslPeerName, "sts");
}

TEST_F(EndpointClientTest, RefusesWhatNoAttemptCanUse) {
  const auto refused = [](const TokenSourceConfig& config, const std::string& url) {
    EXPECT_THROW(CreateEndpointClient(config, {url, ""}), Tarnik::InvalidArgumentException) << url;
  };
  TokenSourceConfig config = Config();
  refused(config, "");
  refused(config, "ftp://sts.example/");
  config.sslContext = nullptr;
  refused(config, "https://sts.example/");
  EXPECT_NE(CreateEndpointClient(config, {"http://sts.example/", ""}), nullptr);
  config.tokenFactory = nullptr;
  refused(config, "http://sts.example/");
  config = Config();
  config.holderOfKey = HolderOfKeyConfig{};
  refused(config, "https://sts.example/");
}

// ---- the password in released memory

constexpr char kLongPassword[] = "Nowhere-else:0123456789abcdefghijklmnopqrstuvwxyz";
// So short that a copy which was released early, before the text was complete, is found as well.
constexpr std::size_t kPiece = 10;

class FreedPasswordTest : public EndpointTest {
 protected:
  /// What the blocks that an attempt releases hold of the password, but not those of its outcome.
  AttemptOutcome AttemptAt(const std::string& url) {
    const auto client = CreateEndpointClient(Config(), {url, ""});
    const auto limit = AMinute();
    const SsoClient::Testing::FreedMemory memory(password_, kPiece);
    AttemptOutcome outcome =
        client->Attempt({AttemptOperation::kLogin, spec_, nullptr, password_}, *limit);
    finds_ = memory.Finds();
    return outcome;
  }

  const std::string password_ = kLongPassword;
  const TokenSpec spec_ = TenMinutes();
  int finds_ = -1;
};

TEST_F(FreedPasswordTest, NothingOfItRemainsWhenNoServiceIsReached) {
  EXPECT_EQ(AttemptAt("http://127.0.0.1:1/").kind, FailureKind::kUnreachable);
  EXPECT_EQ(finds_, 0);
}

TEST_F(FreedPasswordTest, SecretReleasesNothingOfIt) {
  const SsoClient::Testing::FreedMemory memory(password_, kPiece);
  {
    const Secret secret{std::string(kLongPassword)};
    ASSERT_EQ(secret.text, password_);
  }
  EXPECT_EQ(memory.Finds(), 0);
}

TEST_F(FreedPasswordTest, HidingAnEchoReleasesNothingOfIt) {
  for (const std::string& before : {std::string("no user with ["), std::string(5000, 'a')}) {
    std::string text = before + kLongPassword + "&amp;] &lt;" + kLongPassword;
    const SsoClient::Testing::FreedMemory memory(password_, kPiece);
    std::string shown = HideSecret(std::move(text), password_);
    const std::string record = ToRecordText(shown);
    shown = std::string();
    EXPECT_EQ(memory.Finds(), 0) << record;
  }
}

}  // namespace
}  // namespace SsoClient::Access
