#include "devsts/xml_security.h"

#include <cstddef>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/certificates.h"

namespace DevSts::Testing {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

constexpr char kDocument[] =
    R"(<a:Root xmlns:a="urn:a"><a:Assertion ID="_1"><a:Issuer>me</a:Issuer><a:Text>hello</a:Text></a:Assertion></a:Root>)";

Credential Make(KeyType type, bool fresh = false) {
  CertificateSpec spec;
  spec.commonName = "signer";
  spec.keyType = type;
  spec.freshKey = fresh;
  return MakeCertificate(spec);
}

std::string Sign(const Credential& credential, const SignOptions& options,
                 const std::string& xml = kDocument) {
  return SignXml(xml, credential.privateKeyPem, credential.certificatePem, options);
}

std::string Tampered(std::string text, const std::string& from, const std::string& to) {
  const std::size_t at = text.find(from);
  EXPECT_NE(at, std::string::npos) << from;
  return text.replace(at, from.size(), to);
}

struct AlgorithmCase {
  const char* name;
  KeyType key;
  SignatureAlgorithm signature;
  DigestAlgorithm digest;
  CanonicalMode canonicalization;
};

class SignatureAlgorithmTest : public testing::TestWithParam<AlgorithmCase> {
 protected:
  static std::string SignedText() {
    SignOptions options;
    options.signature = GetParam().signature;
    options.digest = GetParam().digest;
    options.canonicalization = GetParam().canonicalization;
    return Sign(Make(GetParam().key), options);
  }
};

TEST_P(SignatureAlgorithmTest, Verifies) {
  const VerifyResult result = VerifyXml(SignedText(), Make(GetParam().key).certificatePem);
  EXPECT_TRUE(result.valid) << result.reason;
  EXPECT_EQ(result.reason, "");
  EXPECT_THAT(result.referenceUris, ElementsAre("#_1"));
}

TEST_P(SignatureAlgorithmTest, DoesNotVerifyOtherContent) {
  const VerifyResult result =
      VerifyXml(Tampered(SignedText(), "hello", "hallo"), Make(GetParam().key).certificatePem);
  EXPECT_FALSE(result.valid);
  EXPECT_NE(result.reason, "");
}

TEST_P(SignatureAlgorithmTest, DoesNotVerifyWithAnotherKey) {
  const VerifyResult result = VerifyXml(SignedText(), Make(GetParam().key, true).certificatePem);
  EXPECT_FALSE(result.valid);
  EXPECT_NE(result.reason, "");
}

INSTANTIATE_TEST_SUITE_P(
    EveryAlgorithm, SignatureAlgorithmTest,
    testing::Values(
        AlgorithmCase{"RsaSha256", KeyType::Rsa2048, SignatureAlgorithm::RsaSha256,
                      DigestAlgorithm::Sha256, CanonicalMode::Exclusive},
        AlgorithmCase{"RsaSha384", KeyType::Rsa2048, SignatureAlgorithm::RsaSha384,
                      DigestAlgorithm::Sha384, CanonicalMode::ExclusiveWithComments},
        AlgorithmCase{"RsaSha512", KeyType::Rsa2048, SignatureAlgorithm::RsaSha512,
                      DigestAlgorithm::Sha512, CanonicalMode::Inclusive},
        AlgorithmCase{"RsaPssSha256", KeyType::Rsa2048, SignatureAlgorithm::RsaPssSha256,
                      DigestAlgorithm::Sha256, CanonicalMode::Exclusive},
        AlgorithmCase{"RsaPssSha384", KeyType::Rsa2048, SignatureAlgorithm::RsaPssSha384,
                      DigestAlgorithm::Sha384, CanonicalMode::Inclusive},
        AlgorithmCase{"RsaPssSha512", KeyType::Rsa2048, SignatureAlgorithm::RsaPssSha512,
                      DigestAlgorithm::Sha512, CanonicalMode::Exclusive},
        AlgorithmCase{"EcdsaSha256", KeyType::EcP256, SignatureAlgorithm::EcdsaSha256,
                      DigestAlgorithm::Sha256, CanonicalMode::Exclusive},
        AlgorithmCase{"EcdsaSha384", KeyType::EcP384, SignatureAlgorithm::EcdsaSha384,
                      DigestAlgorithm::Sha384, CanonicalMode::InclusiveWithComments},
        AlgorithmCase{"EcdsaSha512", KeyType::EcP384, SignatureAlgorithm::EcdsaSha512,
                      DigestAlgorithm::Sha512, CanonicalMode::Exclusive},
        AlgorithmCase{"RsaSha1", KeyType::Rsa2048, SignatureAlgorithm::RsaSha1,
                      DigestAlgorithm::Sha1, CanonicalMode::Exclusive}),
    [](const auto& test) { return test.param.name; });

TEST(SignXmlTest, PutsTheSignatureAfterTheIssuer) {
  const std::string text = Sign(Make(KeyType::Rsa2048), {});
  EXPECT_THAT(text, HasSubstr("</a:Issuer><ds:Signature"));
  EXPECT_THAT(text, HasSubstr("<ds:X509Certificate>"));
}

TEST(SignXmlTest, OmitsKeyInfoIfRequested) {
  SignOptions options;
  options.keyInfo = KeyInfoContent::None;
  const std::string text = Sign(Make(KeyType::Rsa2048), options);
  EXPECT_THAT(text, Not(HasSubstr("KeyInfo")));
  EXPECT_TRUE(VerifyXml(text, Make(KeyType::Rsa2048).certificatePem));
}

TEST(SignXmlTest, WritesAKeyValueIfRequested) {
  SignOptions options;
  options.keyInfo = KeyInfoContent::KeyValue;
  EXPECT_THAT(Sign(Make(KeyType::Rsa2048), options), HasSubstr("<ds:Modulus>"));
}

TEST(SignXmlTest, KeepsTheTemplateOfTheText) {
  const std::string xml =
      R"(<r><ds:Signature xmlns:ds="http://www.w3.org/2000/09/xmldsig#"><ds:SignedInfo>)"
      R"(<ds:CanonicalizationMethod Algorithm="http://www.w3.org/2001/10/xml-exc-c14n#"/>)"
      R"(<ds:SignatureMethod Algorithm="http://www.w3.org/2001/04/xmldsig-more#rsa-sha512"/>)"
      R"(<ds:Reference URI=""><ds:Transforms>)"
      R"(<ds:Transform Algorithm="http://www.w3.org/2000/09/xmldsig#enveloped-signature"/>)"
      R"(</ds:Transforms><ds:DigestMethod Algorithm="http://www.w3.org/2001/04/xmlenc#sha256"/>)"
      R"(<ds:DigestValue/></ds:Reference></ds:SignedInfo><ds:SignatureValue/></ds:Signature>x</r>)";
  const Credential credential = Make(KeyType::Rsa2048);
  const std::string text = Sign(credential, {}, xml);
  EXPECT_THAT(text, HasSubstr("rsa-sha512"));
  const VerifyResult result = VerifyXml(text, credential.certificatePem);
  EXPECT_TRUE(result.valid) << result.reason;
  EXPECT_THAT(result.referenceUris, ElementsAre(""));
}

TEST(SignXmlTest, WritesNonAsciiTextUnchanged) {
  EXPECT_THAT(Sign(Make(KeyType::Rsa2048), {}, "<r ID=\"_2\">\xC3\xA4</r>"),
              HasSubstr("<r ID=\"_2\">\xC3\xA4<ds:Signature"));
}

TEST(SignXmlTest, RefusesAKeyThatDoesNotLoad) {
  EXPECT_THROW(SignXml(kDocument, "no key", Make(KeyType::Rsa2048).certificatePem), XmlError);
}

TEST(SignXmlTest, RefusesAKeyThatDoesNotFitTheAlgorithm) {
  EXPECT_THROW(Sign(Make(KeyType::EcP256), {}), XmlError);
}

TEST(VerifyXmlTest, SaysWhyThereIsNothingToVerify) {
  const std::string certificate = Make(KeyType::Rsa2048).certificatePem;
  EXPECT_EQ(VerifyXml("<a/>", certificate).reason, "no signature");
  EXPECT_THAT(VerifyXml("<a", certificate).reason, HasSubstr("line 1"));
  EXPECT_EQ(VerifyXml("<!DOCTYPE a><a/>", certificate).reason, "a document type is not accepted");
}

TEST(VerifyXmlTest, RefusesTwoElementsWithTheSameId) {
  const Credential credential = Make(KeyType::Rsa2048);
  const std::string text = Tampered(Sign(credential, {}), "</a:Root>", "<b Id=\"_1\"/></a:Root>");
  EXPECT_EQ(VerifyXml(text, credential.certificatePem).reason, "two elements have the id _1");
}

TEST(VerifyXmlTest, FollowsNoExternalReference) {
  const Credential credential = Make(KeyType::Rsa2048);
  const std::string text =
      Tampered(Sign(credential, {}), "URI=\"#_1\"", "URI=\"file:///etc/hosts\"");
  EXPECT_FALSE(VerifyXml(text, credential.certificatePem));
}

TEST(VerifyXmlTest, RefusesAChangedSignatureValue) {
  const Credential credential = Make(KeyType::Rsa2048);
  for (const SignatureAlgorithm algorithm :
       {SignatureAlgorithm::RsaSha256, SignatureAlgorithm::RsaPssSha256}) {
    SignOptions options;
    options.signature = algorithm;
    std::string text = Sign(credential, options);
    char& first = text[text.find("<ds:SignatureValue>") + 24];
    first = first == 'A' ? 'B' : 'A';
    const VerifyResult result = VerifyXml(text, credential.certificatePem);
    EXPECT_FALSE(result.valid);
    EXPECT_THAT(result.reason, HasSubstr("signature"));
  }
}

TEST(VerifyXmlTest, ThrowsForACertificateThatDoesNotLoad) {
  EXPECT_THROW(VerifyXml(kDocument, "no certificate"), XmlError);
}

TEST(VerifyXmlTest, WritesNothingToStandardError) {
  testing::internal::CaptureStderr();
  const Credential credential = Make(KeyType::Rsa2048);
  VerifyXml(Tampered(Sign(credential, {}), "hello", "hallo"), credential.certificatePem);
  VerifyXml(Tampered(Sign(credential, {}), "rsa-sha256", "unknown"), credential.certificatePem);
  VerifyXml("<a><b></a>", credential.certificatePem);
  EXPECT_THROW(Canonicalize("<a xmlns='rel'/>", "//[", CanonicalMode::Inclusive), XmlError);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST(VerifyXmlTest, WorksOnManyThreadsAtOnce) {
  const Credential credential = Make(KeyType::Rsa2048);
  const std::string good = Sign(credential, {});
  const std::string bad = Tampered(good, "hello", "hallo");
  std::vector<std::thread> threads;
  std::vector<int> right(8);
  for (std::size_t i = 0; i < right.size(); ++i) {
    threads.emplace_back([&, i] {
      for (int round = 0; round < 20; ++round) {
        right[i] += VerifyXml(good, credential.certificatePem) ? 1 : 0;
        right[i] += VerifyXml(bad, credential.certificatePem) ? 0 : 1;
        right[i] += VerifyXml(Sign(credential, {}), credential.certificatePem) ? 1 : 0;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_THAT(right, testing::Each(60));
}

constexpr char kTree[] =
    "<?pi x?><!--out--><p:r xmlns:p='urn:p' xmlns:u='urn:u' b='2' a='1' xml:lang='de'>"
    "<!--in--><p:e Id='i'  z=''><![CDATA[<&]]></p:e></p:r>";

struct CanonicalCase {
  const char* name;
  const char* selector;
  CanonicalMode mode;
  std::vector<std::string> prefixes;
  const char* expected;
};

class CanonicalFormTest : public testing::TestWithParam<CanonicalCase> {};

TEST_P(CanonicalFormTest, MatchesTheRecommendation) {
  const CanonicalCase& test = GetParam();
  EXPECT_EQ(Canonicalize(kTree, test.selector, test.mode, test.prefixes), test.expected);
}

INSTANTIATE_TEST_SUITE_P(
    EveryMode, CanonicalFormTest,
    testing::Values(
        CanonicalCase{"InclusiveDocument",
                      "",
                      CanonicalMode::Inclusive,
                      {},
                      "<?pi x?>\n<p:r xmlns:p=\"urn:p\" xmlns:u=\"urn:u\" a=\"1\" b=\"2\" "
                      "xml:lang=\"de\"><p:e Id=\"i\" z=\"\">&lt;&amp;</p:e></p:r>"},
        CanonicalCase{
            "InclusiveDocumentWithComments",
            "",
            CanonicalMode::InclusiveWithComments,
            {},
            "<?pi x?>\n<!--out-->\n<p:r xmlns:p=\"urn:p\" xmlns:u=\"urn:u\" a=\"1\" "
            "b=\"2\" xml:lang=\"de\"><!--in--><p:e Id=\"i\" z=\"\">&lt;&amp;</p:e></p:r>"},
        CanonicalCase{"InclusiveElement",
                      "#i",
                      CanonicalMode::Inclusive,
                      {},
                      "<p:e xmlns:p=\"urn:p\" xmlns:u=\"urn:u\" Id=\"i\" z=\"\" xml:lang=\"de\">"
                      "&lt;&amp;</p:e>"},
        CanonicalCase{"ExclusiveElement",
                      "//*[local-name()='e']",
                      CanonicalMode::Exclusive,
                      {},
                      "<p:e xmlns:p=\"urn:p\" Id=\"i\" z=\"\">&lt;&amp;</p:e>"},
        CanonicalCase{"ExclusiveElementWithPrefixList",
                      "#i",
                      CanonicalMode::Exclusive,
                      {"u"},
                      "<p:e xmlns:p=\"urn:p\" xmlns:u=\"urn:u\" Id=\"i\" z=\"\">&lt;&amp;</p:e>"},
        CanonicalCase{"ExclusiveRootWithComments",
                      "/*",
                      CanonicalMode::ExclusiveWithComments,
                      {},
                      "<p:r xmlns:p=\"urn:p\" a=\"1\" b=\"2\" xml:lang=\"de\"><!--in-->"
                      "<p:e Id=\"i\" z=\"\">&lt;&amp;</p:e></p:r>"}),
    [](const auto& test) { return test.param.name; });

TEST(CanonicalizeTest, RefusesWhatHasNoCanonicalForm) {
  EXPECT_THROW(Canonicalize("<a xmlns='relative'/>", "", CanonicalMode::Inclusive), XmlError);
  EXPECT_THROW(Canonicalize("<a><p:b/></a>", "", CanonicalMode::Inclusive), XmlError);
  EXPECT_THROW(Canonicalize("<!DOCTYPE a><a/>", "", CanonicalMode::Inclusive), XmlError);
  EXPECT_THROW(Canonicalize("<a/>", "#none", CanonicalMode::Inclusive), XmlError);
  EXPECT_THROW(Canonicalize("<a><b/><b/></a>", "//b", CanonicalMode::Inclusive), XmlError);
}

TEST(CanonicalizeTest, TakesTheDefaultNamespaceInAPrefixList) {
  EXPECT_EQ(Canonicalize("<a xmlns='urn:d' xmlns:p='urn:p'><p:b Id='i'/></a>", "#i",
                         CanonicalMode::Exclusive, {"#default"}),
            "<p:b xmlns=\"urn:d\" xmlns:p=\"urn:p\" Id=\"i\"></p:b>");
}

}  // namespace
}  // namespace DevSts::Testing
