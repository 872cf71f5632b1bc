#include <tarnik/xml/security/signature.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/err.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/text/string_util.h>
#include <atomic>
#include <thread>

#include "support/signed_documents.h"
#include "support/test_certificates.h"

namespace Tarnik::Xml::Security {
namespace {

using DevSts::CanonicalMode;
using DevSts::DigestAlgorithm;
using DevSts::KeyType;
using DevSts::SignatureAlgorithm;
using DevSts::SignOptions;
using ::testing::ElementsAre;
using ::testing::StartsWith;
using Tests::Between;
using Tests::Judge;
using Tests::Replaced;
using Tests::ReplacedBetween;
using Tests::Resigned;
using Tests::Signed;
using Tests::Signer;
using Tests::Stranger;

constexpr const char* kWrongKeyType =
    "refused: The trusted key is not of the type of the signature algorithm.";

struct AlgorithmCase {
  const char* name;
  SignatureAlgorithm algorithm;
  KeyType keyType;
};

class SignatureAlgorithms
    : public ::testing::TestWithParam<std::tuple<AlgorithmCase, CanonicalMode, DigestAlgorithm>> {
 protected:
  void SetUp() override {
    const auto& [algorithm, mode, digest] = GetParam();
    signer_ = Tests::SignerOf(algorithm.keyType);
    options_.signature = algorithm.algorithm;
    options_.canonicalization = mode;
    options_.digest = digest;
  }

  DevSts::Credential signer_;
  SignOptions options_;
};

TEST_P(SignatureAlgorithms, AreVerifiedAsTheOracleDoes) {
  const std::string text = Signed(options_, Tests::kUnsigned, signer_);
  ASSERT_TRUE(DevSts::VerifyXml(text, signer_.certificatePem));
  EXPECT_EQ(Judge(text, signer_), "valid");

  const std::string tampered = Replaced(text, "user@example", "root@example");
  ASSERT_FALSE(DevSts::VerifyXml(tampered, signer_.certificatePem));
  EXPECT_EQ(Judge(tampered, signer_), "invalid");
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

std::string CaseName(const ::testing::TestParamInfo<SignatureAlgorithms::ParamType>& tested) {
  static constexpr const char* kModes[] = {"Inclusive", "InclusiveWithComments", "Exclusive",
                                           "ExclusiveWithComments"};
  static constexpr const char* kDigests[] = {"Sha256", "Sha384", "Sha512"};
  return std::string(std::get<0>(tested.param).name) +
         kModes[static_cast<std::size_t>(std::get<1>(tested.param))] +
         kDigests[static_cast<std::size_t>(std::get<2>(tested.param))];
}

INSTANTIATE_TEST_SUITE_P(All, SignatureAlgorithms,
                         ::testing::Combine(::testing::ValuesIn(kAlgorithms),
                                            ::testing::Values(CanonicalMode::Inclusive,
                                                              CanonicalMode::InclusiveWithComments,
                                                              CanonicalMode::Exclusive,
                                                              CanonicalMode::ExclusiveWithComments),
                                            ::testing::Values(DigestAlgorithm::Sha256,
                                                              DigestAlgorithm::Sha384,
                                                              DigestAlgorithm::Sha512)),
                         CaseName);

TEST(Signature, TellsWhatItHolds) {
  const std::string text = Signed();
  const auto document = Tests::ParseDocument(text);
  ElementNode* element = Tests::FindElement(document.get(), "Signature");
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

TEST(Signature, KeepsItsDocumentAlive) {
  const std::string text = Signed();
  auto document = Tests::ParseDocument(text);
  const auto signature = CreateSignatureFromDom(Tests::FindElement(document.get(), "Signature"));
  document.reset();
  EXPECT_TRUE(signature->Verify(Tests::Trusting(Signer()).get()));
}

TEST(Signature, VerifiesTheSameWayEveryTime) {
  const std::string text = Signed();
  const std::string tampered = Replaced(text, "user@example", "root@example");
  const auto resolver = Tests::Trusting(Signer());
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(Judge(text, resolver.get()), "valid");
    EXPECT_EQ(Judge(tampered, resolver.get()), "invalid");
  }
}

TEST(Signature, IsVerifiedByManyThreadsAtOnce) {
  const std::string text = Signed();
  const auto document = Tests::ParseDocument(text);
  const auto signature = CreateSignatureFromDom(Tests::FindElement(document.get(), "Signature"));
  const auto resolver = Tests::Trusting(Signer());
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

TEST(Signature, SurvivesWhatCanonicalFormDoesNotSee) {
  const std::string text = Signed();
  EXPECT_EQ(Judge("<!-- before -->" + text + "<!-- behind -->"), "valid");
  EXPECT_EQ(Judge(Replaced(text, "<!-- a remark -->", "")), "valid");
  EXPECT_EQ(Judge(Replaced(text, "b=\"2\" a=\"1\"", "a='1'  b='2'")), "valid");
  EXPECT_EQ(Judge(Replaced(text, "user@example", "<![CDATA[user@]]>exam&#112;le")), "valid");
  EXPECT_EQ(Judge(Replaced(text, "xmlns:unused=\"urn:unused\"", "xmlns:other=\"urn:other\"")),
            "valid");
  EXPECT_EQ(Judge(Replaced(text, "/>\n</saml:Assertion>", "></Plain>\n</saml:Assertion>")),
            "valid");
}

TEST(Signature, FailsForEveryChangeOfTheContent) {
  const std::string text = Signed();
  ASSERT_EQ(Judge(text), "valid");
  EXPECT_EQ(Judge(Replaced(text, "a=\"1\"", "a=\"3\"")), "invalid");
  EXPECT_EQ(Judge(Replaced(text, "a=\"1\"", "")), "invalid");
  EXPECT_EQ(Judge(Replaced(text, "<saml:Issuer>", "<saml:Issuer> ")), "invalid");
  EXPECT_EQ(Judge(Replaced(text, "urn:plain", "urn:other")), "invalid");
  EXPECT_EQ(Judge(Replaced(text, "</saml:Assertion>", "<x/></saml:Assertion>")), "invalid");
  EXPECT_EQ(Judge(Replaced(text, "</saml:Assertion>", "<?x y?></saml:Assertion>")), "invalid");
}

TEST(Signature, FailsForAChangedSignatureValue) {
  const std::string text = Signed();
  ASSERT_EQ(Judge(text), "valid");
  EXPECT_EQ(Judge(ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                  StringUtil::Base64Encode(std::vector<unsigned char>(256, 1)))),
            "invalid");
}

std::string WithDigest(const std::string& text, const std::vector<unsigned char>& digest) {
  return Resigned(ReplacedBetween(text, "<ds:DigestValue>", "</ds:DigestValue>",
                                  StringUtil::Base64Encode(digest)));
}

TEST(Signature, FailsForAnotherDigestOrOneOfAnotherLength) {
  const std::string text = Signed();
  std::vector<unsigned char> digest;
  StringUtil::Base64Decode(Between(text, "<ds:DigestValue>", "</ds:DigestValue>"), digest);
  ASSERT_EQ(digest.size(), 32U);
  EXPECT_EQ(Judge(WithDigest(text, digest)), "valid");
  for (std::size_t i = 0; i < digest.size(); ++i) {
    auto other = digest;
    other[i] ^= 1;
    EXPECT_EQ(Judge(WithDigest(text, other)), "invalid") << i;
  }
  for (const std::size_t length : {std::size_t{1}, std::size_t{31}, std::size_t{33}}) {
    auto other = digest;
    other.resize(length);
    EXPECT_EQ(Judge(WithDigest(text, other)), "invalid") << length;
  }
}

TEST(Signature, FailsForASignatureValueOfAnotherLength) {
  for (const SignatureAlgorithm algorithm :
       {SignatureAlgorithm::RsaSha256, SignatureAlgorithm::RsaPssSha256}) {
    SignOptions options;
    options.signature = algorithm;
    const std::string text = Signed(options);
    ASSERT_EQ(Judge(text), "valid");
    std::vector<unsigned char> value;
    StringUtil::Base64Decode(Between(text, "<ds:SignatureValue>", "</ds:SignatureValue>"), value);
    auto padded = value;
    padded.insert(padded.begin(), 0);
    auto longer = value;
    longer.push_back(0);
    auto shorter = value;
    shorter.pop_back();
    for (const auto& other : {padded, longer, shorter}) {
      EXPECT_EQ(Judge(ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                      StringUtil::Base64Encode(other))),
                "invalid");
    }
  }
}

class EcdsaSignature : public ::testing::Test {
 protected:
  void SetUp() override {
    signer_ = Tests::SignerOf(KeyType::EcP256);
    SignOptions options;
    options.signature = SignatureAlgorithm::EcdsaSha256;
    text_ = Signed(options, Tests::kUnsigned, signer_);
    StringUtil::Base64Decode(Between(text_, "<ds:SignatureValue>", "</ds:SignatureValue>"), value_);
    ASSERT_EQ(value_.size(), 64U);
    ASSERT_EQ(Judge(text_, signer_), "valid");
  }

  std::string JudgeWith(const std::vector<unsigned char>& value) const {
    return Judge(ReplacedBetween(text_, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                 StringUtil::Base64Encode(value)),
                 signer_);
  }

  DevSts::Credential signer_;
  std::string text_;
  std::vector<unsigned char> value_;
};

TEST_F(EcdsaSignature, FailsForDegenerateValues) {
  EXPECT_EQ(JudgeWith(value_), "valid");
  EXPECT_EQ(JudgeWith(std::vector<unsigned char>(64, 0)), "invalid");
  EXPECT_EQ(JudgeWith(std::vector<unsigned char>(64, 0xFF)), "invalid");
  auto zeroR = value_;
  std::fill(zeroR.begin(), zeroR.begin() + 32, static_cast<unsigned char>(0));
  EXPECT_EQ(JudgeWith(zeroR), "invalid");
  auto zeroS = value_;
  std::fill(zeroS.begin() + 32, zeroS.end(), static_cast<unsigned char>(0));
  EXPECT_EQ(JudgeWith(zeroS), "invalid");
  auto longer = value_;
  longer.insert(longer.begin() + 32, 0);
  longer.insert(longer.begin(), 0);
  EXPECT_EQ(JudgeWith(longer), "invalid");
  auto shorter = value_;
  shorter.pop_back();
  EXPECT_EQ(JudgeWith(shorter), "invalid");
}

TEST_F(EcdsaSignature, FailsWhenWrittenInDer) {
  const OpenSsl::OwnedEcdsaSignature numbers(ECDSA_SIG_new());
  ASSERT_EQ(ECDSA_SIG_set0(numbers.get(), BN_bin2bn(value_.data(), 32, nullptr),
                           BN_bin2bn(value_.data() + 32, 32, nullptr)),
            1);
  unsigned char* der = nullptr;
  const int length = i2d_ECDSA_SIG(numbers.get(), &der);
  const OpenSsl::OwnedMemory<unsigned char> owner(der);
  EXPECT_EQ(JudgeWith({der, der + length}), "invalid");
}

TEST(SignatureKey, IsNeverTakenFromTheMessage) {
  const std::string text = Signed({}, Tests::kUnsigned, Stranger());
  ASSERT_TRUE(DevSts::VerifyXml(text, Stranger().certificatePem));
  EXPECT_EQ(Judge(text, Stranger()), "valid");
  EXPECT_EQ(Judge(text, Signer()), "refused: There is no trusted key for the signature.");

  SignOptions bareKey;
  bareKey.keyInfo = DevSts::KeyInfoContent::KeyValue;
  EXPECT_EQ(Judge(Signed(bareKey, Tests::kUnsigned, Stranger()), Signer()), "invalid");
  EXPECT_EQ(Judge(Signed(bareKey), Signer()), "valid");

  SignOptions noKey;
  noKey.keyInfo = DevSts::KeyInfoContent::None;
  EXPECT_EQ(Judge(Signed(noKey, Tests::kUnsigned, Stranger()), Signer()), "invalid");
  EXPECT_EQ(Judge(Signed(noKey), Signer()), "valid");
}

TEST(SignatureKey, OfAStrangerWithTheTrustedNameIsNotTrusted) {
  DevSts::CertificateSpec spec;
  spec.commonName = "signer";
  spec.keyType = KeyType::Rsa2048;
  spec.freshKey = true;
  const DevSts::Credential namesake = DevSts::MakeCertificate(spec);
  ASSERT_EQ(Tests::CertificateOf(namesake)->SubjectName(),
            Tests::CertificateOf(Signer())->SubjectName());
  const std::string text = Signed({}, Tests::kUnsigned, namesake);
  EXPECT_EQ(Judge(text, namesake), "valid");
  EXPECT_EQ(Judge(text, Signer()), "refused: There is no trusted key for the signature.");
}

TEST(SignatureKey, MustBeOfTheAlgorithmsType) {
  SignOptions options;
  options.keyInfo = DevSts::KeyInfoContent::None;
  const auto ec = Tests::SignerOf(KeyType::EcP256);
  EXPECT_EQ(Judge(Signed(options), ec), kWrongKeyType);
  options.signature = SignatureAlgorithm::RsaPssSha256;
  EXPECT_EQ(Judge(Signed(options), ec), kWrongKeyType);
  options.signature = SignatureAlgorithm::EcdsaSha256;
  EXPECT_EQ(Judge(Signed(options, Tests::kUnsigned, ec), Signer()), kWrongKeyType);
  EXPECT_EQ(Judge(Signed(options, Tests::kUnsigned, ec), ec), "valid");
}

TEST(SignatureKey, OfRsaBelow2048BitsIsRefused) {
  const auto weak = Tests::SignerOf(KeyType::Rsa1024);
  const std::string text = Signed({}, Tests::kUnsigned, weak);
  ASSERT_TRUE(DevSts::VerifyXml(text, weak.certificatePem));
  EXPECT_EQ(Judge(text, weak),
            "refused: The trusted RSA key has 1024 bits; at least 2048 are needed.");
}

class FixedKeyResolver final : public KeyInfoResolver, public ObjectImpl {
 public:
  explicit FixedKeyResolver(Ref<const Crypto::PublicKey> key) : key_(std::move(key)) {}
  Ref<const Crypto::PublicKey> Resolve(const Security::KeyInfo&) const override { return key_; }

 private:
  Ref<const Crypto::PublicKey> key_;
};

Ref<const KeyInfoResolver> ResolverFor(EVP_PKEY* key) {
  return MakeRef<FixedKeyResolver>(Tests::MakeCertificate({.key = key})->GetPublicKey());
}

TEST(SignatureKey, OnAnotherCurveIsRefused) {
  SignOptions options;
  options.signature = SignatureAlgorithm::EcdsaSha256;
  const std::string text = Signed(options, Tests::kUnsigned, Tests::SignerOf(KeyType::EcP256));
  const auto key = Tests::MakeEcKey("secp256k1");
  EXPECT_EQ(Judge(text, ResolverFor(key.get()).get()),
            "refused: The trusted key is not on the curve P-256, P-384 or P-521.");
  const auto sameCurve = Tests::MakeEcKey("P-256");
  EXPECT_EQ(Judge(text, ResolverFor(sameCurve.get()).get()), "invalid");
}

TEST(SignatureKey, OfAnUnknownKindIsRefused) {
  const auto key = Tests::MakeKey("ED25519");
  EXPECT_EQ(Judge(Signed(), ResolverFor(key.get()).get()), kWrongKeyType);
}

TEST(SignatureKey, OfTheRsaPssTypeVerifiesPssAlone) {
  const OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA-PSS", nullptr));
  ASSERT_EQ(EVP_PKEY_keygen_init(context.get()), 1);
  EVP_PKEY* made = nullptr;
  ASSERT_EQ(EVP_PKEY_generate(context.get(), &made), 1);
  const OpenSsl::OwnedKey key(made);
  SignOptions options;
  EXPECT_EQ(Judge(Signed(options), ResolverFor(key.get()).get()), kWrongKeyType);
  options.signature = SignatureAlgorithm::RsaPssSha256;
  EXPECT_EQ(Judge(Signed(options), ResolverFor(key.get()).get()), "invalid");
}

class ForeignKey final : public Crypto::PublicKey, public ObjectImpl {
 public:
  Crypto::KeyAlgorithm Algorithm() const noexcept override { return Crypto::KeyAlgorithm::kRsa; }
  int Bits() const noexcept override { return 2048; }
};

TEST(SignatureKey, OfAnotherImplementationIsRefused) {
  const auto resolver = MakeRef<FixedKeyResolver>(MakeRef<ForeignKey>());
  EXPECT_EQ(Judge(Signed(), resolver.get()),
            "refused: The trusted key was not made by this library.");
}

TEST(SignatureKey, IsNeeded) {
  EXPECT_EQ(Judge(Signed(), nullptr),
            "refused: A signature cannot be verified without a key resolver.");
  EXPECT_EQ(Judge(Signed(), MakeRef<FixedKeyResolver>(nullptr).get()),
            "refused: There is no trusted key for the signature.");
}

class ThrowingResolver final : public KeyInfoResolver, public ObjectImpl {
 public:
  Ref<const Crypto::PublicKey> Resolve(const Security::KeyInfo&) const override {
    throw InvalidStateException("no keys today");
  }
};

TEST(SignatureKey, ResolversExceptionsPassThrough) {
  const auto resolver = MakeRef<ThrowingResolver>();
  EXPECT_THROW(Judge(Signed(), resolver.get()), InvalidStateException);
}

TEST(Signature, LeavesTheErrorQueueEmpty) {
  ERR_clear_error();
  const std::string text = Signed();
  ERR_clear_error();
  EXPECT_EQ(Judge(text), "valid");
  EXPECT_EQ(Judge(ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                  StringUtil::Base64Encode(std::vector<unsigned char>(256, 1)))),
            "invalid");
  EXPECT_EQ(ERR_peek_error(), 0U);
}

TEST(Signature, CannotBeReadFromNull) {
  EXPECT_THROW(CreateSignatureFromDom(nullptr), InvalidArgumentException);
}

// Were a canonicalisation that fails taken for one that wrote nothing, these would be valid.
TEST(Signature, IsRefusedWhenCanonicalisationFails) {
  const std::string empty = ReplacedBetween(Signed(), "<ds:DigestValue>", "</ds:DigestValue>",
                                            "47DEQpj8HBSa+/TImW+5JCeuQeRkm5NMpJWZG3hSuFU=");
  EXPECT_EQ(Judge(Resigned(empty)), "invalid");
  for (const char* uri : {"relative/uri", "../other", "not a uri"}) {
    EXPECT_THAT(Judge(Resigned(Replaced(empty, "urn:plain", uri))), StartsWith("refused: ")) << uri;
  }
}

TEST(Signature, WithAnInclusivePrefixListIsVerified) {
  for (const std::vector<std::string>& prefixes :
       {std::vector<std::string>{"unused"}, {"unused", "saml"}, {"#default", "unused"}}) {
    SignOptions options;
    options.inclusivePrefixes = prefixes;
    const std::string text = Signed(options);
    EXPECT_EQ(Judge(text), "valid");
    EXPECT_EQ(Judge(Replaced(text, "xmlns:unused=\"urn:unused\"", "xmlns:unused=\"urn:other\"")),
              "invalid");
  }
}

TEST(Signature, StaysValidInsideAnotherDocument) {
  const std::string text = Signed();
  EXPECT_EQ(Judge("<e:Envelope xmlns:e=\"urn:e\" xmlns=\"urn:d\"><e:Body>" + text +
                  "</e:Body></e:Envelope>"),
            "valid");
}

}  // namespace
}  // namespace Tarnik::Xml::Security
