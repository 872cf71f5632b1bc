#include "sts/response_handler.h"

#include <cstddef>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "sts/answers.h"
#include "sts/parse_answers.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"

namespace SsoClient::Testing {
namespace {

using testing::StartsWith;

constexpr char kNoBody[] = "Unexpected response format: missing SAOP Body.";

std::string ParseIssue(const std::string& answer) {
  std::string assertion;
  ResponseHandlerImpl().ParseIssueResponse(Tarnik::CreateStringReader(answer).get(), assertion);
  return assertion;
}

std::string ParseRenew(const std::string& answer) {
  std::string assertion;
  ResponseHandlerImpl().ParseRenewResponse(Tarnik::CreateStringReader(answer).get(), assertion);
  return assertion;
}

bool ParseValidate(const std::string& answer) {
  return ResponseHandlerImpl().ParseValidateResponse(Tarnik::CreateStringReader(answer).get());
}

using Parser = std::function<void(const std::string&)>;

const std::vector<std::pair<std::string, Parser>>& AllParsers() {
  static const std::vector<std::pair<std::string, Parser>> kParsers = {
      {"issue", [](const std::string& answer) { ParseIssue(answer); }},
      {"renew", [](const std::string& answer) { ParseRenew(answer); }},
      {"validate", [](const std::string& answer) { ParseValidate(answer); }},
      {"negotiation", [](const std::string& answer) { ParseNegotiation(answer); }},
  };
  return kParsers;
}

std::string StatusAnswer(const std::string& code) {
  return Envelope(Rstr("<wst:Status><wst:Code>" + code + "</wst:Code></wst:Status>"));
}

constexpr char kValid[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/valid";
constexpr char kInvalid[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/invalid";

// The steps of every operation before it reads the body.

TEST(ResponseHandlerImplTest, AnAnswerThatIsNotXmlIsRefusedWithTheReason) {
  for (const auto& [name, parse] : AllParsers()) {
    for (const std::string answer : {"", "no XML", "<a>", "<a></b>", "<a/><b/>", "<p:a/>",
                                     "<!DOCTYPE a><a/>", "<a>\xff</a>", "<a b='1' b='2'/>"}) {
      EXPECT_EQ(Failure([&, &parser = parse] { parser(answer); }),
                "Response is not well-formed XML: " +
                    ThrownMessage<Tarnik::Xml::XMLParseException>([&] { ParseXml(answer); }))
          << name << ": " << answer;
    }
  }
}

TEST(ResponseHandlerImplTest, AnAnswerNeedsABody) {
  for (const auto& [name, parse] : AllParsers()) {
    for (const std::string answer :
         {"<Envelope/>", "<Envelope>Body</Envelope>", "<Envelope><Header/><Fault/></Envelope>",
          "<Body/>", "<Envelope><a><Body/></a></Envelope>", "<Envelope><body/></Envelope>"}) {
      EXPECT_EQ(Failure([&, &parser = parse] { parser(answer); }), kNoBody)
          << name << ": " << answer;
    }
  }
}

TEST(ResponseHandlerImplTest, AFaultIsReportedBeforeTheBodyIsExamined) {
  const std::string everything =
      Rstr(Requested(kAssertionXml), " Context=\"c\"") + Collection(Rstr(Requested(kAssertionXml)));
  for (const auto& [name, parse] : AllParsers()) {
    for (const auto& body :
         {Fault("S:Server", "busy") + everything, everything + Fault("S:Server", "busy")}) {
      EXPECT_EQ(Failure([&, &parser = parse] { parser(Envelope(body)); }),
                "Unexpected SOAP fault: S:Server; request failed.")
          << name;
    }
    EXPECT_THROW(parse(Envelope(Fault("wst:FailedAuthentication", "no"))),
                 InvalidCredentialsException)
        << name;
    EXPECT_THROW(parse(Envelope(Fault("wst:FailedAuthentication",
                                      "Password of the user logging on is expired"))),
                 PasswordExpiredException)
        << name;
  }
}

TEST(ResponseHandlerImplTest, TheFirstOfTwoBodiesCounts) {
  const std::string second =
      "<Body>" + Collection(Rstr(Requested("<Assertion n=\"2\"/>"))) + "</Body>";
  const std::string start = R"(<E xmlns:wst="urn:w"><Body>)";
  EXPECT_EQ(Failure([&] { ParseIssue(start + "</Body>" + second + "</E>"); }), kFormat);
  EXPECT_EQ(ParseIssue(start + Collection(Rstr(Requested("<Assertion n=\"1\"/>"))) + "</Body>" +
                       second + "</E>"),
            R"(<Assertion xmlns:wst="urn:w" n="1"></Assertion>)");
  EXPECT_EQ(Failure([&] {
              ParseIssue(start + "</Body><Body><Fault><faultcode>x</faultcode></Fault></Body></E>");
            }),
            kFormat);
}

TEST(ResponseHandlerImplTest, AnAnswerCutOffAnywhereIsRefused) {
  const struct {
    std::string answer;
    Parser parse;
  } kCases[] = {
      {IssueAnswer(), AllParsers()[0].second},
      {RenewAnswer(), AllParsers()[1].second},
      {StatusAnswer(kValid), AllParsers()[2].second},
      {IntermediateAnswer("<wst:BinaryExchange>QUJD</wst:BinaryExchange>"), AllParsers()[3].second},
      {FinalAnswer(kSamlType + Requested(kAssertionXml)), AllParsers()[3].second},
  };
  for (const auto& test : kCases) {
    EXPECT_NO_THROW(test.parse(test.answer));
    for (std::size_t length = 0; length < test.answer.size(); ++length) {
      EXPECT_THAT(Failure([&] { test.parse(test.answer.substr(0, length)); }),
                  StartsWith("Response is not well-formed XML: "))
          << length;
    }
  }
}

class FailingReader final : public Tarnik::Reader, public Tarnik::ObjectImpl {
 public:
  std::size_t Read(char*, std::size_t) override { throw Tarnik::IOException("cut off"); }
};

TEST(ResponseHandlerImplTest, FailuresOfTheReaderPassUnchanged) {
  const auto reader = Tarnik::MakeRef<FailingReader>();
  std::string assertion = "kept";
  EXPECT_EQ(ThrownMessage<Tarnik::IOException>(
                [&] { ResponseHandlerImpl().ParseIssueResponse(reader.get(), assertion); }),
            "cut off");
  EXPECT_EQ(assertion, "kept");
}

TEST(ResponseHandlerImplTest, AFailureLeavesTheOutputUnchanged) {
  const ResponseHandlerImpl handler;
  std::string assertion = "kept";
  EXPECT_THROW(
      handler.ParseIssueResponse(Tarnik::CreateStringReader(Envelope("")).get(), assertion),
      SsoException);
  EXPECT_EQ(assertion, "kept");
  EXPECT_THROW(
      handler.ParseRenewResponse(Tarnik::CreateStringReader(Envelope("")).get(), assertion),
      SsoException);
  EXPECT_EQ(assertion, "kept");
}

// Issue.

TEST(ParseIssueResponseTest, GivesTheCanonicalAssertionWithItsInheritedNamespaces) {
  EXPECT_EQ(ParseIssue(IssueAnswer()), kCanonicalAssertion);
}

TEST(ParseIssueResponseTest, IgnoresOtherContent) {
  EXPECT_EQ(ParseIssue(Envelope(
                "text<other/>" +
                Collection("<!-- c -->" +
                           Rstr("<wst:TokenType>any</wst:TokenType><wst:Lifetime/>" +
                                Requested("\n <!-- c --> " + std::string(kAssertionXml) + "text")) +
                           Rstr(Requested("<Assertion/>"))))),
            kCanonicalAssertion);
}

TEST(ParseIssueResponseTest, TheFirstOfTwoAssertionsCounts) {
  const std::string second = "<Assertion n=\"2\"/>";
  EXPECT_EQ(ParseIssue(Envelope(Collection(Rstr(Requested(kAssertionXml + second))))),
            kCanonicalAssertion);
  EXPECT_EQ(
      ParseIssue(Envelope(Collection(Rstr(Requested(kAssertionXml)) + Rstr(Requested(second))))),
      kCanonicalAssertion);
  EXPECT_EQ(ParseIssue(Envelope(Collection(Rstr(Requested(kAssertionXml) + Requested(second))))),
            kCanonicalAssertion);
}

TEST(ParseIssueResponseTest, AFirstResponseWithoutAnAssertionIsNotSkipped) {
  EXPECT_EQ(
      Failure([] { ParseIssue(Envelope(Collection(Rstr("") + Rstr(Requested(kAssertionXml))))); }),
      kFormat);
  EXPECT_EQ(Failure([] {
              ParseIssue(Envelope(Collection("") + Collection(Rstr(Requested(kAssertionXml)))));
            }),
            kFormat);
}

TEST(ParseIssueResponseTest, DoesNotCompareNamespaces) {
  EXPECT_EQ(ParseIssue(R"(<a:E xmlns:a="urn:a"><a:Body><RequestSecurityTokenResponseCollection>)"
                       "<a:RequestSecurityTokenResponse><RequestedSecurityToken><a:Assertion/>"
                       "</RequestedSecurityToken></a:RequestSecurityTokenResponse>"
                       "</RequestSecurityTokenResponseCollection></a:Body></a:E>"),
            R"(<a:Assertion xmlns:a="urn:a"></a:Assertion>)");
}

TEST(ParseIssueResponseTest, EveryElementOfThePathIsRequired) {
  for (const auto& body :
       {std::string(), Rstr(Requested(kAssertionXml)), Collection(""), Collection(Rstr("")),
        Collection(Rstr(Requested(""))), Collection(Rstr(kAssertionXml)),
        Collection(Requested(kAssertionXml)), Collection(Rstr(Requested("<Encrypted/>"))),
        Collection(Rstr(Requested("<x>" + std::string(kAssertionXml) + "</x>"))),
        std::string("<!--") + Collection("") + "-->",
        "<![CDATA[" + Collection(Rstr(Requested(kAssertionXml))) + "]]>"}) {
    EXPECT_EQ(Failure([&] { ParseIssue(Envelope(body)); }), kFormat) << body;
  }
}

// Renew.

TEST(ParseRenewResponseTest, GivesTheCanonicalAssertion) {
  EXPECT_EQ(ParseRenew(RenewAnswer()), kCanonicalAssertion);
}

TEST(ParseRenewResponseTest, TheFirstOfTwoResponsesOrAssertionsCounts) {
  const std::string second = "<Assertion n=\"2\"/>";
  EXPECT_EQ(ParseRenew(Envelope(Rstr("<wst:TokenType>any</wst:TokenType><wst:Lifetime/>" +
                                     Requested(kAssertionXml + second) + Requested(second)) +
                                Rstr(Requested(second)))),
            kCanonicalAssertion);
  EXPECT_EQ(Failure([] { ParseRenew(Envelope(Rstr("") + Rstr(Requested(kAssertionXml)))); }),
            kFormat);
}

TEST(ParseRenewResponseTest, EveryElementOfThePathIsRequiredAndNoCollection) {
  for (const auto& body : {std::string(), Collection(Rstr(Requested(kAssertionXml))), Rstr(""),
                           Rstr(Requested("")), Rstr(kAssertionXml), Requested(kAssertionXml)}) {
    EXPECT_EQ(Failure([&] { ParseRenew(Envelope(body)); }), kFormat) << body;
  }
}

// Validate.

TEST(ParseValidateResponseTest, ReturnsTheVerdict) {
  EXPECT_TRUE(ParseValidate(StatusAnswer(kValid)));
  EXPECT_FALSE(ParseValidate(StatusAnswer(kInvalid)));
  EXPECT_TRUE(ParseValidate(StatusAnswer("<![CDATA[" + std::string(kValid) + "]]>")));
}

TEST(ParseValidateResponseTest, OnlyTheFirstTextAndTheFirstElementsCount) {
  EXPECT_TRUE(ParseValidate(StatusAnswer(kValid + std::string("<b/>more"))));
  const auto status = [](const std::string& code) {
    return "<wst:Status><wst:Code>" + code + "</wst:Code><wst:Code>x</wst:Code></wst:Status>";
  };
  EXPECT_FALSE(
      ParseValidate(Envelope(Rstr(status(kInvalid) + status(kValid)) + Rstr(status(kValid)))));
}

TEST(ParseValidateResponseTest, AnyOtherCodeIsUnexpected) {
  for (const std::string& code :
       {std::string(), " " + std::string(kValid), std::string(kValid) + " ",
        std::string(kValid) + "\n", std::string(kValid) + "x",
        std::string("http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/VALID"),
        std::string("valid"), "<b>" + std::string(kValid) + "</b>",
        "<!-- c -->" + std::string(kValid), "<?pi?>" + std::string(kValid)}) {
    EXPECT_EQ(Failure([&] { ParseValidate(StatusAnswer(code)); }), kFormat) << code;
  }
}

TEST(ParseValidateResponseTest, EveryElementOfThePathIsRequired) {
  const std::string code = "<wst:Code>" + std::string(kValid) + "</wst:Code>";
  const std::string status = "<wst:Status>" + code + "</wst:Status>";
  for (const auto& body : {std::string(), Rstr(""), Rstr("<wst:Status/>"), Rstr(code), status,
                           Collection(Rstr(status))}) {
    EXPECT_EQ(Failure([&] { ParseValidate(Envelope(body)); }), kFormat) << body;
  }
}

TEST(ResponseHandlerImplTest, OperationsKeepTheirSlotOrder) {
  const ResponseHandlerImpl handler;
  const ResponseHandler& object = handler;
  using ParseText = void(const void*, Tarnik::Reader*, std::string&);
  std::string assertion;
  VtableSlot<ParseText>(&object, 0)(&object, Tarnik::CreateStringReader(IssueAnswer()).get(),
                                    assertion);
  EXPECT_EQ(assertion, kCanonicalAssertion);
  EXPECT_TRUE((VtableSlot<bool(const void*, Tarnik::Reader*)>(&object, 1)(
      &object, Tarnik::CreateStringReader(StatusAnswer(kValid)).get())));
  assertion.clear();
  VtableSlot<ParseText>(&object, 2)(&object, Tarnik::CreateStringReader(RenewAnswer()).get(),
                                    assertion);
  EXPECT_EQ(assertion, kCanonicalAssertion);
  NegotiationResponse response;
  VtableSlot<void(const void*, Tarnik::Reader*, NegotiationResponse&)>(&object, 3)(
      &object, Tarnik::CreateStringReader(IntermediateAnswer(kExchange)).get(), response);
  EXPECT_EQ(response.contextId, "urn:uuid:1");
}

}  // namespace
}  // namespace SsoClient::Testing
