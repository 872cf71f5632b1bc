#include "xml/security/algorithms.h"

#include <optional>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/algorithm_uris.h"
#include "support/signed_documents.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;

// Everything else in these documents is supported: without the change they are only "invalid", as
// AlgorithmParametersTest shows.
class UnlistedSignatureMethodTest : public testing::TestWithParam<const char*> {};

TEST_P(UnlistedSignatureMethodTest, IsRefused) {
  SignatureTemplate signature;
  signature.signatureMethod = GetParam();
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            std::string("refused: The signature algorithm '") + GetParam() + "' is not supported.");
}

INSTANTIATE_TEST_SUITE_P(Uris, UnlistedSignatureMethodTest,
                         testing::Values("", "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256 ",
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

class UnlistedDigestMethodTest : public testing::TestWithParam<const char*> {};

TEST_P(UnlistedDigestMethodTest, IsRefused) {
  SignatureTemplate signature;
  signature.digestMethod = GetParam();
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            std::string("refused: The digest algorithm '") + GetParam() + "' is not supported.");
}

INSTANTIATE_TEST_SUITE_P(Uris, UnlistedDigestMethodTest,
                         testing::Values("", "http://www.w3.org/2001/04/xmlenc#sha256 ",
                                         "http://www.w3.org/2001/04/xmlenc#SHA256",
                                         "http://www.w3.org/2001/04/xmlenc#sha384",
                                         "http://www.w3.org/2000/09/xmldsig#sha1",
                                         "http://www.w3.org/2001/04/xmldsig-more#md5",
                                         "http://www.w3.org/2001/04/xmldsig-more#sha224",
                                         "http://www.w3.org/2001/04/xmlenc#ripemd160"));

class UnlistedCanonicalizationTest : public testing::TestWithParam<const char*> {};

TEST_P(UnlistedCanonicalizationTest, IsRefused) {
  SignatureTemplate signature;
  signature.canonicalization = GetParam();
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            std::string("refused: The canonicalisation algorithm '") + GetParam() +
                "' is not supported.");
}

TEST_P(UnlistedCanonicalizationTest, IsRefusedAsTransform) {
  SignatureTemplate signature;
  signature.transforms = Transforms({kEnveloped, GetParam()});
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            std::string("refused: The transform algorithm '") + GetParam() + "' is not supported.");
}

INSTANTIATE_TEST_SUITE_P(
    Uris, UnlistedCanonicalizationTest,
    testing::Values(
        "", "http://www.w3.org/2001/10/xml-exc-c14n", "http://www.w3.org/2001/10/xml-exc-c14n# ",
        "http://www.w3.org/2001/10/xml-exc-c14n#withcomments",
        "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#withComments",
        "http://www.w3.org/2006/12/xml-c14n11", "http://www.w3.org/2000/09/xmldsig#base64",
        "http://www.w3.org/TR/1999/REC-xslt-19991116",
        "http://www.w3.org/TR/1999/REC-xpath-19991116", "http://www.w3.org/2002/06/xmldsig-filter2",
        "http://www.w3.org/2000/09/xmldsig#enveloped-signature"));

TEST(TransformListTest, AcceptsOnlyTheSupportedCombinations) {
  SignatureTemplate signature;
  signature.transforms = Transforms({kEnveloped, kExclusive});
  EXPECT_EQ(Verdict(Signed({}, AssertionWith(signature.Text()))), "valid");
  signature.transforms = Transforms({kEnveloped});
  EXPECT_EQ(Verdict(Signed({}, AssertionWith(signature.Text()))), "valid");

  signature.transforms = Transforms({kEnveloped, kExclusive, kExclusive});
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            "refused: The transform algorithm 'http://www.w3.org/2001/10/xml-exc-c14n#' is not "
            "supported after a canonicalisation.");
  signature.transforms = Transforms({kExclusive, kEnveloped});
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            "refused: The transform algorithm "
            "'http://www.w3.org/2000/09/xmldsig#enveloped-signature' is not supported after a "
            "canonicalisation.");
}

TEST(TransformListTest, ComparesTheEnvelopedMethodWhole) {
  for (const std::string& uri : {std::string(kEnveloped) + "2", std::string(kEnveloped) + " ",
                                 std::string(kEnveloped).substr(0, 20)}) {
    SignatureTemplate signature;
    signature.transforms = Transforms({uri});
    EXPECT_EQ(Verdict(AssertionWithValues(signature)),
              "refused: The transform algorithm '" + uri + "' is not supported.");
  }
}

// The oracle accepts the signature, so that only the list of algorithms can be the reason.
TEST(TransformListTest, RefusesCorrectSignaturesOverXPath) {
  SignatureTemplate signature;
  signature.transforms =
      "<ds:Transforms><ds:Transform "
      "Algorithm=\"http://www.w3.org/2000/09/xmldsig#enveloped-signature\"/><ds:Transform "
      "Algorithm=\"http://www.w3.org/TR/1999/REC-xpath-19991116\"><ds:XPath>true()</ds:XPath>"
      "</ds:Transform></ds:Transforms>";
  const std::string text = Signed({}, AssertionWith(signature.Text()));
  EXPECT_EQ(Verdict(text),
            "refused: The transform algorithm 'http://www.w3.org/TR/1999/REC-xpath-19991116' is "
            "not supported.");
}

TEST(AlgorithmsTest, RefusesCorrectSignaturesWithSha1) {
  DevSts::SignOptions options;
  options.digest = DevSts::DigestAlgorithm::Sha1;
  EXPECT_EQ(Verdict(Signed(options)),
            "refused: The digest algorithm 'http://www.w3.org/2000/09/xmldsig#sha1' is not "
            "supported.");
  options.digest = DevSts::DigestAlgorithm::Sha256;
  EXPECT_EQ(Verdict(Signed(options)), "valid");
  options.signature = DevSts::SignatureAlgorithm::RsaSha1;
  EXPECT_EQ(Verdict(Signed(options)),
            "refused: The signature algorithm 'http://www.w3.org/2000/09/xmldsig#rsa-sha1' is not "
            "supported.");
}

// The URI with a trailing number sign means the same method; the oracle knows only the one without.
TEST(AlgorithmsTest, AcceptsTheInclusiveMethodWithANumberSign) {
  SignatureTemplate signature;
  signature.canonicalization = kInclusive;
  signature.transforms = Transforms({kEnveloped, kInclusive});
  EXPECT_EQ(Verdict(Signed({}, AssertionWith(signature.Text()))), "valid");
  const std::string text =
      Signed({}, AssertionWith(Replaced(signature.Text(), Transforms({kEnveloped, kInclusive}),
                                        Transforms({kEnveloped, kExclusive}))));
  EXPECT_EQ(Verdict(text), "valid");
  signature.canonicalization = kExclusive;
  const std::string inclusive = Signed({}, AssertionWith(signature.Text()));
  EXPECT_EQ(
      Verdict(Resigned(Replaced(inclusive, "REC-xml-c14n-20010315\"", "REC-xml-c14n-20010315#\""))),
      "valid");
}

TEST(AlgorithmsTest, ChecksEveryListBeforeAnyKeyIsRequested) {
  SignatureTemplate signature;
  signature.moreReferences =
      "<ds:Reference URI=\"#_a1\">" + Transforms({"urn:unknown"}) +
      "<ds:DigestMethod Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"/>"
      "<ds:DigestValue>AAAA</ds:DigestValue></ds:Reference>";
  EXPECT_EQ(Verdict(AssertionWithValues(signature), Stranger()),
            "refused: The transform algorithm 'urn:unknown' is not supported.");
}

TEST(AlgorithmParametersTest, AreRefusedWhereNoneAreAllowed) {
  const std::string text = AssertionWithValues({});
  ASSERT_EQ(Verdict(text), "invalid");
  EXPECT_EQ(Verdict(Replaced(text, "rsa-sha256\"/>",
                             "rsa-sha256\"><ds:HMACOutputLength>8</ds:HMACOutputLength>"
                             "</ds:SignatureMethod>")),
            "refused: The algorithm 'http://www.w3.org/2001/04/xmldsig-more#rsa-sha256' takes no "
            "parameters, but has 'ds:HMACOutputLength'.");
  EXPECT_EQ(Verdict(Replaced(text, "xmlenc#sha256\"/>", "xmlenc#sha256\"><x/></ds:DigestMethod>")),
            "refused: The algorithm 'http://www.w3.org/2001/04/xmlenc#sha256' takes no "
            "parameters, but has 'x'.");
  EXPECT_EQ(
      Verdict(
          Replaced(text, "enveloped-signature\"/>", "enveloped-signature\"><x/></ds:Transform>")),
      "refused: The algorithm 'http://www.w3.org/2000/09/xmldsig#enveloped-signature' takes no "
      "parameters, but has 'x'.");
  EXPECT_EQ(Verdict(Replaced(text, "xml-exc-c14n#\"/></ds:Transforms>",
                             "xml-exc-c14n#\"><ds:XPath/></ds:Transform></ds:Transforms>")),
            "refused: The algorithm 'http://www.w3.org/2001/10/xml-exc-c14n#' does not take "
            "'ds:XPath' as a parameter.");
}

std::string WithPrefixList(const std::string& list) {
  return Replaced(AssertionWithValues({}), "xml-exc-c14n#\"/></ds:Transforms>",
                  "xml-exc-c14n#\">" + list + "</ds:Transform></ds:Transforms>");
}

TEST(AlgorithmParametersTest, OfTheExclusiveMethodAreOnePrefixList) {
  const std::string list =
      "<c:InclusiveNamespaces xmlns:c=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>";
  EXPECT_EQ(Verdict(WithPrefixList(list)), "invalid");
  EXPECT_EQ(Verdict(WithPrefixList(list + list)),
            "refused: Element 'ds:Transform' holds the unexpected element "
            "'c:InclusiveNamespaces'.");
  EXPECT_EQ(Verdict(WithPrefixList(Replaced(list, "/>", " Prefix=\"\"/>"))),
            "refused: Element 'c:InclusiveNamespaces' has the unexpected attribute 'Prefix'.");
  EXPECT_EQ(Verdict(WithPrefixList(Replaced(list, "/>", "><x/></c:InclusiveNamespaces>"))),
            "refused: Element 'c:InclusiveNamespaces' holds the unexpected element 'x'.");
}

std::string WithParameterOfEnveloped(const std::string& content) {
  SignatureTemplate signature;
  signature.transforms = Replaced(signature.transforms, "enveloped-signature\"/>",
                                  "enveloped-signature\">" + content + "</ds:Transform>");
  return signature.Text();
}

// Some signers repeat the prefix list of the canonicalisation in every transform, in the namespace
// of the canonicalisation or in one that is named after the transform.
TEST(AlgorithmParametersTest, OfEnvelopedMayBeAPrefixListWithoutEffect) {
  for (const char* uri : {"http://www.w3.org/2001/10/xml-exc-c14n#",
                          "http://www.w3.org/2000/09/xmldsig#enveloped-signature"}) {
    for (const char* list : {"", " PrefixList=\"\"", " PrefixList=\"xs unbound #default\""}) {
      const std::string parameter =
          std::string("\n<i:InclusiveNamespaces xmlns:i=\"") + uri + "\"" + list + "/>";
      const std::string text =
          Signed({}, AssertionWith(WithParameterOfEnveloped(parameter), "<b/>"));
      EXPECT_EQ(Verdict(text), "valid") << parameter;
      EXPECT_EQ(Verdict(Replaced(text, "user@example", "root@example")), "invalid") << parameter;
    }
  }
}

// The oracle accepts these signatures too, so that only the rules for parameters can be the reason.
TEST(AlgorithmParametersTest, OfEnvelopedMayBeNothingElse) {
  const std::string list =
      "<i:InclusiveNamespaces xmlns:i=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>";
  const auto verdict = [](const std::string& parameter) {
    return Verdict(Signed({}, AssertionWith(WithParameterOfEnveloped(parameter))));
  };
  const auto takesNo = [](const std::string& name) {
    return "refused: The algorithm 'http://www.w3.org/2000/09/xmldsig#enveloped-signature' takes "
           "no parameters, but has '" +
           name + "'.";
  };
  EXPECT_EQ(verdict(list), "valid");
  EXPECT_EQ(verdict(list + list),
            "refused: Element 'ds:Transform' holds the unexpected element "
            "'i:InclusiveNamespaces'.");
  EXPECT_EQ(verdict(list + "<x/>"),
            "refused: Element 'ds:Transform' holds the unexpected element 'x'.");
  EXPECT_EQ(verdict(Replaced(list, "/>", " Prefix=\"\"/>")),
            "refused: Element 'i:InclusiveNamespaces' has the unexpected attribute 'Prefix'.");
  EXPECT_EQ(verdict(Replaced(list, "/>", "><x/></i:InclusiveNamespaces>")),
            "refused: Element 'i:InclusiveNamespaces' holds the unexpected element 'x'.");
  EXPECT_EQ(verdict("<ds:XPath>false()</ds:XPath>"), takesNo("ds:XPath"));
  EXPECT_EQ(verdict("<InclusiveNamespaces/>"), takesNo("InclusiveNamespaces"));
  EXPECT_EQ(verdict("<ds:InclusiveNamespaces/>"), takesNo("ds:InclusiveNamespaces"));
  EXPECT_EQ(verdict(Replaced(list, "InclusiveNamespaces", "inclusivenamespaces")),
            takesNo("i:inclusivenamespaces"));
}

// The namespace of the transform is not one of the canonicalisation's parameters.
TEST(AlgorithmParametersTest, OfTheExclusiveMethodAreInItsOwnNamespace) {
  const std::string list =
      "<i:InclusiveNamespaces xmlns:i=\"http://www.w3.org/2000/09/xmldsig#enveloped-signature\"/>";
  EXPECT_EQ(Verdict(WithPrefixList(list)),
            "refused: The algorithm 'http://www.w3.org/2001/10/xml-exc-c14n#' does not take "
            "'i:InclusiveNamespaces' as a parameter.");
}

TEST(AlgorithmParametersTest, OfTheExclusiveMethodHaveOneExpandedName) {
  const std::string start =
      "refused: The algorithm 'http://www.w3.org/2001/10/xml-exc-c14n#' does "
      "not take ";
  EXPECT_EQ(Verdict(WithPrefixList("<c:InclusiveNamespaces xmlns:c=\"urn:other\"/>")),
            start + "'c:InclusiveNamespaces' as a parameter.");
  EXPECT_EQ(Verdict(WithPrefixList(
                "<c:Other xmlns:c=\"http://www.w3.org/2001/10/xml-exc-c14n#\" PrefixList=\"\"/>")),
            start + "'c:Other' as a parameter.");
}

TEST(AlgorithmParametersTest, AreRefusedForTheInclusiveMethod) {
  SignatureTemplate signature;
  signature.transforms = Transforms({kEnveloped, kInclusive});
  const std::string text = AssertionWithValues(signature);
  ASSERT_EQ(Verdict(text), "invalid");
  const std::string list =
      "<c:InclusiveNamespaces xmlns:c=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>";
  EXPECT_EQ(
      Verdict(Replaced(text, "REC-xml-c14n-20010315\"/></ds:Transforms>",
                       "REC-xml-c14n-20010315\">" + list + "</ds:Transform></ds:Transforms>")),
      "refused: The algorithm 'http://www.w3.org/TR/2001/REC-xml-c14n-20010315' takes no "
      "parameters, but has 'c:InclusiveNamespaces'.");
}

TEST(AlgorithmParametersTest, PrefixListsAreSplitAtWhiteSpace) {
  const auto document = ParseXml(
      "<t><i:InclusiveNamespaces xmlns:i=\"http://www.w3.org/2001/10/xml-exc-c14n#\" "
      "PrefixList=\"  a&#10;b&#9;#default&#13;d  c \"/></t>");
  const C14nOptions options = LookUpCanonicalizationMethod(kExclusive, document->RootElement());
  EXPECT_TRUE(options.exclusive);
  EXPECT_THAT(options.inclusivePrefixes, testing::ElementsAre("a", "b", "#default", "d", "c"));
}

TEST(AlgorithmsTest, BoundsAndSanitisesWhatItQuotes) {
  SignatureTemplate signature;
  signature.signatureMethod = "\xC3\xA4&#9;" + std::string(100'000, 'x');
  const std::string verdict = Verdict(AssertionWithValues(signature));
  EXPECT_THAT(verdict, testing::StartsWith("refused: The signature algorithm '???xxx"));
  EXPECT_LT(verdict.size(), 250U);
}

TEST(FindDigestMethodTest, KnowsTheListedAlgorithms) {
  EXPECT_EQ(FindDigestMethod("http://www.w3.org/2001/04/xmlenc#sha256"), Crypto::Hash::kSha256);
  EXPECT_EQ(FindDigestMethod("http://www.w3.org/2001/04/xmldsig-more#sha384"),
            Crypto::Hash::kSha384);
  EXPECT_EQ(FindDigestMethod("http://www.w3.org/2001/04/xmlenc#sha512"), Crypto::Hash::kSha512);
  for (const char* algorithm :
       {"", "http://www.w3.org/2000/09/xmldsig#sha1", "http://www.w3.org/2001/04/xmlenc#SHA256",
        "http://www.w3.org/2001/04/xmlenc#sha256 "}) {
    EXPECT_EQ(FindDigestMethod(algorithm), std::nullopt) << algorithm;
  }
}

}  // namespace
}  // namespace Tarnik::Testing
