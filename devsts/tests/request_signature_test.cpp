// What the service refuses of a request's signature, one rule at a time.
#include <gmock/gmock.h>

#include <cstring>

#include "devsts/server.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts {
namespace {

using Testing::Ask;
using Testing::AssertionIn;
using Testing::ByCertificate;
using Testing::ByToken;
using Testing::Edits;
using Testing::ElementText;
using Testing::Envelope;
using Testing::Holder;
using Testing::HolderToken;
using Testing::IssueBody;
using Testing::kTimestampId;
using Testing::kUseKey;
using Testing::ProofRequest;
using Testing::ReferenceTo;
using Testing::Replaced;
using Testing::Sign;
using testing::StartsWith;
using Testing::TimeFromNow;
using Testing::UsernameToken;

constexpr char kExclusive[] = "Algorithm=\"http://www.w3.org/2001/10/xml-exc-c14n#\"";
constexpr char kInclusive[] = "Algorithm=\"http://www.w3.org/TR/2001/REC-xml-c14n-20010315\"";

const Credential& Alices() {
  static const Credential holder = Holder();
  return holder;
}

ProofRequest AlicesRequest() {
  return ByCertificate(Alices(), IssueBody("PublicKey", kUseKey),
                       UsernameToken("alice@EXAMPLE.COM", "secret"));
}

void ExpectFault(const std::string& answer, const std::string& code, const std::string& reason) {
  EXPECT_THAT(answer, StartsWith("HTTP/1.1 500 Internal Server Error\r\n"));
  EXPECT_EQ(ElementText(answer, "faultcode"), code);
  EXPECT_THAT(ElementText(answer, "faultstring"), StartsWith(reason));
}

struct RuleCase {
  const char* name;
  Edits edits;  // made before the request is signed
  const char* code;
  std::string reason;
};

std::string NameOf(const testing::TestParamInfo<RuleCase>& test) {
  return test.param.name;
}

class CertificateForm : public testing::TestWithParam<RuleCase> {};

TEST_P(CertificateForm, RefusesWhatBreaksOneRule) {
  const Server server;
  const RuleCase& rule = GetParam();
  ExpectFault(Ask(server, Sign(AlicesRequest(), Alices(), rule.edits)), rule.code, rule.reason);
}

std::string Algorithm(const char* uri) {
  return std::string("Algorithm=\"") + uri + "\"";
}

INSTANTIATE_TEST_SUITE_P(
    Signature, CertificateForm,
    testing::Values(RuleCase{"NotTheLastElement",
                             {{"</ds:Signature>", "</ds:Signature><wsse:Other/>"}},
                             "wsse:InvalidSecurity",
                             "The Signature is not the last element of Security"},
                    RuleCase{"OtherSignatureId",
                             {{"Id=\"holderOfKeyProofSignature\"", "Id=\"other\""}},
                             "wsse:InvalidSecurity",
                             "Signature/@Id is not holderOfKeyProofSignature"},
                    RuleCase{"NoSignatureId",
                             {{" Id=\"holderOfKeyProofSignature\"", ""}},
                             "wst:InvalidRequest",
                             "Missing attribute Id on Signature"},
                    RuleCase{"SignedObject",
                             {{"</ds:Signature>", "<ds:Object/></ds:Signature>"}},
                             "wst:InvalidRequest",
                             "Unexpected element Object in Signature"},
                    RuleCase{
                        "TwoElementsOfOneId",
                        {{"<wst:RequestSecurityToken", "<wst:RequestSecurityToken Id=\"Body-1\""}},
                        "wsse:InvalidSecurity",
                        "The request is ambiguous: two elements have the id Body-1"},
                    RuleCase{"BodyWithoutId",
                             {{" wsu:Id=\"Body-1\"", ""}},
                             "wst:InvalidRequest",
                             "Missing attribute Id on Body"},
                    RuleCase{"TimestampWithoutId",
                             {{" wsu:Id=\"Timestamp-1\"", ""}},
                             "wst:InvalidRequest",
                             "Missing attribute Id on Timestamp"}),
    NameOf);

INSTANTIATE_TEST_SUITE_P(
    References, CertificateForm,
    testing::Values(RuleCase{"TimestampBeforeBody",
                             {{"URI=\"#Body-1\"", "URI=\"#x\""},
                              {"URI=\"#Timestamp-1\"", "URI=\"#Body-1\""},
                              {"URI=\"#x\"", "URI=\"#Timestamp-1\""}},
                             "wsse:InvalidSecurity",
                             "The Body is not the target of its Reference: #Timestamp-1"},
                    RuleCase{"WholeDocument",
                             {{"URI=\"#Body-1\"", "URI=\"\""}},
                             "wsse:InvalidSecurity",
                             "The Body is not the target of its Reference: "},
                    RuleCase{"OtherTimestamp",
                             {{"URI=\"#Timestamp-1\"", "URI=\"#holderOfKeyCertificate\""}},
                             "wsse:InvalidSecurity",
                             "The Timestamp is not the target of its Reference: "
                             "#holderOfKeyCertificate"},
                    RuleCase{"BodyOnly",
                             {{ReferenceTo(kTimestampId), ""}},
                             "wst:InvalidRequest",
                             "Expected Reference (http://www.w3.org/2000/09/xmldsig#) in "
                             "SignedInfo, found nothing"},
                    RuleCase{"Three",
                             {{"</ds:SignedInfo>", ReferenceTo(kTimestampId) + "</ds:SignedInfo>"}},
                             "wsse:InvalidSecurity",
                             "The Signature has more than two References"},
                    RuleCase{"TwoTransforms",
                             {{"</ds:Transforms>",
                               std::string("<ds:Transform ") + kExclusive + "/></ds:Transforms>"}},
                             "wsse:InvalidSecurity",
                             "A Reference has more than one Transform"},
                    RuleCase{"TransformWithPrefixes",
                             {{std::string("<ds:Transform ") + kExclusive + "/>",
                               std::string("<ds:Transform ") + kExclusive +
                                   "><ec:InclusiveNamespaces PrefixList=\"wst\" "
                                   "xmlns:ec=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>"
                                   "</ds:Transform>"}},
                             "wst:InvalidRequest",
                             "Unexpected element InclusiveNamespaces in Transform"}),
    NameOf);

INSTANTIATE_TEST_SUITE_P(
    Algorithms, CertificateForm,
    testing::Values(
        RuleCase{"InclusiveSignedInfo",
                 {{kExclusive, kInclusive}},
                 "wsse:UnsupportedAlgorithm",
                 "CanonicalizationMethod is not http://www.w3.org/2001/10/xml-exc-c14n# but "
                 "http://www.w3.org/TR/2001/REC-xml-c14n-20010315"},
        RuleCase{"InclusiveTransform",
                 {{std::string("<ds:Transform ") + kExclusive,
                   std::string("<ds:Transform ") + kInclusive}},
                 "wsse:UnsupportedAlgorithm",
                 "Transform is not http://www.w3.org/2001/10/xml-exc-c14n# but "
                 "http://www.w3.org/TR/2001/REC-xml-c14n-20010315"},
        RuleCase{"Sha1Digest",
                 {{Algorithm("http://www.w3.org/2001/04/xmlenc#sha256"),
                   Algorithm("http://www.w3.org/2000/09/xmldsig#sha1")}},
                 "wsse:UnsupportedAlgorithm",
                 "DigestMethod is not http://www.w3.org/2001/04/xmlenc#sha256 but "
                 "http://www.w3.org/2000/09/xmldsig#sha1"},
        RuleCase{"RsaSha1",
                 {{"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256",
                   "http://www.w3.org/2000/09/xmldsig#rsa-sha1"}},
                 "wsse:UnsupportedAlgorithm",
                 "SignatureMethod is not http://www.w3.org/2001/04/xmldsig-more#rsa-sha256 but "
                 "http://www.w3.org/2000/09/xmldsig#rsa-sha1"},
        RuleCase{"RsaSha512",
                 {{"#rsa-sha256", "#rsa-sha512"}},
                 "wsse:UnsupportedAlgorithm",
                 "SignatureMethod is not "},
        RuleCase{"Hmac",
                 {{"#rsa-sha256", "#hmac-sha256"}},
                 "wsse:UnsupportedAlgorithm",
                 "SignatureMethod is not "}),
    NameOf);

INSTANTIATE_TEST_SUITE_P(
    KeyInfo, CertificateForm,
    testing::Values(
        RuleCase{"OtherReferenceUri",
                 {{"URI=\"#holderOfKeyCertificate\"", "URI=\"#Body-1\""}},
                 "wsse:InvalidSecurity",
                 "Reference/@URI is not #holderOfKeyCertificate but #Body-1"},
        RuleCase{"OtherReferenceType",
                 {{"<wsse:Reference URI=\"#holderOfKeyCertificate\" ValueType=\"http",
                   "<wsse:Reference URI=\"#holderOfKeyCertificate\" ValueType=\"urn"}},
                 "wsse:InvalidSecurity",
                 "Reference/@ValueType is not http"},
        RuleCase{"OtherEncodingType",
                 {{"EncodingType=\"http", "EncodingType=\"urn"}},
                 "wsse:InvalidSecurity",
                 "BinarySecurityToken/@EncodingType is not http"},
        RuleCase{"OtherValueType",
                 {{"#X509v3", "#X509v1"}},
                 "wsse:InvalidSecurity",
                 "BinarySecurityToken/@ValueType is not http"},
        RuleCase{"OtherTokenId",
                 {{"wsu:Id=\"holderOfKeyCertificate\"", "wsu:Id=\"certificate\""}},
                 "wsse:InvalidSecurity",
                 "BinarySecurityToken/@Id is not holderOfKeyCertificate but certificate"},
        RuleCase{"NoCertificate",
                 {{">MII", ">NII"}},
                 "wsse:InvalidSecurityToken",
                 "The BinarySecurityToken holds no certificate: "},
        RuleCase{"OctetsBehindTheCertificate",
                 {{"</wsse:BinarySecurityToken>", "AAAA</wsse:BinarySecurityToken>"}},
                 "wsse:InvalidSecurityToken",
                 "The BinarySecurityToken holds no certificate: "},
        RuleCase{"NoBinarySecurityToken",
                 {{"<wsse:BinarySecurityToken ", "<!--"}, {"</wsse:BinarySecurityToken>", "-->"}},
                 "wsse:InvalidSecurity",
                 "The signature refers to a BinarySecurityToken, but there is none"},
        RuleCase{"NoReference",
                 {{"<wsse:Reference ", "<wsse:Embedded "}},
                 "wsse:InvalidSecurity",
                 "The SecurityTokenReference is neither a Reference nor a KeyIdentifier"},
        RuleCase{"BareKey",
                 {{"<ds:KeyInfo>", "<ds:KeyInfo><ds:KeyName/>"}},
                 "wst:InvalidRequest",
                 "Expected SecurityTokenReference"},
        RuleCase{"NoKeyInfo",
                 {{"<ds:KeyInfo>", "<!--"}, {"</ds:KeyInfo>", "-->"}},
                 "wst:InvalidRequest",
                 "Expected KeyInfo (http://www.w3.org/2000/09/xmldsig#) in Signature, found "
                 "nothing"}),
    NameOf);

INSTANTIATE_TEST_SUITE_P(
    UseKey, CertificateForm,
    testing::Values(RuleCase{"Missing", {{kUseKey, ""}}, "wst:InvalidRequest", "UseKey is missing"},
                    RuleCase{"NamesNoSignature",
                             {{"Sig=\"holderOfKeyProofSignature\"", "Sig=\"other\""}},
                             "wst:InvalidRequest",
                             "UseKey/@Sig does not name the request's signature: other"},
                    RuleCase{"BesideDelegateTo",
                             {{kUseKey, Testing::DelegateTo("bob@EXAMPLE.COM") + kUseKey}},
                             "wst:InvalidRequest",
                             "UseKey is not expected beside DelegateTo"},
                    RuleCase{"ForABearerToken",
                             {{"/PublicKey<", "/Bearer<"}},
                             "wst:InvalidRequest",
                             "A request signed with a certificate must ask for a PublicKey token"}),
    NameOf);

TEST(RequestSignature, OfTheCertificateFormIsAccepted) {
  const Server server;
  EXPECT_THAT(Ask(server, Sign(AlicesRequest(), Alices())), StartsWith("HTTP/1.1 200"));
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::ByCertificate);
}

TEST(RequestSignature, IsSeenOfARefusedRequestToo) {
  const Server server;
  Ask(server, Sign(AlicesRequest(), Alices(), {{kUseKey, ""}}));
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::ByCertificate);
  Ask(server, Sign(AlicesRequest(), Alices(), {{"<wsse:Reference ", "<wsse:Embedded "}}));
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::Other);
  Ask(server, Testing::AliceEnvelope());
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::None);
}

struct TamperCase {
  const char* name;
  const char* from;
  const char* to;
};

class TamperedRequest : public testing::TestWithParam<TamperCase> {};

TEST_P(TamperedRequest, FailsTheCheck) {
  const Server server;
  const TamperCase& test = GetParam();
  const std::string envelope = Replaced(Sign(AlicesRequest(), Alices()), test.from, test.to);
  ExpectFault(Ask(server, envelope), "wsse:FailedCheck",
              "The request's signature does not verify: ");
}

INSTANTIATE_TEST_SUITE_P(
    EveryPart, TamperedRequest,
    testing::Values(TamperCase{"Body", ">true</wst:Delegatable>", ">false</wst:Delegatable>"},
                    TamperCase{"BodyBlank", "<wst:TokenType>", " <wst:TokenType>"},
                    TamperCase{"Timestamp", ".010Z</wsu:Created>", ".010+00:00</wsu:Created>"},
                    TamperCase{"SignatureValue", "<ds:SignatureValue>", "<ds:SignatureValue>AAAA"}),
    [](const auto& test) { return test.param.name; });

TEST(RequestSignature, MustBeByTheCertificatesKey) {
  const Server server;
  ExpectFault(Ask(server, Sign(AlicesRequest(), Holder("somebody else"))), "wsse:FailedCheck",
              "The request's signature does not verify: ");
}

TEST(RequestSignature, MayBeInAnIndentedHeader) {
  const Server server;
  const Edits blanks = {{"<wsse:BinarySecurityToken", "\n  <wsse:BinarySecurityToken"},
                        {"<ds:SignedInfo>", "\n<ds:SignedInfo>\n"}};
  EXPECT_THAT(Ask(server, Sign(AlicesRequest(), Alices(), blanks)), StartsWith("HTTP/1.1 200"));
}

TEST(RequestSignature, OfAWeakOrOtherKeyIsRefused) {
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

TEST(RequestSignature, ByACertificateOutOfItsTimeIsRefused) {
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

class SignedTimestamp : public testing::TestWithParam<TimeCase> {};

TEST_P(SignedTimestamp, IsRefused) {
  const Server server;
  const TimeCase& test = GetParam();
  const auto times = [](long created, long expires) {
    return "<wsu:Created>" + TimeFromNow(created) + "</wsu:Created><wsu:Expires>" +
           TimeFromNow(expires) + "</wsu:Expires></wsu:Timestamp>";
  };
  std::string envelope = Sign(AlicesRequest(), Alices());
  const std::size_t from = envelope.find("<wsu:Created>");
  const std::size_t end = envelope.find("</wsu:Timestamp>") + std::strlen("</wsu:Timestamp>");
  envelope.replace(from, end - from, times(test.created, test.expires));
  ExpectFault(Ask(server, envelope), test.code, test.reason);
}

INSTANTIATE_TEST_SUITE_P(
    EveryFault, SignedTimestamp,
    testing::Values(
        TimeCase{"InTheFuture", 120, 720, "wsse:InvalidSecurity", "The Timestamp is in the future"},
        TimeCase{"Expired", -700, -100, "wsu:MessageExpired", "The Timestamp has expired"},
        TimeCase{"ElevenMinutes", 0, 660, "wsse:InvalidSecurity",
                 "The signed Timestamp is not valid for ten minutes"},
        TimeCase{"NineMinutes", 0, 540, "wsse:InvalidSecurity",
                 "The signed Timestamp is not valid for ten minutes"}),
    [](const auto& test) { return test.param.name; });

TEST(RequestSignature, IsMissedWhereItsPartsAre) {
  const Server server;
  const ProofRequest request = AlicesRequest();
  ExpectFault(Ask(server, Envelope(request.tokens, request.body)), "wsse:InvalidSecurity",
              "A token that names a key needs a signature by that key");
  const std::string wsuId =
      " xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-utility-1.0.xsd\" wsu:Id=\"x\"";
  ExpectFault(
      Ask(server, Replaced(Testing::AliceEnvelope(), "<soapenv:Body", "<soapenv:Body" + wsuId)),
      "wst:InvalidRequest", "Unexpected attribute Id on Body");
}

// The subject could have anybody's key bound to somebody's token.
TEST(RequestSignature, IsNeededForAHolderOfKeyTokenByPasswordWithActAs) {
  const Server server;
  const std::string user = UsernameToken("bob@EXAMPLE.COM", "bob-secret");
  const std::string alices = AssertionIn(Ask(server, Testing::AliceEnvelope()));
  ExpectFault(Ask(server, Envelope(user, IssueBody("PublicKey", Testing::ActAs(alices) + kUseKey))),
              "wst:InvalidRequest", "PublicKey tokens are not issued to unsigned requests");
  ExpectFault(Ask(server, Envelope(user, IssueBody("Bearer", kUseKey))), "wst:InvalidRequest",
              "UseKey names a signature that is not there");
}

class TokenForm : public testing::TestWithParam<RuleCase> {};

TEST_P(TokenForm, RefusesWhatBreaksOneRule) {
  const Server server;
  const std::string token = HolderToken(server, Alices());
  const ProofRequest request = ByToken(token, IssueBody("PublicKey"));
  const RuleCase& rule = GetParam();
  ExpectFault(Ask(server, Sign(request, Alices(), rule.edits)), rule.code, rule.reason);
}

INSTANTIATE_TEST_SUITE_P(
    KeyInfo, TokenForm,
    testing::Values(
        RuleCase{"HyphenInTheTokenType",
                 {{"saml-tokenprofile-1.1#SAMLV2.0", "saml-token-profile-1.1#SAMLV2.0"}},
                 "wsse:InvalidSecurity",
                 "SecurityTokenReference/@TokenType is not "
                 "http://docs.oasis-open.org/wss/oasis-wss-saml-tokenprofile-1.1#SAMLV2.0 but "},
        RuleCase{"NoHyphenInTheValueType",
                 {{"saml-token-profile-1.1#SAMLID", "saml-tokenprofile-1.1#SAMLID"}},
                 "wsse:InvalidSecurity",
                 "KeyIdentifier/@ValueType is not "
                 "http://docs.oasis-open.org/wss/oasis-wss-saml-token-profile-1.1#SAMLID but "},
        RuleCase{"NoTokenType",
                 {{" wsse11:TokenType=", " wsse11:Usage="}},
                 "wst:InvalidRequest",
                 "Unexpected attribute Usage on SecurityTokenReference"},
        RuleCase{"OtherAssertion",
                 {{"</wsse:KeyIdentifier>", "0</wsse:KeyIdentifier>"}},
                 "wsse:InvalidSecurity",
                 "The KeyIdentifier names no assertion of the header: _"},
        RuleCase{"UsernameTokenBeside",
                 {{"<saml2:Assertion", UsernameToken("bob@EXAMPLE.COM", "x") + "<saml2:Assertion"}},
                 "wsse:InvalidSecurity",
                 "An assertion that proves the key must be the only token"},
        RuleCase{"UseKey",
                 {{"</wst:Delegatable>", std::string("</wst:Delegatable>") + kUseKey}},
                 "wst:InvalidRequest",
                 "UseKey is not expected in a request made with a token"}),
    NameOf);

TEST(RequestSignature, OfTheTokenFormIsAccepted) {
  const Server server;
  const std::string token = HolderToken(server, Alices());
  EXPECT_THAT(Ask(server, Sign(ByToken(token, IssueBody("PublicKey")), Alices())),
              StartsWith("HTTP/1.1 200"));
  EXPECT_EQ(server.LastRequest().signature, RequestSignature::ByToken);
}

TEST(RequestSignature, OfTheTokenFormMustBeByTheTokensKey) {
  const Server server;
  const std::string token = HolderToken(server, Alices());
  ExpectFault(Ask(server, Sign(ByToken(token, IssueBody("PublicKey")), Holder("somebody else"))),
              "wsse:FailedCheck", "The request's signature does not verify: ");
}

TEST(RequestSignature, OfTheTokenFormNeedsAHolderOfKeyToken) {
  const Server server;
  const std::string bearer = AssertionIn(Ask(server, Testing::AliceEnvelope()));
  ExpectFault(Ask(server, Sign(ByToken(bearer, IssueBody("PublicKey")), Alices())),
              "wsse:InvalidSecurityToken", "The presented token is not a holder-of-key token");
}

TEST(RequestSignature, OfTheCertificateFormHasNoAssertionBeside) {
  const Server server;
  const std::string token = HolderToken(server, Alices());
  const ProofRequest request = ByCertificate(Alices(), IssueBody("PublicKey", kUseKey), token);
  ExpectFault(Ask(server, Sign(request, Alices())), "wsse:InvalidSecurity",
              "An assertion is not expected beside a BinarySecurityToken");
}

}  // namespace
}  // namespace DevSts
