#include "xml/security/algorithms.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/signed_documents.h"

namespace Tarnik::Xml::Security {
namespace {

using Tests::AssertionWith;
using Tests::AssertionWithValues;
using Tests::Judge;
using Tests::Replaced;
using Tests::SignatureTemplate;
using Tests::Signed;
using Tests::Transforms;

constexpr const char* kEnveloped = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";
constexpr const char* kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr const char* kInclusive = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";

// Every other slot of the same document is right, as the first case of each list shows.
class UnlistedSignatureMethod : public ::testing::TestWithParam<const char*> {};

TEST_P(UnlistedSignatureMethod, IsRefused) {
  SignatureTemplate signature;
  signature.signatureMethod = GetParam();
  EXPECT_EQ(Judge(AssertionWithValues(signature)),
            std::string("refused: The signature algorithm '") + GetParam() + "' is not supported.");
}

INSTANTIATE_TEST_SUITE_P(Uris, UnlistedSignatureMethod,
                         ::testing::Values("", "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256 ",
                                           " http://www.w3.org/2001/04/xmldsig-more#rsa-sha256",
                                           "http://www.w3.org/2001/04/xmldsig-more#RSA-SHA256",
                                           "http://www.w3.org/2001/04/xmldsig-more#rsa-sha",
                                           "http://www.w3.org/2001/04/xmldsig-more#rsa-sha2567",
                                           "https://www.w3.org/2001/04/xmldsig-more#rsa-sha256",
                                           "http://www.w3.org/2000/09/xmldsig#rsa-sha1",
                                           "http://www.w3.org/2000/09/xmldsig#dsa-sha1",
                                           "http://www.w3.org/2000/09/xmldsig#hmac-sha1",
                                           "http://www.w3.org/2001/04/xmldsig-more#hmac-sha256",
                                           "http://www.w3.org/2001/04/xmldsig-more#rsa-md5",
                                           "http://www.w3.org/2001/04/xmldsig-more#rsa-sha224",
                                           "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha1",
                                           "http://www.w3.org/2007/05/xmldsig-more#sha1-rsa-MGF1",
                                           "http://www.w3.org/2007/05/xmldsig-more#rsa-pss",
                                           "http://www.w3.org/2001/04/xmlenc#sha256"));

class UnlistedDigestMethod : public ::testing::TestWithParam<const char*> {};

TEST_P(UnlistedDigestMethod, IsRefused) {
  SignatureTemplate signature;
  signature.digestMethod = GetParam();
  EXPECT_EQ(Judge(AssertionWithValues(signature)),
            std::string("refused: The digest algorithm '") + GetParam() + "' is not supported.");
}

INSTANTIATE_TEST_SUITE_P(Uris, UnlistedDigestMethod,
                         ::testing::Values("", "http://www.w3.org/2001/04/xmlenc#sha256 ",
                                           "http://www.w3.org/2001/04/xmlenc#SHA256",
                                           "http://www.w3.org/2001/04/xmlenc#sha384",
                                           "http://www.w3.org/2000/09/xmldsig#sha1",
                                           "http://www.w3.org/2001/04/xmldsig-more#md5",
                                           "http://www.w3.org/2001/04/xmldsig-more#sha224",
                                           "http://www.w3.org/2001/04/xmlenc#ripemd160"));

class UnlistedCanonicalization : public ::testing::TestWithParam<const char*> {};

TEST_P(UnlistedCanonicalization, IsRefused) {
  SignatureTemplate signature;
  signature.canonicalization = GetParam();
  EXPECT_EQ(Judge(AssertionWithValues(signature)),
            std::string("refused: The canonicalisation algorithm '") + GetParam() +
                "' is not supported.");
}

TEST_P(UnlistedCanonicalization, IsRefusedAsTransform) {
  SignatureTemplate signature;
  signature.transforms = Transforms({kEnveloped, GetParam()});
  EXPECT_EQ(Judge(AssertionWithValues(signature)),
            std::string("refused: The transform algorithm '") + GetParam() + "' is not supported.");
}

INSTANTIATE_TEST_SUITE_P(
    Uris, UnlistedCanonicalization,
    ::testing::Values(
        "", "http://www.w3.org/2001/10/xml-exc-c14n", "http://www.w3.org/2001/10/xml-exc-c14n# ",
        "http://www.w3.org/2001/10/xml-exc-c14n#withcomments",
        "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#withComments",
        "http://www.w3.org/2006/12/xml-c14n11", "http://www.w3.org/2000/09/xmldsig#base64",
        "http://www.w3.org/TR/1999/REC-xslt-19991116",
        "http://www.w3.org/TR/1999/REC-xpath-19991116", "http://www.w3.org/2002/06/xmldsig-filter2",
        "http://www.w3.org/2000/09/xmldsig#enveloped-signature"));

TEST(TransformList, IsLimitedToItsSaneForms) {
  SignatureTemplate signature;
  signature.transforms = Transforms({kEnveloped, kExclusive});
  EXPECT_EQ(Judge(Signed({}, AssertionWith(signature.Text()))), "valid");
  signature.transforms = Transforms({kEnveloped});
  EXPECT_EQ(Judge(Signed({}, AssertionWith(signature.Text()))), "valid");

  signature.transforms = Transforms({kEnveloped, kExclusive, kExclusive});
  EXPECT_EQ(Judge(AssertionWithValues(signature)),
            "refused: The transform algorithm 'http://www.w3.org/2001/10/xml-exc-c14n#' is not "
            "supported after a canonicalisation.");
  signature.transforms = Transforms({kExclusive, kEnveloped});
  EXPECT_EQ(Judge(AssertionWithValues(signature)),
            "refused: The transform algorithm "
            "'http://www.w3.org/2000/09/xmldsig#enveloped-signature' is not supported after a "
            "canonicalisation.");
}

// Both are right in the eyes of the oracle, so that only the list can be the reason.
TEST(TransformList, RefusesRightSignaturesOverXPath) {
  SignatureTemplate signature;
  signature.transforms =
      "<ds:Transforms><ds:Transform "
      "Algorithm=\"http://www.w3.org/2000/09/xmldsig#enveloped-signature\"/><ds:Transform "
      "Algorithm=\"http://www.w3.org/TR/1999/REC-xpath-19991116\"><ds:XPath>true()</ds:XPath>"
      "</ds:Transform></ds:Transforms>";
  const std::string text = Signed({}, AssertionWith(signature.Text()));
  EXPECT_EQ(Judge(text),
            "refused: The transform algorithm 'http://www.w3.org/TR/1999/REC-xpath-19991116' is "
            "not supported.");
}

TEST(AlgorithmList, RefusesRightSignaturesWithSha1) {
  DevSts::SignOptions options;
  options.digest = DevSts::DigestAlgorithm::Sha1;
  EXPECT_EQ(Judge(Signed(options)),
            "refused: The digest algorithm 'http://www.w3.org/2000/09/xmldsig#sha1' is not "
            "supported.");
  options.digest = DevSts::DigestAlgorithm::Sha256;
  EXPECT_EQ(Judge(Signed(options)), "valid");
  options.signature = DevSts::SignatureAlgorithm::RsaSha1;
  EXPECT_EQ(Judge(Signed(options)),
            "refused: The signature algorithm 'http://www.w3.org/2000/09/xmldsig#rsa-sha1' is not "
            "supported.");
}

// The URI with the bare number sign means the same form; the oracle knows the one without.
TEST(AlgorithmList, TakesTheInclusiveFormWithANumberSign) {
  SignatureTemplate signature;
  signature.canonicalization = kInclusive;
  signature.transforms = Transforms({kEnveloped, kInclusive});
  EXPECT_EQ(Judge(Signed({}, AssertionWith(signature.Text()))), "valid");
  const std::string text =
      Signed({}, AssertionWith(Replaced(signature.Text(), Transforms({kEnveloped, kInclusive}),
                                        Transforms({kEnveloped, kExclusive}))));
  EXPECT_EQ(Judge(text), "valid");
  signature.canonicalization = kExclusive;
  const std::string inclusive = Signed({}, AssertionWith(signature.Text()));
  EXPECT_EQ(Judge(Tests::Resigned(
                Replaced(inclusive, "REC-xml-c14n-20010315\"", "REC-xml-c14n-20010315#\""))),
            "valid");
}

TEST(AlgorithmList, EveryListIsJudgedBeforeAnyKeyIsAskedFor) {
  SignatureTemplate signature;
  signature.moreReferences =
      "<ds:Reference URI=\"#_a1\">" + Transforms({"urn:unknown"}) +
      "<ds:DigestMethod Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"/>"
      "<ds:DigestValue>AAAA</ds:DigestValue></ds:Reference>";
  EXPECT_EQ(Judge(AssertionWithValues(signature), Tests::Stranger()),
            "refused: The transform algorithm 'urn:unknown' is not supported.");
}

TEST(AlgorithmParameters, AreRefusedWhereNoneBelong) {
  const std::string text = AssertionWithValues({});
  ASSERT_EQ(Judge(text), "invalid");
  EXPECT_EQ(Judge(Replaced(text, "rsa-sha256\"/>",
                           "rsa-sha256\"><ds:HMACOutputLength>8</ds:HMACOutputLength>"
                           "</ds:SignatureMethod>")),
            "refused: The algorithm 'http://www.w3.org/2001/04/xmldsig-more#rsa-sha256' takes no "
            "parameters, but has 'ds:HMACOutputLength'.");
  EXPECT_EQ(Judge(Replaced(text, "xmlenc#sha256\"/>", "xmlenc#sha256\"><x/></ds:DigestMethod>")),
            "refused: The algorithm 'http://www.w3.org/2001/04/xmlenc#sha256' takes no "
            "parameters, but has 'x'.");
  EXPECT_EQ(
      Judge(Replaced(text, "enveloped-signature\"/>", "enveloped-signature\"><x/></ds:Transform>")),
      "refused: The algorithm 'http://www.w3.org/2000/09/xmldsig#enveloped-signature' takes no "
      "parameters, but has 'x'.");
  EXPECT_EQ(Judge(Replaced(text, "xml-exc-c14n#\"/></ds:Transforms>",
                           "xml-exc-c14n#\"><ds:XPath/></ds:Transform></ds:Transforms>")),
            "refused: The algorithm 'http://www.w3.org/2001/10/xml-exc-c14n#' does not take "
            "'ds:XPath' as a parameter.");
}

std::string WithPrefixList(const std::string& list) {
  return Replaced(AssertionWithValues({}), "xml-exc-c14n#\"/></ds:Transforms>",
                  "xml-exc-c14n#\">" + list + "</ds:Transform></ds:Transforms>");
}

TEST(AlgorithmParameters, OfTheExclusiveFormAreOnePrefixList) {
  const std::string list =
      "<c:InclusiveNamespaces xmlns:c=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>";
  EXPECT_EQ(Judge(WithPrefixList(list)), "invalid");
  EXPECT_EQ(Judge(WithPrefixList(list + list)),
            "refused: Element 'ds:Transform' holds the unexpected element "
            "'c:InclusiveNamespaces'.");
  EXPECT_EQ(Judge(WithPrefixList(Replaced(list, "/>", " Prefix=\"\"/>"))),
            "refused: Element 'c:InclusiveNamespaces' has the unexpected attribute 'Prefix'.");
  EXPECT_EQ(Judge(WithPrefixList(Replaced(list, "/>", "><x/></c:InclusiveNamespaces>"))),
            "refused: Element 'c:InclusiveNamespaces' holds the unexpected element 'x'.");
}

TEST(AlgorithmParameters, PrefixListsAreSplitAtWhiteSpace) {
  const auto document = Tests::ParseDocument(
      "<t><i:InclusiveNamespaces xmlns:i=\"http://www.w3.org/2001/10/xml-exc-c14n#\" "
      "PrefixList=\"  a&#10;b&#9;#default  c \"/></t>");
  const C14nOptions options = LookUpCanonicalizationMethod(kExclusive, document->RootElement());
  EXPECT_TRUE(options.exclusive);
  EXPECT_THAT(options.inclusivePrefixes, ::testing::ElementsAre("a", "b", "#default", "c"));
}

TEST(AlgorithmList, BoundsAndCleansWhatItQuotes) {
  SignatureTemplate signature;
  signature.signatureMethod = "\xC3\xA4&#9;" + std::string(100'000, 'x');
  const std::string judgement = Judge(AssertionWithValues(signature));
  EXPECT_THAT(judgement, ::testing::StartsWith("refused: The signature algorithm '???xxx"));
  EXPECT_LT(judgement.size(), 250U);
}

}  // namespace
}  // namespace Tarnik::Xml::Security
