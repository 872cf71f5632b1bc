// Requests that each break one rule for signatures.
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/server.h"
#include "expect_fault.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts::Testing {
namespace {

constexpr char kExclusive[] = "Algorithm=\"http://www.w3.org/2001/10/xml-exc-c14n#\"";
constexpr char kInclusive[] = "Algorithm=\"http://www.w3.org/TR/2001/REC-xml-c14n-20010315\"";

const Credential& AliceCredential() {
  static const Credential holder = Holder();
  return holder;
}

ProofRequest AliceRequest() {
  return ByCertificate(AliceCredential(), IssueBody("PublicKey", kUseKey),
                       UsernameToken("alice@EXAMPLE.COM", "secret"));
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

class CertificateFormTest : public testing::TestWithParam<RuleCase> {};

TEST_P(CertificateFormTest, RefusesWhatBreaksOneRule) {
  const Server server;
  const RuleCase& rule = GetParam();
  ExpectFault(Ask(server, Sign(AliceRequest(), AliceCredential(), rule.edits)), rule.code,
              rule.reason);
}

std::string Algorithm(const char* uri) {
  return std::string("Algorithm=\"") + uri + "\"";
}

INSTANTIATE_TEST_SUITE_P(
    Signature, CertificateFormTest,
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
                    RuleCase{"IdThatIsAnExpression",
                             {{" wsu:Id=\"Timestamp-1\"", " wsu:Id=\"xpointer(id('Body-1'))\""},
                              {"URI=\"#Timestamp-1\"", "URI=\"#xpointer(id('Body-1'))\""},
                              {"DIGEST-Timestamp-1", "DIGEST-Body-1"}},
                             "wsse:InvalidSecurity",
                             "Timestamp/@Id is not an NCName: xpointer(id('Body-1'))"},
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
    References, CertificateFormTest,
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
    Algorithms, CertificateFormTest,
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
    KeyInfo, CertificateFormTest,
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
                 "The BinarySecurityToken contains no certificate: "},
        RuleCase{"OctetsAfterTheCertificate",
                 {{"</wsse:BinarySecurityToken>", "AAAA</wsse:BinarySecurityToken>"}},
                 "wsse:InvalidSecurityToken",
                 "The BinarySecurityToken contains no certificate: "},
        RuleCase{"NoBinarySecurityToken",
                 {{"<wsse:BinarySecurityToken ", "<!--"}, {"</wsse:BinarySecurityToken>", "-->"}},
                 "wsse:InvalidSecurity",
                 "The signature refers to a BinarySecurityToken that is missing"},
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
    UseKey, CertificateFormTest,
    testing::Values(RuleCase{"Missing", {{kUseKey, ""}}, "wst:InvalidRequest", "UseKey is missing"},
                    RuleCase{"NamesNoSignature",
                             {{"Sig=\"holderOfKeyProofSignature\"", "Sig=\"other\""}},
                             "wst:InvalidRequest",
                             "UseKey/@Sig does not name the request's signature: other"},
                    RuleCase{"WithDelegateTo",
                             {{kUseKey, DelegateTo("bob@EXAMPLE.COM") + kUseKey}},
                             "wst:InvalidRequest",
                             "UseKey is not expected together with DelegateTo"},
                    RuleCase{"ForABearerToken",
                             {{"/PublicKey<", "/Bearer<"}},
                             "wst:InvalidRequest",
                             "A request signed with a certificate must ask for a PublicKey token"}),
    NameOf);

class TokenFormTest : public testing::TestWithParam<RuleCase> {};

TEST_P(TokenFormTest, RefusesWhatBreaksOneRule) {
  const Server server;
  const std::string token = HolderToken(server, AliceCredential());
  const ProofRequest request = ByToken(token, IssueBody("PublicKey"));
  const RuleCase& rule = GetParam();
  ExpectFault(Ask(server, Sign(request, AliceCredential(), rule.edits)), rule.code, rule.reason);
}

INSTANTIATE_TEST_SUITE_P(
    KeyInfo, TokenFormTest,
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
        RuleCase{"WithUsernameToken",
                 {{"<saml2:Assertion", UsernameToken("bob@EXAMPLE.COM", "x") + "<saml2:Assertion"}},
                 "wsse:InvalidSecurity",
                 "An assertion that proves the key must be the only token"},
        RuleCase{"UseKey",
                 {{"</wst:Delegatable>", std::string("</wst:Delegatable>") + kUseKey}},
                 "wst:InvalidRequest",
                 "UseKey is not expected in a request made with a token"}),
    NameOf);

}  // namespace
}  // namespace DevSts::Testing
