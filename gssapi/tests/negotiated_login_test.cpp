// The handler in the two places that exchange legs, with a service that accepts Kerberos.
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <boost/none.hpp>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/gssapi_negotiation_handler.h>
#include <tarnik/text/string_util.h>

#include "gss_acceptor.h"
#include "realm_fixture.h"
#include "sts/answers.h"
#include "sts/fakes.h"
#include "sts/internal/gss_negotiation_context_impl.h"
#include "sts/log_capture.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "sts/security_token_service_impl.h"
#include "support/assertion_text.h"
#include "support/async_call.h"
#include "support/forked_child.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

using Leg = std::vector<unsigned char>;

struct Behavior {
  bool isTokenWithLastLeg = true;
  bool isLastLegSent = true;
  bool isImpostor = false;
};

// The bytes of the request's only BinaryExchange.
Leg LegOf(const SoapRequest& request) {
  const auto end = request.body.find("</wst:BinaryExchange>");
  const auto begin = request.body.rfind('>', end) + 1;
  Leg leg;
  Tarnik::StringUtil::Base64Decode(std::string_view(request.body).substr(begin, end - begin), leg);
  return leg;
}

std::string Exchange(const Leg& leg) {
  return leg.empty() ? ""
                     : "<wst:BinaryExchange>" + Tarnik::StringUtil::Base64Encode(leg) +
                           "</wst:BinaryExchange>";
}

std::string LegAnswer(const Leg& leg) {
  return Envelope(Rstr(Exchange(leg), " Context=\"c\""));
}

std::string TokenAnswer(const Leg& leg) {
  return Envelope(Collection(
      Rstr(Exchange(leg) + "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>" +
               Requested(AssertionText().ToXml()),
           " Context=\"c\"")));
}

// The service's end of one connection.
class Service final : public TransportSession {
 public:
  Service(const std::string& keytab, const Behavior& behavior)
      : acceptor_(keytab), behavior_(behavior) {}

  void SendRequest(const SoapRequest& request, Tarnik::Ref<Tarnik::Reader>& reader) const override {
    legs.push_back(LegOf(request));
    reader = Tarnik::CreateStringReader(legs.size() == 1 ? FirstAnswer() : TokenAnswer({}));
  }

  void SendRequestAsync(const SoapRequest&, const Completion&,
                        Tarnik::Ref<Tarnik::Http::PendingRequestItem>&) const override {
    FAIL() << "negotiations send synchronously";
  }

  std::string Client() const { return acceptor_.clientName; }

  mutable std::vector<Leg> legs;

 private:
  std::string FirstAnswer() const {
    Leg proof = acceptor_.Accept(legs[0]);
    if (behavior_.isImpostor) {
      proof.back() ^= 1U;
    }
    if (!behavior_.isLastLegSent) {
      proof.clear();
    }
    return behavior_.isTokenWithLastLeg ? TokenAnswer(proof) : LegAnswer(proof);
  }

  mutable GssAcceptor acceptor_;
  Behavior behavior_;
};

class OneService final : public Transport {
 public:
  explicit OneService(std::shared_ptr<Service> service) : service_(std::move(service)) {}
  std::shared_ptr<TransportSession> CreateSession() const override { return service_; }

 private:
  std::shared_ptr<Service> service_;
};

TokenSpec OneHour() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  return spec;
}

class NegotiatedLoginTest : public RealmFixture {
 protected:
  std::shared_ptr<const SamlToken> Acquire(const Behavior& behavior) {
    return Connect(behavior).AcquireTokenByGSS(OneHour(), *handler_);
  }
  std::shared_ptr<const SamlToken> AcquireAsynchronously() {
    AsyncCall call;
    Connect({}).AcquireTokenByGSSAsync(OneHour(), *handler_, call.Callback());
    return call.Wait().token;
  }

  /// A client of a new service.
  SecurityTokenServiceImpl Connect(const Behavior& behavior) {
    service_ = std::make_shared<Service>(serviceKeytab, behavior);
    return SecurityTokenServiceImpl(
        std::make_shared<RequestBuilderImpl>(boost::none), std::make_shared<OneService>(service_),
        std::make_shared<ResponseHandlerImpl>(), std::make_shared<FakeTokenFactory>());
  }

  std::shared_ptr<GssapiNegotiationHandler> handler_ =
      CreateGssapiNegotiationHandler(ConfigOf("alice"));
  std::shared_ptr<Service> service_;
};

TEST_F(NegotiatedLoginTest, EndsAfterOneExchangeWithAProof) {
  const auto token = Acquire({});
  ASSERT_NE(token, nullptr);
  EXPECT_EQ(service_->legs.size(), 1U);
  EXPECT_EQ(service_->Client(), "alice@EXAMPLE.COM");
  EXPECT_TRUE(handler_->IsEstablished());
}

TEST_F(NegotiatedLoginTest, SendsAnEmptyLegToAServiceThatGoesOnAfterTheProof) {
  EXPECT_NE(Acquire({.isTokenWithLastLeg = false}), nullptr);
  ASSERT_EQ(service_->legs.size(), 2U);
  EXPECT_TRUE(service_->legs[1].empty());
  EXPECT_TRUE(handler_->IsEstablished());
}

TEST_F(NegotiatedLoginTest, ReportsThatAServiceHasNotProvedItself) {
  EXPECT_NE(Acquire({.isLastLegSent = false}), nullptr);
  EXPECT_EQ(service_->Client(), "alice@EXAMPLE.COM");
  EXPECT_FALSE(handler_->IsEstablished());
}

TEST_F(NegotiatedLoginTest, ReturnsNoTokenFromAServiceThatCannotProveItself) {
  for (const bool isTokenWithLastLeg : {true, false}) {
    EXPECT_THROW(Acquire({.isTokenWithLastLeg = isTokenWithLastLeg, .isImpostor = true}),
                 SsoException);
    EXPECT_FALSE(handler_->IsEstablished());
  }
}

TEST_F(NegotiatedLoginTest, SendsNothingWithoutCredentials) {
  auto config = ConfigOf("alice");
  config.credentialCache = "FILE:/nonexistent/cache";
  handler_ = CreateGssapiNegotiationHandler(config);
  EXPECT_EQ(ThrownMessage<SsoException>([this] { Acquire({}); }),
            "There are no credentials to log in with: No credentials were supplied, or the "
            "credentials were unavailable or inaccessible (No credentials cache found).");
  EXPECT_TRUE(service_->legs.empty());
}

TEST_F(NegotiatedLoginTest, ServesLoginsInSequence) {
  EXPECT_NE(Acquire({}), nullptr);
  EXPECT_THROW(Acquire({.isImpostor = true}), SsoException);
  EXPECT_NE(Acquire({}), nullptr);
  EXPECT_TRUE(handler_->IsEstablished());
}

// The parent has threads of the pool and its child has not; the handler is the same.
TEST_F(NegotiatedLoginTest, WorksInAForkedChild) {
  ASSERT_NE(AcquireAsynchronously(), nullptr);
  EXPECT_TRUE(Tarnik::Testing::HoldsInChild([this] {
    return Acquire({}) != nullptr && handler_->IsEstablished() &&
           AcquireAsynchronously() != nullptr && handler_->IsEstablished() &&
           service_->Client() == "alice@EXAMPLE.COM";
  }));
  EXPECT_NE(AcquireAsynchronously(), nullptr);
}

// The line is about the empty answer to the last leg. It is harmless.
TEST_F(NegotiatedLoginTest, IsLoggedForItsLastLeg) {
  const LogCapture log(4);
  Acquire({});
  EXPECT_THAT(log.Lines(),
              testing::ElementsAre(
                  "4 GSS contract error: non-empty user leg after negotiation is complete"));
}

TEST_F(NegotiatedLoginTest, IsMadeLegByLegWithAContext) {
  for (const bool isTokenWithLastLeg : {true, false}) {
    const auto service = std::make_shared<Service>(
        serviceKeytab, Behavior{.isTokenWithLastLeg = isTokenWithLastLeg});
    InternalApi::GssNegotiationContextImpl context(
        OneHour(), std::make_shared<RequestBuilderImpl>(boost::none), service,
        std::make_shared<ResponseHandlerImpl>(), nullptr);
    const auto answer = context.Negotiate(*handler_->Negotiate({}));
    EXPECT_EQ(service->Client(), "alice@EXAMPLE.COM");
    EXPECT_EQ(answer.token != nullptr, isTokenWithLastLeg);
    const auto last = handler_->Negotiate(*answer.outputLeg);
    EXPECT_TRUE(last->empty());
    EXPECT_TRUE(handler_->IsEstablished());
    if (!isTokenWithLastLeg) {
      EXPECT_NE(context.Negotiate(*last).token, nullptr);
    }
  }
}

}  // namespace
}  // namespace SsoClient::Testing
