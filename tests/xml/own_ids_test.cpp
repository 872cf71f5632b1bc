#include "xml/signed_envelope.h"

#include <gtest/gtest.h>
#include <tarnik/core/exception.h>

#include <string>

#include "support/parse_xml.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

std::string Complaint(const std::string& xml) {
  const auto document = Testing::ParseXml(xml);
  return TestSupport::ThrownMessage<Tarnik::InvalidArgumentException>(
      [&] { RejectReservedIds(*document->RootElement()); });
}

TEST(OwnIdsTest, AcceptsOtherIdsAndOneCertificate) {
  const std::string accepted = "Nothing was thrown.";
  EXPECT_EQ(Complaint("<a Id=\"1\"><b Id=\"1\">text</b><!-- --><c/></a>"), accepted);
  EXPECT_EQ(Complaint("<a><b><c Id=\"holderOfKeyCertificate\"/></b></a>"), accepted);
  EXPECT_EQ(Complaint("<a Name=\"holderOfKeyProofSignature\">holderOfKeyProofSignature</a>"),
            accepted);
}

TEST(OwnIdsTest, RefusesTheSignatureIdAnywhere) {
  const std::string refused =
      "A token in the request carries the id 'holderOfKeyProofSignature', which is the request's "
      "own";
  for (const char* element :
       {"<c Id=\"holderOfKeyProofSignature\"/>", "<c ID=\"holderOfKeyProofSignature\"/>",
        "<c id=\"holderOfKeyProofSignature\"/>", "<c xml:id=\"holderOfKeyProofSignature\"/>",
        "<c xmlns:p=\"urn:p\" a=\"b\" p:Id=\"holderOfKeyProofSignature\"/>"}) {
    EXPECT_EQ(Complaint(element), refused) << element;
    EXPECT_EQ(Complaint("<a>text<b/><b><d/>" + std::string(element) + "</b></a>"), refused)
        << element;
    EXPECT_EQ(Complaint("<a><b><d/></b>" + std::string(element) + "</a>"), refused) << element;
  }
}

TEST(OwnIdsTest, RefusesASecondCertificateId) {
  EXPECT_EQ(Complaint("<a><b Id=\"holderOfKeyCertificate\"/><c><d id=\"holderOfKeyCertificate\"/>"
                      "</c></a>"),
            "A token in the request carries the id 'holderOfKeyCertificate', which is the "
            "request's own");
}

}  // namespace
}  // namespace SsoClient
