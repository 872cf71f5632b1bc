#include <algorithm>
#include <cstddef>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/crypto/certificate.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/signed_documents.h"
#include "support/xml_text.h"

// Signatures that were made by other implementations: see data/other_signers/README.md.
namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml::Security;
using Bytes = std::vector<unsigned char>;

struct Sample {
  const char* file;
  const char* signer;
};

std::string VerdictOf(const std::string& text, const std::string& signer) {
  const auto resolver = CreateTrustedCertificatesResolver(Crypto::LoadCertificates(
      std::string(TARNIK_TEST_DATA) + "/other_signers/" + signer + ".pem"));
  return Verdict(text, resolver.get());
}

class OtherSignersTest : public testing::TestWithParam<Sample> {};

TEST_P(OtherSignersTest, MakeSignaturesThatAreReadAndVerified) {
  const std::string text = ReadTestData(std::string("other_signers/") + GetParam().file);
  const std::string signer =
      ReadTestData(std::string("other_signers/") + GetParam().signer + ".pem");
  EXPECT_TRUE(DevSts::VerifyXml(text, signer)) << "the oracle refuses the sample";
  EXPECT_EQ(VerdictOf(text, GetParam().signer), "valid");
  EXPECT_EQ(VerdictOf(Replaced(text, "ada@example", "eve@example"), GetParam().signer), "invalid");
}

INSTANTIATE_TEST_SUITE_P(Files, OtherSignersTest,
                         testing::Values(Sample{"jdk-empty-value.xml", "rsa"},
                                         Sample{"jdk-p521.xml", "p521"},
                                         Sample{"jdk-undeclared-type-prefix.xml", "rsa"},
                                         Sample{"santuario-p521-short.xml", "p521"},
                                         Sample{"santuario-p521.xml", "p521"},
                                         Sample{"santuario-prefix-list.xml", "rsa"},
                                         Sample{"xml-crypto-empty-value.xml", "rsa"},
                                         Sample{"xml-crypto-prefix-list.xml", "rsa"},
                                         Sample{"xml-crypto-undeclared-type-prefix.xml", "rsa"},
                                         Sample{"xmlsec1-empty-value.xml", "rsa"},
                                         Sample{"xmlsec1-p521.xml", "p521"},
                                         Sample{"xmlsec1-prefix-list.xml", "rsa"},
                                         Sample{"xmlsec1-undeclared-type-prefix.xml", "rsa"}),
                         [](const auto& tested) {
                           std::string name;
                           for (const char c : std::string(tested.param.file)) {
                             name.push_back(c == '-' || c == '.' ? '_' : c);
                           }
                           return name;
                         });

class ShortEcdsaValueTest : public testing::Test {
 protected:
  static constexpr std::size_t kHalf = 65;  // one byte shorter than the order of P-521

  void SetUp() override {
    text_ = ReadTestData("other_signers/santuario-p521-short.xml");
    const auto document = ParseXml(text_);
    const auto* value = FindElement(document.get(), "SignatureValue")->FirstChild();
    StringUtil::Base64Decode(static_cast<const Xml::TextNode*>(value)->Text(), value_);
    ASSERT_EQ(value_.size(), 2 * kHalf);
    ASSERT_EQ(VerdictWith(value_), "valid");
  }

  std::string VerdictWith(const Bytes& value) const {
    return VerdictOf(ReplacedBetween(text_, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                     StringUtil::Base64Encode(value)),
                     "p521");
  }

  // The value with `count` zeros in front of both halves.
  Bytes Padded(std::size_t count) const {
    Bytes value = value_;
    value.insert(value.begin() + kHalf, count, 0);
    value.insert(value.begin(), count, 0);
    return value;
  }

  std::string text_;
  Bytes value_;
};

TEST_F(ShortEcdsaValueTest, MayBeWrittenInFull) {
  EXPECT_EQ(VerdictWith(Padded(1)), "valid");
  EXPECT_EQ(VerdictWith(Padded(2)), "invalid");
}

TEST_F(ShortEcdsaValueTest, HasTwoEqualHalves) {
  Bytes value = value_;
  value.insert(value.begin(), 0);
  EXPECT_EQ(VerdictWith(value), "invalid");
  value = value_;
  value.insert(value.begin() + kHalf, 0);
  EXPECT_EQ(VerdictWith(value), "invalid");
  value = value_;
  value.pop_back();
  EXPECT_EQ(VerdictWith(value), "invalid");
  value.erase(value.begin());
  EXPECT_EQ(VerdictWith(value), "invalid");
}

TEST_F(ShortEcdsaValueTest, HasNoHalfOfZero) {
  Bytes zeroR = value_;
  std::fill(zeroR.begin(), zeroR.begin() + kHalf, static_cast<unsigned char>(0));
  EXPECT_EQ(VerdictWith(zeroR), "invalid");
  Bytes zeroS = value_;
  std::fill(zeroS.begin() + kHalf, zeroS.end(), static_cast<unsigned char>(0));
  EXPECT_EQ(VerdictWith(zeroS), "invalid");
  EXPECT_EQ(VerdictWith(Bytes(2, 0)), "invalid");
}

TEST_F(ShortEcdsaValueTest, IsNotAcceptedWithItsHalvesExchanged) {
  Bytes value(value_.begin() + kHalf, value_.end());
  value.insert(value.end(), value_.begin(), value_.begin() + kHalf);
  EXPECT_EQ(VerdictWith(value), "invalid");
}

}  // namespace
}  // namespace Tarnik::Testing
