// Attempts with a negotiated login, whose handlers are the test's own.
#include <functional>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "attempts/endpoint_fixture.h"

namespace SsoClient::Access {
namespace {

using SsoClient::Testing::TenMinutes;

using Leg = std::shared_ptr<const std::vector<unsigned char>>;

/// A handler whose legs `next` makes; it receives the number of the leg, from 1.
class ScriptedNegotiation final : public NegotiationHandler {
 public:
  explicit ScriptedNegotiation(std::function<Leg(int)> next) : next_(std::move(next)) {}

  Leg Negotiate(const std::vector<unsigned char>&) override { return next_(++legs_); }

 private:
  const std::function<Leg(int)> next_;
  int legs_ = 0;
};

Leg SomeLeg() {
  return std::make_shared<const std::vector<unsigned char>>(3, 'x');
}

class NegotiatedAttemptTest : public EndpointTest {
 protected:
  static AttemptOutcome Attempt(
      std::function<std::shared_ptr<NegotiationHandler>(const Endpoint&)> createHandler) {
    TokenSourceConfig config = Config();
    config.login = NegotiatedLogin{std::move(createHandler)};
    return AttemptAt(config, Sts().HttpsUrl(), TenMinutes(), "");
  }
  static AttemptOutcome AttemptWithLegs(const std::function<Leg(int)>& next) {
    return Attempt([&](const Endpoint&) { return std::make_shared<ScriptedNegotiation>(next); });
  }
  /// Answers with a further leg of the service.
  static void AskForMoreLegs(const std::string& context) {
    DevSts::Misbehavior more;
    more.httpAnswer = DevSts::HttpAnswer{
        200,
        "OK",
        {},
        "<e:Envelope xmlns:e='http://schemas.xmlsoap.org/soap/envelope/' xmlns:t='" +
            std::string(SsoClient::Testing::kTrust) +
            "'><e:Body><t:RequestSecurityTokenResponse Context='" + context +
            "'><t:BinaryExchange>QUJD</t:BinaryExchange></t:RequestSecurityTokenResponse></e:Body>"
            "</e:Envelope>"};
    Sts().SetMisbehavior(more);
  }
};

TEST_F(NegotiatedAttemptTest, EachAttemptHasAHandlerOfItsOwnForItsEndpoint) {
  std::vector<std::string> urls;
  TokenSourceConfig config = Config();
  config.login = NegotiatedLogin{[&urls](const Endpoint& endpoint) {
    urls.push_back(endpoint.url);
    return std::make_shared<ScriptedNegotiation>([](int) { return SomeLeg(); });
  }};
  for (int i = 0; i < 2; ++i) {
    // The service, which has no keytab, refuses negotiations.
    AttemptAt(config, Sts().HttpsUrl(), TenMinutes(), "");
  }
  EXPECT_THAT(urls, testing::ElementsAre(Sts().HttpsUrl(), Sts().HttpsUrl()));
  EXPECT_EQ(Sts().Requests().size(), 2U);
}

TEST_F(NegotiatedAttemptTest, AHandlerThatCannotBeMadeIsAFailureOfTheLogin) {
  const AttemptOutcome thrown = Attempt([](const Endpoint&) -> std::shared_ptr<NegotiationHandler> {
    throw std::runtime_error("no ticket cache");
  });
  EXPECT_STREQ(NameOf(thrown.kind), "secret-failed");
  EXPECT_EQ(thrown.message, "no ticket cache");
  EXPECT_THROW(std::rethrow_exception(thrown.failure), std::runtime_error);
  EXPECT_EQ(ExpectFailure<Tarnik::InvalidArgumentException>(
                Attempt([](const Endpoint&) { return nullptr; }), FailureKind::kSecretFailed),
            "The login's function has returned no handler.");
  const AttemptOutcome odd =
      Attempt([](const Endpoint&) -> std::shared_ptr<NegotiationHandler> { throw 1; });
  EXPECT_EQ(odd.kind, FailureKind::kSecretFailed);
  EXPECT_EQ(odd.message, "An object was thrown that is not an exception.");
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(NegotiatedAttemptTest, AFirstLegThatCannotBeMadeIsAFailureOfTheLogin) {
  ExpectFailure<SsoException>(
      AttemptWithLegs([](int) -> Leg { throw SsoException("There are no credentials."); }),
      FailureKind::kSecretFailed);
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(NegotiatedAttemptTest, ALaterLegThatCannotBeMadeIsALocalFailure) {
  AskForMoreLegs("1");
  ExpectFailure<CommunicationException>(AttemptWithLegs([](int leg) {
                                          return leg == 1 ? SomeLeg()
                                                          : throw CommunicationException("no KDC");
                                        }),
                                        FailureKind::kLocal);
  ExpectFailure<Tarnik::InvalidArgumentException>(
      AttemptWithLegs([](int leg) { return leg == 1 ? SomeLeg() : nullptr; }), FailureKind::kLocal);
}

TEST_F(NegotiatedAttemptTest, AServiceThatNeverEndsANegotiationAnswersBadly) {
  AskForMoreLegs("1");
  ExpectFailure<CommunicationException>(AttemptWithLegs([](int) { return SomeLeg(); }),
                                        FailureKind::kBadAnswer);
}

TEST_F(NegotiatedAttemptTest, AnAnswerWithoutAContextIsBad) {
  AskForMoreLegs("");
  ExpectFailure<CommunicationException>(AttemptWithLegs([](int) { return SomeLeg(); }),
                                        FailureKind::kBadAnswer);
}

TEST_F(NegotiatedAttemptTest, ALimitThatPassesBetweenTwoLegsEndsTheAttempt) {
  AskForMoreLegs("1");
  const TokenSpec spec = TenMinutes();
  const std::string none;
  const auto limit = AMinute();
  TokenSourceConfig config = Config();
  config.login = NegotiatedLogin{[&limit](const Endpoint&) {
    return std::make_shared<ScriptedNegotiation>([&limit](int leg) {
      if (leg == 2) {
        limit->Cancel();
      }
      return SomeLeg();
    });
  }};
  const auto client = CreateEndpointClient(config, {Sts().HttpsUrl(), ""});
  ExpectFailure<CommunicationException>(
      client->Attempt({AttemptOperation::kLogin, spec, nullptr, none}, *limit),
      FailureKind::kAbandoned);
  EXPECT_EQ(Sts().Requests().size(), 1U);
}

TEST_F(NegotiatedAttemptTest, AShortageOfMemoryPassesThrough) {
  EXPECT_THROW(Attempt([](const Endpoint&) -> std::shared_ptr<NegotiationHandler> {
                 throw std::bad_alloc();
               }),
               std::bad_alloc);
}

}  // namespace
}  // namespace SsoClient::Access
