#include <algorithm>
#include <atomic>
#include <cstddef>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/err.h>

#include <tarnik/core/exception.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>

#include "support/openssl.h"
#include "support/signed_documents.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using DevSts::CanonicalMode;
using DevSts::DigestAlgorithm;
using DevSts::KeyType;
using DevSts::SignatureAlgorithm;
using DevSts::SignOptions;
using testing::ElementsAre;
using testing::StartsWith;

struct AlgorithmCase {
  const char* name;
  SignatureAlgorithm algorithm;
  KeyType keyType;
};

class SignatureAlgorithmsTest
    : public testing::TestWithParam<std::tuple<AlgorithmCase, CanonicalMode, DigestAlgorithm>> {
 protected:
  void SetUp() override {
    const auto& [algorithm, mode, digest] = GetParam();
    signer_ = SignerOf(algorithm.keyType);
    options_.signature = algorithm.algorithm;
    options_.canonicalization = mode;
    options_.digest = digest;
  }

  DevSts::Credential signer_;
  SignOptions options_;
};

TEST_P(SignatureAlgorithmsTest, AreVerifiedAsByTheOracle) {
  const std::string text = Signed(options_, kUnsigned, signer_);
  ASSERT_TRUE(DevSts::VerifyXml(text, signer_.certificatePem));
  EXPECT_EQ(Verdict(text, signer_), "valid");

  const std::string tampered = Replaced(text, "user@example", "root@example");
  ASSERT_FALSE(DevSts::VerifyXml(tampered, signer_.certificatePem));
  EXPECT_EQ(Verdict(tampered, signer_), "invalid");
}

constexpr AlgorithmCase kAlgorithms[] = {
    {"RsaSha256", SignatureAlgorithm::RsaSha256, KeyType::Rsa2048},
    {"RsaSha384", SignatureAlgorithm::RsaSha384, KeyType::Rsa2048},
    {"RsaSha512", SignatureAlgorithm::RsaSha512, KeyType::Rsa3072},
    {"RsaPssSha256", SignatureAlgorithm::RsaPssSha256, KeyType::Rsa2048},
    {"RsaPssSha384", SignatureAlgorithm::RsaPssSha384, KeyType::Rsa2048},
    {"RsaPssSha512", SignatureAlgorithm::RsaPssSha512, KeyType::Rsa2048},
    {"EcdsaSha256OnP256", SignatureAlgorithm::EcdsaSha256, KeyType::EcP256},
    {"EcdsaSha512OnP256", SignatureAlgorithm::EcdsaSha512, KeyType::EcP256},
    {"EcdsaSha256OnP384", SignatureAlgorithm::EcdsaSha256, KeyType::EcP384},
    {"EcdsaSha384OnP384", SignatureAlgorithm::EcdsaSha384, KeyType::EcP384},
};

std::string CaseName(const testing::TestParamInfo<SignatureAlgorithmsTest::ParamType>& tested) {
  static constexpr const char* kModes[] = {"Inclusive", "InclusiveWithComments", "Exclusive",
                                           "ExclusiveWithComments"};
  static constexpr const char* kDigests[] = {"Sha256", "Sha384", "Sha512"};
  return std::string(std::get<0>(tested.param).name) +
         kModes[static_cast<std::size_t>(std::get<1>(tested.param))] +
         kDigests[static_cast<std::size_t>(std::get<2>(tested.param))];
}

INSTANTIATE_TEST_SUITE_P(
    All, SignatureAlgorithmsTest,
    testing::Combine(
        testing::ValuesIn(kAlgorithms),
        testing::Values(CanonicalMode::Inclusive, CanonicalMode::InclusiveWithComments,
                        CanonicalMode::Exclusive, CanonicalMode::ExclusiveWithComments),
        testing::Values(DigestAlgorithm::Sha256, DigestAlgorithm::Sha384, DigestAlgorithm::Sha512)),
    CaseName);

TEST(SignatureTest, ReturnsItsContent) {
  const std::string text = Signed();
  const auto document = ParseXml(text);
  ElementNode* element = FindElement(document.get(), "Signature");
  const auto signature = CreateSignatureFromDom(element);
  EXPECT_EQ(signature->Element(), element);
  EXPECT_EQ(signature->CanonicalizationMethod(), "http://www.w3.org/2001/10/xml-exc-c14n#");
  EXPECT_EQ(signature->SignatureMethod(), "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256");
  ASSERT_EQ(signature->References().size(), 1U);
  const Reference& reference = signature->References().front();
  EXPECT_EQ(reference.uri, "#_a1");
  EXPECT_EQ(reference.digestMethod, "http://www.w3.org/2001/04/xmlenc#sha256");
  EXPECT_EQ(reference.digestValue.size(), 32U);
  EXPECT_THAT(reference.transforms,
              ElementsAre("http://www.w3.org/2000/09/xmldsig#enveloped-signature",
                          "http://www.w3.org/2001/10/xml-exc-c14n#"));
  EXPECT_EQ(signature->KeyInfo().certificates.size(), 1U);
  EXPECT_EQ(signature->KeyInfo().element->LocalName(), "KeyInfo");
}

TEST(SignatureTest, KeepsItsDocumentAlive) {
  const std::string text = Signed();
  auto document = ParseXml(text);
  const auto signature = CreateSignatureFromDom(FindElement(document.get(), "Signature"));
  document.reset();
  EXPECT_TRUE(signature->Verify(Trusting(Signer()).get()));
}

TEST(SignatureTest, VerifiesTheSameWayEveryTime) {
  const std::string text = Signed();
  const std::string tampered = Replaced(text, "user@example", "root@example");
  const auto resolver = Trusting(Signer());
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(Verdict(text, resolver.get()), "valid");
    EXPECT_EQ(Verdict(tampered, resolver.get()), "invalid");
  }
}

TEST(SignatureTest, IsVerifiedByManyThreadsAtOnce) {
  const std::string text = Signed();
  const auto document = ParseXml(text);
  const auto signature = CreateSignatureFromDom(FindElement(document.get(), "Signature"));
  const auto resolver = Trusting(Signer());
  std::atomic<int> valid{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&] {
      for (int i = 0; i < 50; ++i) {
        valid += signature->Verify(resolver.get()) ? 1 : 0;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(valid, 200);
}

TEST(SignatureTest, StaysValidWhenTheCanonicalFormIsTheSame) {
  const std::string text = Signed();
  EXPECT_EQ(Verdict("<!-- before -->" + text + "<!-- after -->"), "valid");
  EXPECT_EQ(Verdict(Replaced(text, "<!-- a remark -->", "")), "valid");
  EXPECT_EQ(Verdict(Replaced(text, "b=\"2\" a=\"1\"", "a='1'  b='2'")), "valid");
  EXPECT_EQ(Verdict(Replaced(text, "user@example", "<![CDATA[user@]]>exam&#112;le")), "valid");
  EXPECT_EQ(Verdict(Replaced(text, "xmlns:unused=\"urn:unused\"", "xmlns:other=\"urn:other\"")),
            "valid");
  EXPECT_EQ(Verdict(Replaced(text, "/>\n</saml:Assertion>", "></Plain>\n</saml:Assertion>")),
            "valid");
}

TEST(SignatureTest, FailsForEveryChangeOfTheContent) {
  const std::string text = Signed();
  ASSERT_EQ(Verdict(text), "valid");
  EXPECT_EQ(Verdict(Replaced(text, "a=\"1\"", "a=\"3\"")), "invalid");
  EXPECT_EQ(Verdict(Replaced(text, "a=\"1\"", "")), "invalid");
  EXPECT_EQ(Verdict(Replaced(text, "<saml:Issuer>", "<saml:Issuer> ")), "invalid");
  EXPECT_EQ(Verdict(Replaced(text, "urn:plain", "urn:other")), "invalid");
  EXPECT_EQ(Verdict(Replaced(text, "</saml:Assertion>", "<x/></saml:Assertion>")), "invalid");
  EXPECT_EQ(Verdict(Replaced(text, "</saml:Assertion>", "<?x y?></saml:Assertion>")), "invalid");
}

TEST(SignatureTest, FailsForAChangedSignatureValue) {
  const std::string text = Signed();
  ASSERT_EQ(Verdict(text), "valid");
  EXPECT_EQ(Verdict(ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                    StringUtil::Base64Encode(std::vector<unsigned char>(256, 1)))),
            "invalid");
}

std::string WithDigest(const std::string& text, const std::vector<unsigned char>& digest) {
  return Resigned(ReplacedBetween(text, "<ds:DigestValue>", "</ds:DigestValue>",
                                  StringUtil::Base64Encode(digest)));
}

TEST(SignatureTest, FailsForAnotherDigestOrDigestLength) {
  const std::string text = Signed();
  std::vector<unsigned char> digest;
  StringUtil::Base64Decode(Between(text, "<ds:DigestValue>", "</ds:DigestValue>"), digest);
  ASSERT_EQ(digest.size(), 32U);
  EXPECT_EQ(Verdict(WithDigest(text, digest)), "valid");
  for (std::size_t i = 0; i < digest.size(); ++i) {
    auto other = digest;
    other[i] ^= 1;
    EXPECT_EQ(Verdict(WithDigest(text, other)), "invalid") << i;
  }
  for (const std::size_t length : {std::size_t{1}, std::size_t{31}, std::size_t{33}}) {
    auto other = digest;
    other.resize(length);
    EXPECT_EQ(Verdict(WithDigest(text, other)), "invalid") << length;
  }
}

TEST(SignatureTest, FailsForASignatureValueOfAnotherLength) {
  for (const SignatureAlgorithm algorithm :
       {SignatureAlgorithm::RsaSha256, SignatureAlgorithm::RsaPssSha256}) {
    SignOptions options;
    options.signature = algorithm;
    const std::string text = Signed(options);
    ASSERT_EQ(Verdict(text), "valid");
    std::vector<unsigned char> value;
    StringUtil::Base64Decode(Between(text, "<ds:SignatureValue>", "</ds:SignatureValue>"), value);
    auto padded = value;
    padded.insert(padded.begin(), 0);
    auto longer = value;
    longer.push_back(0);
    auto shorter = value;
    shorter.pop_back();
    for (const auto& other : {padded, longer, shorter}) {
      EXPECT_EQ(Verdict(ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                        StringUtil::Base64Encode(other))),
                "invalid");
    }
  }
}

class EcdsaSignatureTest : public testing::Test {
 protected:
  void SetUp() override {
    signer_ = SignerOf(KeyType::EcP256);
    SignOptions options;
    options.signature = SignatureAlgorithm::EcdsaSha256;
    text_ = Signed(options, kUnsigned, signer_);
    StringUtil::Base64Decode(Between(text_, "<ds:SignatureValue>", "</ds:SignatureValue>"), value_);
    ASSERT_EQ(value_.size(), 64U);
    ASSERT_EQ(Verdict(text_, signer_), "valid");
  }

  std::string VerdictWith(const std::vector<unsigned char>& value) const {
    return Verdict(ReplacedBetween(text_, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                   StringUtil::Base64Encode(value)),
                   signer_);
  }

  DevSts::Credential signer_;
  std::string text_;
  std::vector<unsigned char> value_;
};

TEST_F(EcdsaSignatureTest, FailsForDegenerateValues) {
  EXPECT_EQ(VerdictWith(value_), "valid");
  EXPECT_EQ(VerdictWith(std::vector<unsigned char>(64, 0)), "invalid");
  EXPECT_EQ(VerdictWith(std::vector<unsigned char>(64, 0xFF)), "invalid");
  auto zeroR = value_;
  std::fill(zeroR.begin(), zeroR.begin() + 32, static_cast<unsigned char>(0));
  EXPECT_EQ(VerdictWith(zeroR), "invalid");
  auto zeroS = value_;
  std::fill(zeroS.begin() + 32, zeroS.end(), static_cast<unsigned char>(0));
  EXPECT_EQ(VerdictWith(zeroS), "invalid");
  auto longer = value_;
  longer.insert(longer.begin() + 32, 0);
  longer.insert(longer.begin(), 0);
  EXPECT_EQ(VerdictWith(longer), "invalid");
  auto shorter = value_;
  shorter.pop_back();
  EXPECT_EQ(VerdictWith(shorter), "invalid");
}

// Two of the signature's numbers do not both begin with so many zeros by chance.
TEST_F(EcdsaSignatureTest, FailsForHalvesThatLackDigits) {
  for (const std::size_t half : {std::size_t{28}, std::size_t{16}, std::size_t{1}}) {
    for (const std::size_t from : {std::size_t{0}, 32 - half}) {
      std::vector<unsigned char> shorter;
      for (const std::size_t start : {std::size_t{0}, std::size_t{32}}) {
        const auto first = value_.begin() + static_cast<std::ptrdiff_t>(start + from);
        shorter.insert(shorter.end(), first, first + static_cast<std::ptrdiff_t>(half));
      }
      EXPECT_EQ(VerdictWith(shorter), "invalid") << half << " from " << from;
    }
  }
  EXPECT_EQ(VerdictWith({1, 1}), "invalid");
}

TEST_F(EcdsaSignatureTest, FailsWhenEncodedInDer) {
  const OpenSsl::OwnedEcdsaSignature numbers(ECDSA_SIG_new());
  ASSERT_EQ(ECDSA_SIG_set0(numbers.get(), BN_bin2bn(value_.data(), 32, nullptr),
                           BN_bin2bn(value_.data() + 32, 32, nullptr)),
            1);
  unsigned char* der = nullptr;
  const int length = i2d_ECDSA_SIG(numbers.get(), &der);
  const OpenSsl::OwnedMemory<unsigned char> owner(der);
  EXPECT_EQ(VerdictWith({der, der + length}), "invalid");
}

TEST(SignatureTest, LeavesTheErrorQueueEmpty) {
  ERR_clear_error();
  const std::string text = Signed();
  ERR_clear_error();
  EXPECT_EQ(Verdict(text), "valid");
  EXPECT_EQ(Verdict(ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                    StringUtil::Base64Encode(std::vector<unsigned char>(256, 1)))),
            "invalid");
  EXPECT_EQ(ERR_peek_error(), 0U);
}

TEST(SignatureTest, CannotBeReadFromNull) {
  EXPECT_THROW(CreateSignatureFromDom(nullptr), InvalidArgumentException);
}

// If a failed canonicalisation counted as one that wrote nothing, these would be valid.
TEST(SignatureTest, IsRefusedWhenCanonicalisationFails) {
  const std::string empty = ReplacedBetween(Signed(), "<ds:DigestValue>", "</ds:DigestValue>",
                                            "47DEQpj8HBSa+/TImW+5JCeuQeRkm5NMpJWZG3hSuFU=");
  EXPECT_EQ(Verdict(Resigned(empty)), "invalid");
  for (const char* uri : {"relative/uri", "../other", "not a uri"}) {
    EXPECT_THAT(Verdict(Resigned(Replaced(empty, "urn:plain", uri))), StartsWith("refused: "))
        << uri;
  }
}

TEST(SignatureTest, WithAnInclusivePrefixListIsVerified) {
  for (const std::vector<std::string>& prefixes :
       {std::vector<std::string>{"unused"}, {"unused", "saml"}, {"#default", "unused"}}) {
    SignOptions options;
    options.inclusivePrefixes = prefixes;
    const std::string text = Signed(options);
    EXPECT_EQ(Verdict(text), "valid");
    EXPECT_EQ(Verdict(Replaced(text, "xmlns:unused=\"urn:unused\"", "xmlns:unused=\"urn:other\"")),
              "invalid");
  }
}

TEST(SignatureTest, StaysValidInsideAnotherDocument) {
  const std::string text = Signed();
  EXPECT_EQ(Verdict("<e:Envelope xmlns:e=\"urn:e\" xmlns=\"urn:d\"><e:Body>" + text +
                    "</e:Body></e:Envelope>"),
            "valid");
}

}  // namespace
}  // namespace Tarnik::Testing
