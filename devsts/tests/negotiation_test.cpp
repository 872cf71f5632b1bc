#include "devsts/negotiation.h"

#include <gmock/gmock.h>

#include <thread>

#include "expect_fault.h"
#include "negotiation_fixture.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts::Testing {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

class NegotiationTest : public NegotiationFixture {};

TEST_F(NegotiationTest, LogsInByOneLeg) {
  const Server server(Options());
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  const std::string answer = client.SendFirst(gss.Step());
  ASSERT_THAT(answer, StartsWith("HTTP/1.1 200 OK\r\n")) << answer;
  EXPECT_EQ(ContextIn(answer), client.context);
  const std::string assertion = AssertionIn(answer);
  EXPECT_EQ(ElementText(assertion, "saml2:NameID"), "alice@EXAMPLE.COM");
  EXPECT_EQ(ElementText(assertion, "saml2:AuthnContextClassRef"),
            "urn:oasis:names:tc:SAML:2.0:ac:classes:Kerberos");
  EXPECT_THAT(assertion, HasSubstr(">EXAMPLE\\staff<"));
  EXPECT_TRUE(VerifyXml(assertion, server.SigningCertificatePem()));
  gss.Step(LegIn(answer));
  EXPECT_TRUE(gss.IsDone());
  EXPECT_EQ(server.OpenNegotiations(), 0U);
}

}  // namespace
}  // namespace DevSts::Testing
