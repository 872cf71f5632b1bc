// What a hostile service may answer to the legs of a negotiation.
#include <cstddef>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <boost/none.hpp>
#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/negotiation_handler.h>
#include <tarnik/text/string_util.h>

#include "sts/answers.h"
#include "sts/fakes.h"
#include "sts/internal/gss_negotiation_context_impl.h"
#include "sts/log_capture.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "sts/security_token_service_impl.h"
#include "sts/token_specs.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

using Leg = std::vector<unsigned char>;

/// Records what it is given and returns one byte.
class ListeningHandler final : public NegotiationHandler {
 public:
  std::shared_ptr<const Leg> Negotiate(const Leg& serverLeg) override {
    received.push_back(serverLeg);
    return std::make_shared<const Leg>(1, static_cast<unsigned char>(7));
  }

  std::vector<Leg> received;
};

/// Logs in with the loop, or with a context that is called until it has a token.
class HostileNegotiationTest : public testing::TestWithParam<bool> {
 protected:
  void Answer(std::vector<std::string> answers) {
    transport_ = std::make_shared<FakeTransport>(std::move(answers));
  }

  void LogIn() {
    if (!GetParam()) {
      const SecurityTokenServiceImpl service(builder_, transport_, responseHandler_, factory_);
      service.AcquireTokenByGSS(OneHour(), handler_);
      return;
    }
    InternalApi::GssNegotiationContextImpl context(OneHour(), builder_, transport_->CreateSession(),
                                                   responseHandler_, nullptr);
    Leg serverLeg;
    for (std::size_t i = 0; i < 3; ++i) {
      serverLeg = *context.Negotiate(*handler_.Negotiate(serverLeg)).outputLeg;
    }
  }

  std::shared_ptr<FakeTransport> transport_;
  std::shared_ptr<const RequestBuilder> builder_ =
      std::make_shared<RequestBuilderImpl>(boost::none);
  std::shared_ptr<const ResponseHandler> responseHandler_ = std::make_shared<ResponseHandlerImpl>();
  std::shared_ptr<FakeTokenFactory> factory_ = std::make_shared<FakeTokenFactory>();
  ListeningHandler handler_;
};

INSTANTIATE_TEST_SUITE_P(Ways, HostileNegotiationTest, testing::Bool(),
                         [](const auto& test) { return test.param ? "Context" : "Loop"; });

std::string FaultAnswer() {
  return Envelope(Fault("wst:RequestFailed", "enough"));
}

std::string ContextIn(const std::string& request) {
  const auto document = ParseXml(request);
  const auto* message = document->RootElement()->FirstChildElement("Body")->FirstChildElement(
      "RequestSecurityTokenResponse");
  return std::string(message->FindAttribute("Context").value_or("no Context"));
}

// The text in an answer, and its value.
struct ContextId {
  std::string written;
  std::string meant;
};

TEST_P(HostileNegotiationTest, AnyContextIdIsSentBackUnchanged) {
  const std::string huge(std::size_t{1} << 20, 'c');
  for (const auto& [written, meant] :
       {ContextId{"&quot;>&lt;wst:BinaryExchange/>", "\"><wst:BinaryExchange/>"},
        ContextId{"' xmlns:wst='urn:other", "' xmlns:wst='urn:other"},
        ContextId{"a&#13;&#10;&#9;b", "a\r\n\tb"}, ContextId{"&amp;amp;]]&gt;", "&amp;]]>"},
        ContextId{"\xF0\x9F\x98\x80\xE2\x80\xAE", "\xF0\x9F\x98\x80\xE2\x80\xAE"},
        ContextId{" ", " "}, ContextId{huge, huge}}) {
    SCOPED_TRACE(meant.substr(0, 50));
    Answer({LegAnswer(written), FaultAnswer()});
    EXPECT_EQ(ThrownMessage<SsoException>([this] { LogIn(); }),
              "Unexpected SOAP fault: wst:RequestFailed; request failed.");
    ASSERT_EQ(transport_->bodies.size(), 2U);
    EXPECT_EQ(ContextIn(transport_->bodies[1]), meant);
    EXPECT_THAT(transport_->actions[1], Not(HasSubstr(meant)));
  }
}

TEST_P(HostileNegotiationTest, AContextIdThatXmlForbidsIsRefused) {
  for (const std::string written :
       {"&#0;", "&#1;", "&#xFFFE;", "&#xD800;", "<", "&unknown;", "\x01", "\xC0\x80", "\xFF"}) {
    SCOPED_TRACE(written);
    Answer({LegAnswer(written)});
    EXPECT_THAT(ThrownMessage<SsoException>([this] { LogIn(); }),
                HasSubstr("Response is not well-formed XML: "));
    EXPECT_EQ(transport_->bodies.size(), 1U);
  }
}

std::string Exchange(const std::string& content, const std::string& attributes = {}) {
  return "<wst:BinaryExchange" + attributes + ">" + content + "</wst:BinaryExchange>";
}

// The content of an answer, and the leg that the handler receives.
struct LegContent {
  std::string content;
  std::string leg;
};

TEST_P(HostileNegotiationTest, TheHandlerReceivesTheFirstOfManyLegs) {
  for (const auto& [content, leg] :
       {LegContent{Exchange("Zmlyc3Q=") + Exchange("c2Vjb25k"), "first"},
        LegContent{Exchange("Zmly<x>c2Vjb25k</x>") + Exchange("c2Vjb25k"), "fir"},
        LegContent{"<x>" + Exchange("c2Vjb25k") + "</x>" + Exchange("Zmlyc3Q="), "first"},
        // Only Base64 and SPNEGO are requested, whatever the service calls them.
        LegContent{Exchange("Zmlyc3Q=", " EncodingType=\"urn:hex\" ValueType=\"urn:other\""),
                   "first"},
        // A token next to a leg that is not the last is ignored.
        LegContent{Exchange("Zmlyc3Q=") + Requested(kAssertionXml), "first"}}) {
    SCOPED_TRACE(content);
    handler_.received.clear();
    Answer({LegAnswer("c", content), FaultAnswer()});
    EXPECT_THROW(LogIn(), SsoException);
    ASSERT_EQ(handler_.received.size(), 2U);
    EXPECT_EQ(std::string(handler_.received[1].begin(), handler_.received[1].end()), leg);
    EXPECT_THAT(factory_->texts, IsEmpty());
  }
}

TEST_P(HostileNegotiationTest, ALegOfMegabytesReachesTheHandlerWhole) {
  const Leg leg(std::size_t{8} << 20, 0xAB);
  Answer({LegAnswer("c", Exchange(Tarnik::StringUtil::Base64Encode(leg))), FaultAnswer()});
  EXPECT_THROW(LogIn(), SsoException);
  ASSERT_EQ(handler_.received.size(), 2U);
  EXPECT_TRUE(handler_.received[1] == leg);
}

TEST(HostileNegotiationLoopTest, EndsEvenIfTheServiceContinuesForever) {
  for (const auto* leg : {" ", "AQID"}) {
    const auto transport = std::make_shared<FakeTransport>(LegAnswer("c", Exchange(leg)));
    const SecurityTokenServiceImpl service(std::make_shared<RequestBuilderImpl>(boost::none),
                                           transport, std::make_shared<ResponseHandlerImpl>(),
                                           std::make_shared<FakeTokenFactory>());
    ListeningHandler handler;
    EXPECT_EQ(ThrownMessage<CommunicationException>(
                  [&] { service.AcquireTokenByGSS(OneHour(), handler); }),
              "The service asks for more than 1000 legs of SPNEGO.");
    EXPECT_EQ(transport->bodies.size(), 1000U);
    EXPECT_EQ(handler.received.size(), 1000U);
  }
}

TEST_P(HostileNegotiationTest, AFaultWithATokenIsAFault) {
  const std::string fault = Fault("wst:FailedAuthentication", "no");
  const std::string token =
      Collection(Rstr("<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>" +
                          Requested(kAssertionXml),
                      " Context=\"c\""));
  for (const auto& body : {fault + token, token + fault}) {
    Answer({LegAnswer("c"), Envelope(body)});
    EXPECT_EQ(ThrownMessage<InvalidCredentialsException>([this] { LogIn(); }),
              "Authentication failed: no");
    EXPECT_EQ(transport_->bodies.size(), 2U);
    EXPECT_THAT(factory_->texts, IsEmpty());
  }
}

TEST_P(HostileNegotiationTest, AnAnswerOfAnotherOperationInTheMiddleIsRefused) {
  for (const auto& answer :
       {IssueAnswer(), RenewAnswer(),
        Envelope(Rstr("<wst:Status><wst:Code>http://docs.oasis-open.org/ws-sx/ws-trust/200512/"
                      "status/valid</wst:Code></wst:Status>"))}) {
    Answer({LegAnswer("c"), answer});
    EXPECT_EQ(ThrownMessage<SsoException>([this] { LogIn(); }), "Unexpected XML format");
    EXPECT_THAT(factory_->texts, IsEmpty());
  }
}

TEST_P(HostileNegotiationTest, NoLegReachesTheLogOrAMessage) {
  const std::string secret = "bm8gbG9nIGlzIHRvIGtub3cgdGhpcw==";
  for (const auto& answer :
       {LegAnswer("c", Exchange(secret + "!")), LastLegAnswer("<Other/>", Exchange(secret)),
        LegAnswer("&#1;", Exchange(secret))}) {
    const LogCapture log(9);
    Answer({answer});
    const auto message = ThrownMessage<SsoException>([this] { LogIn(); });
    EXPECT_THAT(message, Not(HasSubstr(secret)));
    for (const auto& line : log.Lines()) {
      EXPECT_THAT(line, Not(HasSubstr(secret)));
    }
  }
}

}  // namespace
}  // namespace SsoClient::Testing
