#include "xml/signed_envelope.h"

#include <gmock/gmock.h>

#include "xml/builders.h"
#include "xml/built_xml.h"

namespace SsoClient {
namespace {

constexpr char kEnvelopeStart[] =
    "<soapenv:Envelope xmlns:soapenv=\"http://schemas.xmlsoap.org/soap/envelope/\">";
constexpr char kBodyStart[] =
    "<soapenv:Body xmlns:wst=\"http://docs.oasis-open.org/ws-sx/ws-trust/200512\">";

TEST(EnvelopeTest, HoldsHeaderThenBody) {
  const auto envelope = BuildEnvelope(MakeElementBuilder("", "H"), MakeElementBuilder("", "B"));
  EXPECT_EQ(Testing::BuiltXml(*envelope), std::string(kEnvelopeStart) +
                                              "<soapenv:Header><H/></soapenv:Header>" + kBodyStart +
                                              "<B/></soapenv:Body></soapenv:Envelope>");
}

TEST(EnvelopeTest, AnEmptyHeaderIsSentEmpty) {
  const auto envelope = BuildEnvelope(nullptr, MakeElementBuilder("", "B"));
  EXPECT_EQ(Testing::BuiltXml(*envelope), std::string(kEnvelopeStart) + "<soapenv:Header/>" +
                                              kBodyStart +
                                              "<B/></soapenv:Body></soapenv:Envelope>");
}

TEST(EnvelopeTest, DeclaresWstForBodiesThatDoNot) {
  const auto envelope =
      Testing::Built(*BuildEnvelope(nullptr, MakeElementBuilder("wst", "Response")));
  const auto* response = envelope->FirstChildElement("Body")->FirstChildElement("Response");
  EXPECT_EQ(response->NamespaceUri(), "http://docs.oasis-open.org/ws-sx/ws-trust/200512");
}

}  // namespace
}  // namespace SsoClient
