#include "sts/response_reading.h"

#include <string>
#include <typeinfo>

#include <gtest/gtest.h>
#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>

#include "sts/answers.h"
#include "support/parse_xml.h"

namespace SsoClient::Testing {
namespace {

TEST(ResponseElementsTest, ElementTextIsTheTextOfAFirstTextChild) {
  const struct {
    const char* xml;
    const char* text;
  } kCases[] = {
      {"<a>text</a>", "text"},
      {"<a> text\n</a>", " text\n"},
      {"<a>text<b/>more</a>", "text"},
      {"<a>te<![CDATA[x]]>t</a>", "text"},
      {"<a>&lt;&#65;</a>", "<A"},
      {"<a/>", ""},
      {"<a><b>text</b></a>", ""},
      {"<a><b/>text</a>", ""},
      {"<a><!-- comment -->text</a>", ""},
      {"<a><?pi?>text</a>", ""},
  };
  for (const auto& test : kCases) {
    const auto document = ParseXml(test.xml);
    EXPECT_EQ(ElementText(document->RootElement()), test.text) << test.xml;
    EXPECT_EQ(FirstTextChild(document->RootElement()) != nullptr, test.text[0] != '\0') << test.xml;
  }
  EXPECT_EQ(ElementText(nullptr), "");
  EXPECT_EQ(FirstTextChild(nullptr), nullptr);
}

TEST(ResponseElementsTest, FindDescendantTakesTheFirstOfEachName) {
  const auto document =
      ParseXml(R"(<r xmlns:p="urn:p">text<x/><p:a><b n="1"/><b n="2"/></p:a><a><c/></a></r>)");
  const auto& root = *document->RootElement();
  const auto* found = FindDescendant(root, {"a", "b"});
  ASSERT_NE(found, nullptr);
  EXPECT_EQ(found->FindAttribute("n"), "1");
  EXPECT_EQ(FindDescendant(root, {}), &root);
  EXPECT_EQ(FindDescendant(root, {"a", "c"}), nullptr);
  EXPECT_EQ(FindDescendant(root, {"b"}), nullptr);
  EXPECT_EQ(FindDescendant(root, {"missing", "b"}), nullptr);
}

TEST(ResponseElementsTest, CanonicalTextHasInheritedNamespacesAndNoComments) {
  const auto document = ParseXml(
      R"(<r xmlns="urn:d" xmlns:q="urn:q" xml:lang="en"><a z="1" b='2'><!--c-->t</a></r>)");
  EXPECT_EQ(CanonicalizeElement(document->RootElement()->FirstChildElement("a")),
            R"(<a xmlns="urn:d" xmlns:q="urn:q" b="2" z="1" xml:lang="en">t</a>)");
  EXPECT_EQ(CanonicalizeElement(nullptr), "");
}

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
        "wst:FailedAuthentication ", "wst:a:b"}) {
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

}  // namespace
}  // namespace SsoClient::Testing
