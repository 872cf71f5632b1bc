#include "sts/soap_fault.h"

#include <string>
#include <typeinfo>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>

#include "sts/answers.h"
#include "sts/log_capture.h"
#include "support/parse_xml.h"

namespace SsoClient::Testing {
namespace {

constexpr char kExpired[] = "Password of the user logging on is expired";

struct Thrown {
  std::string type;
  std::string message;

  bool operator==(const Thrown& other) const = default;
};

template <class Exception>
Thrown Expect(const std::string& message) {
  return {typeid(Exception).name(), message};
}

Thrown ThrownFor(const std::string& envelope) {
  const auto document = ParseXml(envelope);
  try {
    CheckSoapFault(*document->RootElement());
  } catch (const Tarnik::Exception& error) {
    return {typeid(error).name(), error.Message()};
  }
  return {"none", ""};
}

TEST(SoapFaultTest, PassesAnAnswerWithoutAFault) {
  const Thrown none = {"none", ""};
  EXPECT_EQ(ThrownFor(Envelope("")), none);
  EXPECT_EQ(ThrownFor(Envelope("<wst:RequestSecurityTokenResponse/>")), none);
  EXPECT_EQ(ThrownFor("<Envelope/>"), none);
  EXPECT_EQ(ThrownFor("<Envelope><Fault/></Envelope>"), none);
  EXPECT_EQ(ThrownFor("<Envelope><Other><Fault/></Other></Envelope>"), none);
  EXPECT_EQ(ThrownFor("<Envelope><Body><a><Fault/></a></Body></Envelope>"), none);
}

TEST(SoapFaultTest, AFaultNeedsATextualCode) {
  const auto missing = Expect<SsoException>("Invalid SOAP response: missing faultcode.");
  EXPECT_EQ(ThrownFor(Envelope(Fault(""))), missing);
  EXPECT_EQ(ThrownFor(Envelope(Fault("<faultstring>text</faultstring>"))), missing);
  EXPECT_EQ(ThrownFor(Envelope(Fault("<faultcode/>"))), missing);
  EXPECT_EQ(ThrownFor(Envelope(Fault("<faultcode><b/>wst:FailedAuthentication</faultcode>"))),
            missing);
  EXPECT_EQ(ThrownFor(Envelope(Fault("<faultcode><!-- c -->wst:X</faultcode>"))), missing);
}

TEST(SoapFaultTest, CodesOfRejectedCredentials) {
  for (const std::string code :
       {"wst:FailedAuthentication", "wst:InvalidSecurityToken", "wsse:InvalidSecurityToken"}) {
    EXPECT_EQ(ThrownFor(Envelope(Fault(code, "no entry"))),
              Expect<InvalidCredentialsException>("Authentication failed: no entry"));
    EXPECT_EQ(ThrownFor(Envelope(Fault(code, ""))),
              Expect<InvalidCredentialsException>("Authentication failed"));
    EXPECT_EQ(ThrownFor(Envelope(Fault("<faultcode>" + code + "</faultcode>"))),
              Expect<InvalidCredentialsException>("Authentication failed"));
    EXPECT_EQ(ThrownFor(Envelope(Fault("<faultcode>" + code +
                                       "</faultcode><faultstring><b>no entry</b></faultstring>"))),
              Expect<InvalidCredentialsException>("Authentication failed"));
  }
}

// XML Schema Part 2, section 4.3.6: white space around a QName is not part of it.
TEST(SoapFaultTest, CodesMayHaveWhiteSpaceAroundThem) {
  for (const std::string code : {"\n      wst:FailedAuthentication\n    ",
                                 "wst:FailedAuthentication\t", " wsse:InvalidSecurityToken"}) {
    EXPECT_EQ(ThrownFor(Envelope(Fault(code, "no entry"))),
              Expect<InvalidCredentialsException>("Authentication failed: no entry"))
        << code;
  }
  EXPECT_EQ(ThrownFor(Envelope(Fault(" wst:FailedAuthentication ", kExpired))),
            Expect<PasswordExpiredException>("Authentication failed: " + std::string(kExpired)));
}

TEST(SoapFaultTest, CodesAreComparedByTheirNamespace) {
  const std::string foreign =
      R"(<faultcode xmlns:f="http://docs.oasis-open.org/ws-sx/ws-trust/200512">)"
      "f:FailedAuthentication</faultcode>";
  EXPECT_EQ(ThrownFor(Envelope(Fault(foreign))),
            Expect<InvalidCredentialsException>("Authentication failed"));
  const std::string rebound =
      R"(<faultcode xmlns:wst="urn:other">wst:FailedAuthentication</faultcode>)";
  EXPECT_EQ(
      ThrownFor(Envelope(Fault(rebound))),
      Expect<SsoException>("Unexpected SOAP fault: wst:FailedAuthentication; request failed."));
}

TEST(SoapFaultTest, AnyOtherCodeIsReportedAsReceived) {
  for (const std::string code :
       {"wsse:FailedAuthentication", "S:Server", "wst:InvalidRequest", "wst:failedauthentication",
        "wst:FailedAuthentication2", "FailedAuthentication", "InvalidSecurityToken",
        "wst:Failed Authentication", "wst:a:b", " S:Server\n"}) {
    EXPECT_EQ(ThrownFor(Envelope(Fault(code, std::string(kExpired)))),
              Expect<SsoException>("Unexpected SOAP fault: " + code + "; request failed."));
  }
}

TEST(SoapFaultTest, AnExpiredPasswordIsRecognisedByThePrefixOfTheText) {
  EXPECT_EQ(ThrownFor(Envelope(Fault("wst:FailedAuthentication", kExpired))),
            Expect<PasswordExpiredException>(
                "Authentication failed: Password of the user logging on is expired"));
  EXPECT_EQ(
      ThrownFor(Envelope(Fault("wst:FailedAuthentication", std::string(kExpired) + ". :: alice"))),
      Expect<PasswordExpiredException>(
          "Authentication failed: Password of the user logging on is expired. :: alice"));
}

TEST(SoapFaultTest, TheExpiryTextElsewhereIsNotAnExpiredPassword) {
  const std::string later = "Sorry: " + std::string(kExpired);
  EXPECT_EQ(ThrownFor(Envelope(Fault("wst:FailedAuthentication", later))),
            Expect<InvalidCredentialsException>("Authentication failed: " + later));
  const std::string cut = std::string(kExpired).substr(0, 40);
  EXPECT_EQ(ThrownFor(Envelope(Fault("wst:FailedAuthentication", cut))),
            Expect<InvalidCredentialsException>("Authentication failed: " + cut));
  for (const std::string code : {"wst:InvalidSecurityToken", "wsse:InvalidSecurityToken"}) {
    EXPECT_EQ(
        ThrownFor(Envelope(Fault(code, kExpired))),
        Expect<InvalidCredentialsException>("Authentication failed: " + std::string(kExpired)));
  }
}

TEST(SoapFaultTest, AnUnboundPrefixPassesTheResolversError) {
  EXPECT_EQ(ThrownFor("<Envelope><Body><Fault><faultcode>no:Code</faultcode></Fault></Body>"
                      "</Envelope>"),
            Expect<ParseException>("Element faultcodeat 1,24 uses undefined prefix: `no'"));
}

TEST(SoapFaultTest, NamespacesOfTheFaultsElementsAreNotCompared) {
  EXPECT_EQ(ThrownFor(R"(<a:E xmlns:a="urn:a" xmlns:b="urn:b"><b:Body><a:Fault>)"
                      "<b:faultcode>code</b:faultcode></a:Fault></b:Body></a:E>"),
            Expect<SsoException>("Unexpected SOAP fault: code; request failed."));
}

TEST(SoapFaultTest, OnlyTheFirstFaultCodeAndTheFirstFaultStringCount) {
  EXPECT_EQ(ThrownFor(Envelope(Fault("<faultcode>wst:FailedAuthentication</faultcode>"
                                     "<faultstring>first</faultstring>"
                                     "<faultstring>second</faultstring>"))),
            Expect<InvalidCredentialsException>("Authentication failed: first"));

  EXPECT_EQ(ThrownFor(Envelope(Fault("<faultcode>S:Server</faultcode>"
                                     "<faultcode>wst:FailedAuthentication</faultcode>"))),
            Expect<SsoException>("Unexpected SOAP fault: S:Server; request failed."));
}

TEST(SoapFaultTest, TheFaultStringOfARefusedTimestampIsLogged) {
  const LogCapture log(4);
  const std::string fault = "<faultcode>wsse:InvalidSecurity</faultcode><faultstring>";
  ThrownFor(Envelope(Fault(fault + "The clock&#10;is ahead</faultstring>")));
  ThrownFor(Envelope(Fault(fault + std::string(60000, 'x') + "</faultstring>")));
  ThrownFor(Envelope(Fault(fault + "</faultstring>")));
  ThrownFor(
      Envelope(Fault("<faultcode>S:Server</faultcode><faultstring>not a timestamp</faultstring>")));
  ThrownFor(Envelope(
      Fault("<faultcode>wst:FailedAuthentication</faultcode><faultstring>no</faultstring>")));
  const std::string line = "4 The service answered with fault `wsse:InvalidSecurity': ";
  EXPECT_EQ(log.Lines(), (std::vector<std::string>{line + "The clock?is ahead",
                                                   line + std::string(1000, 'x') + "..."}));
}

TEST(SoapFaultTest, TheFaultStringIsLoggedForEveryCodeOfARefusedTimestamp) {
  const LogCapture log(4);
  const std::string wsu = R"( xmlns:wsu="http://docs.oasis-open.org/wss/2004/01/)"
                          R"(oasis-200401-wss-wssecurity-utility-1.0.xsd")";
  for (const std::string code :
       {"wsu:MessageExpired", "wsse:MessageExpired", "wsse:InvalidSecurity", "wsu:InvalidSecurity",
        "wst:MessageExpired", "wsse:messageexpired"}) {
    const std::string fault = "<faultcode" + wsu + ">" + code + "</faultcode>";
    EXPECT_EQ(ThrownFor(Envelope(Fault(fault + "<faultstring>late</faultstring>"))),
              Expect<SsoException>("Unexpected SOAP fault: " + code + "; request failed."));
  }
  const std::string line = "4 The service answered with fault `";
  EXPECT_EQ(log.Lines(), (std::vector<std::string>{line + "wsu:MessageExpired': late",
                                                   line + "wsse:MessageExpired': late",
                                                   line + "wsse:InvalidSecurity': late"}));
}

TEST(SoapFaultTest, ALongFaultCodeIsLoggedInPart) {
  const LogCapture log(4);
  const std::string prefix(2000, 'p');
  const std::string code = prefix + ":InvalidSecurity";
  EXPECT_EQ(ThrownFor(Envelope(Fault("<faultcode xmlns:" + prefix +
                                     R"(="http://docs.oasis-open.org/wss/2004/01/)"
                                     R"(oasis-200401-wss-wssecurity-secext-1.0.xsd">)" +
                                     code + "</faultcode><faultstring>late</faultstring>"))),
            Expect<SsoException>("Unexpected SOAP fault: " + code + "; request failed."));
  EXPECT_EQ(log.Lines(), (std::vector<std::string>{"4 The service answered with fault `" +
                                                   prefix.substr(0, 1000) + "...': late"}));
}

}  // namespace
}  // namespace SsoClient::Testing
