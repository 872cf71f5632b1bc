// What the signatures of requests prove, and when they are required.
#include <chrono>
#include <cstddef>
#include <cstring>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/server.h"
#include "expect_fault.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts::Testing {
namespace {

using testing::StartsWith;

const Credential& AliceCredential() {
  static const Credential holder = Holder();
  return holder;
}

ProofRequest AliceRequest() {
  return ByCertificate(AliceCredential(), IssueBody("PublicKey", kUseKey),
                       UsernameToken("alice@EXAMPLE.COM", "secret"));
}

TEST(RequestSignatureTest, OfTheCertificateFormIsAccepted) {
  const Server server;
  EXPECT_THAT(Ask(server, Sign(AliceRequest(), AliceCredential())), StartsWith("HTTP/1.1 200"));
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::ByCertificate);
}

TEST(RequestSignatureTest, IsReportedForARefusedRequestToo) {
  const Server server;
  Ask(server, Sign(AliceRequest(), AliceCredential(), {{kUseKey, ""}}));
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::ByCertificate);
  Ask(server, Sign(AliceRequest(), AliceCredential(), {{"<wsse:Reference ", "<wsse:Embedded "}}));
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::Other);
  Ask(server, AliceEnvelope());
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::None);
}

struct TamperCase {
  const char* name;
  const char* from;
  const char* to;
};

class TamperedRequestTest : public testing::TestWithParam<TamperCase> {};

TEST_P(TamperedRequestTest, FailsTheCheck) {
  const Server server;
  const TamperCase& test = GetParam();
  const std::string envelope =
      Replaced(Sign(AliceRequest(), AliceCredential()), test.from, test.to);
  ExpectFault(Ask(server, envelope), "wsse:FailedCheck",
              "The request's signature does not verify: ");
}

INSTANTIATE_TEST_SUITE_P(
    EveryPart, TamperedRequestTest,
    testing::Values(TamperCase{"Body", ">true</wst:Delegatable>", ">false</wst:Delegatable>"},
                    TamperCase{"BodyBlank", "<wst:TokenType>", " <wst:TokenType>"},
                    TamperCase{"Timestamp", ".010Z</wsu:Created>", ".010+00:00</wsu:Created>"},
                    TamperCase{"SignatureValue", "<ds:SignatureValue>", "<ds:SignatureValue>AAAA"}),
    [](const auto& test) { return test.param.name; });

TEST(RequestSignatureTest, MustBeByTheCertificatesKey) {
  const Server server;
  ExpectFault(Ask(server, Sign(AliceRequest(), Holder("another holder"))), "wsse:FailedCheck",
              "The request's signature does not verify: ");
}

TEST(RequestSignatureTest, MayBeInAnIndentedHeader) {
  const Server server;
  const Edits blanks = {{"<wsse:BinarySecurityToken", "\n  <wsse:BinarySecurityToken"},
                        {"<ds:SignedInfo>", "\n<ds:SignedInfo>\n"}};
  EXPECT_THAT(Ask(server, Sign(AliceRequest(), AliceCredential(), blanks)),
              StartsWith("HTTP/1.1 200"));
}

TEST(RequestSignatureTest, OfAWeakOrOtherKeyIsRefused) {
  const Server server;
  for (const KeyType type : {KeyType::Rsa1024, KeyType::EcP256}) {
    CertificateSpec spec;
    spec.commonName = "weak";
    spec.keyType = type;
    const Credential weak = MakeCertificate(spec);
    const ProofRequest request = ByCertificate(weak, IssueBody("PublicKey", kUseKey));
    ExpectFault(Ask(server, Sign(request, weak)), "wsse:InvalidSecurityToken",
                "The certificate's key is not an RSA key of 2048 bits or more");
  }
}

TEST(RequestSignatureTest, ByACertificateOutsideItsValidityIsRefused) {
  const Server server;
  for (const long start : {-7200L, 3600L}) {
    CertificateSpec spec;
    spec.commonName = "holder";
    spec.keyType = KeyType::Rsa2048;
    spec.notBefore = std::chrono::seconds(start);
    spec.notAfter = std::chrono::seconds(start + 3600);
    const Credential holder = MakeCertificate(spec);
    const ProofRequest request = ByCertificate(holder, IssueBody("PublicKey", kUseKey));
    ExpectFault(Ask(server, Sign(request, holder)), "wsse:InvalidSecurityToken",
                "The certificate has expired or is not yet valid");
  }
}

struct TimeCase {
  const char* name;
  long created;
  long expires;
  const char* code;
  const char* reason;
};

class SignedTimestampTest : public testing::TestWithParam<TimeCase> {};

TEST_P(SignedTimestampTest, IsRefused) {
  const Server server;
  const TimeCase& test = GetParam();
  const auto times = [](long created, long expires) {
    return "<wsu:Created>" + TimeFromNow(created) + "</wsu:Created><wsu:Expires>" +
           TimeFromNow(expires) + "</wsu:Expires></wsu:Timestamp>";
  };
  std::string envelope = Sign(AliceRequest(), AliceCredential());
  const std::size_t from = envelope.find("<wsu:Created>");
  const std::size_t end = envelope.find("</wsu:Timestamp>") + std::strlen("</wsu:Timestamp>");
  envelope.replace(from, end - from, times(test.created, test.expires));
  ExpectFault(Ask(server, envelope), test.code, test.reason);
}

INSTANTIATE_TEST_SUITE_P(
    EveryFault, SignedTimestampTest,
    testing::Values(
        TimeCase{"InTheFuture", 120, 720, "wsse:InvalidSecurity", "The Timestamp is in the future"},
        TimeCase{"Expired", -700, -100, "wsu:MessageExpired", "The Timestamp has expired"},
        TimeCase{"ElevenMinutes", 0, 660, "wsse:InvalidSecurity",
                 "The signed Timestamp is not valid for ten minutes"},
        TimeCase{"NineMinutes", 0, 540, "wsse:InvalidSecurity",
                 "The signed Timestamp is not valid for ten minutes"}),
    [](const auto& test) { return test.param.name; });

TEST(RequestSignatureTest, IsRequiredIfItsPartsArePresent) {
  const Server server;
  const ProofRequest request = AliceRequest();
  ExpectFault(Ask(server, Envelope(request.tokens, request.body)), "wsse:InvalidSecurity",
              "A token that names a key needs a signature by that key");
  const std::string wsuId =
      " xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-utility-1.0.xsd\" wsu:Id=\"x\"";
  ExpectFault(Ask(server, Replaced(AliceEnvelope(), "<soapenv:Body", "<soapenv:Body" + wsuId)),
              "wst:InvalidRequest", "Unexpected attribute Id on Body");
}

// Otherwise, a requester could have another subject's token bound to a key that it does not have.
TEST(RequestSignatureTest, IsNeededForAHolderOfKeyTokenByPasswordWithActAs) {
  const Server server;
  const std::string user = UsernameToken("bob@EXAMPLE.COM", "bob-secret");
  const std::string alices = AssertionIn(Ask(server, AliceEnvelope()));
  ExpectFault(Ask(server, Envelope(user, IssueBody("PublicKey", ActAs(alices) + kUseKey))),
              "wst:InvalidRequest", "PublicKey tokens are not issued to unsigned requests");
  ExpectFault(Ask(server, Envelope(user, IssueBody("Bearer", kUseKey))), "wst:InvalidRequest",
              "UseKey names a signature that does not exist");
}

TEST(RequestSignatureTest, OfTheTokenFormIsAccepted) {
  const Server server;
  const std::string token = HolderToken(server, AliceCredential());
  EXPECT_THAT(Ask(server, Sign(ByToken(token, IssueBody("PublicKey")), AliceCredential())),
              StartsWith("HTTP/1.1 200"));
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::ByToken);
}

TEST(RequestSignatureTest, OfTheTokenFormMustBeByTheTokensKey) {
  const Server server;
  const std::string token = HolderToken(server, AliceCredential());
  ExpectFault(Ask(server, Sign(ByToken(token, IssueBody("PublicKey")), Holder("another holder"))),
              "wsse:FailedCheck", "The request's signature does not verify: ");
}

TEST(RequestSignatureTest, OfTheTokenFormNeedsAHolderOfKeyToken) {
  const Server server;
  const std::string bearer = AssertionIn(Ask(server, AliceEnvelope()));
  ExpectFault(Ask(server, Sign(ByToken(bearer, IssueBody("PublicKey")), AliceCredential())),
              "wsse:InvalidSecurityToken", "The presented token is not a holder-of-key token");
}

TEST(RequestSignatureTest, OfTheCertificateFormRefusesAnAssertion) {
  const Server server;
  const std::string token = HolderToken(server, AliceCredential());
  const ProofRequest request =
      ByCertificate(AliceCredential(), IssueBody("PublicKey", kUseKey), token);
  ExpectFault(Ask(server, Sign(request, AliceCredential())), "wsse:InvalidSecurity",
              "An assertion is not expected together with a BinarySecurityToken");
}

}  // namespace
}  // namespace DevSts::Testing
