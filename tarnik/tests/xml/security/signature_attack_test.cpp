#include <tarnik/xml/security/signature.h>

#include <gtest/gtest.h>
#include <openssl/ec.h>
#include <openssl/obj_mac.h>
#include <openssl/rsa.h>

#include <tarnik/core/object_impl.h>
#include <algorithm>

#include "support/signed_documents.h"
#include "support/test_certificates.h"

// Documents that somebody else has put together around a signature.
namespace Tarnik::Xml::Security {
namespace {

using DevSts::SignOptions;
using Tests::Between;
using Tests::Judge;
using Tests::Replaced;
using Tests::ReplacedBetween;
using Tests::Resigned;
using Tests::Signed;

// Were the names of namespaces written as they are, both documents had the same canonical text.
TEST(SignatureAttack, ANamespaceNameCannotStandForMarkup) {
  const std::string first = "<n xmlns=\"urn:n\" a=\"1\">t</n>";
  const std::string both = first + "<n xmlns=\"urn:n\">u</n>";
  const std::string original = "<Assertion ID=\"_a1\">" + both + "</Assertion>";
  for (const auto mode : {DevSts::CanonicalMode::Inclusive, DevSts::CanonicalMode::Exclusive}) {
    SignOptions options;
    options.canonicalization = mode;
    const std::string text = Signed(options, original);
    EXPECT_EQ(Judge(text), "valid");
    EXPECT_EQ(Judge(Replaced(text, first, "<n a='1' xmlns='urn:n'>t</n>")), "valid");
    EXPECT_EQ(Judge(Replaced(text, first, "<n xmlns='urn:n\" a=\"1'>t</n>")), "invalid");
    EXPECT_EQ(Judge(Replaced(text, both,
                             "<n xmlns='urn:n\" a=\"1\"&gt;t&lt;/n&gt;&lt;n xmlns=\"urn:n'>u</n>")),
              "invalid");
  }
}

class CountingResolver final : public KeyInfoResolver, public ObjectImpl {
 public:
  explicit CountingResolver(Ref<const KeyInfoResolver> below) : below_(std::move(below)) {}
  Ref<const Crypto::PublicKey> Resolve(const Security::KeyInfo& keyInfo) const override {
    ++calls;
    return below_->Resolve(keyInfo);
  }
  mutable int calls = 0;

 private:
  Ref<const KeyInfoResolver> below_;
};

// Every reference is judged before anything that the message asks for is done.
TEST(SignatureAttack, AnUnlistedTransformOfTheLastReferenceStopsEverything) {
  const auto resolver = MakeRef<CountingResolver>(Tests::Trusting(Tests::Signer()));
  const std::string good = Signed();
  EXPECT_EQ(Judge(good, resolver.get()), "valid");
  EXPECT_EQ(resolver->calls, 1);
  for (const char* algorithm :
       {"http://www.w3.org/TR/1999/REC-xslt-19991116", "http://www.w3.org/2000/09/xmldsig#base64",
        "http://www.w3.org/2002/06/xmldsig-filter2"}) {
    const std::string reference = "<ds:Reference URI=\"\">" + Tests::Transforms({algorithm}) +
                                  "<ds:DigestMethod Algorithm=\""
                                  "http://www.w3.org/2001/04/xmlenc#sha256\"/>"
                                  "<ds:DigestValue>AAAA</ds:DigestValue></ds:Reference>";
    EXPECT_EQ(
        Judge(Replaced(good, "</ds:SignedInfo>", reference + "</ds:SignedInfo>"), resolver.get()),
        std::string("refused: The transform algorithm '") + algorithm + "' is not supported.");
  }
  EXPECT_EQ(resolver->calls, 1);
}

TEST(SignatureAttack, RsaKeysAreRefusedUpToTheLimit) {
  for (const unsigned bits : {512U, 1024U, 2040U}) {
    const auto key = Tests::MakeRsaKey(bits);
    const auto resolver =
        CreateTrustedCertificatesResolver({Tests::MakeCertificate({.key = key.get()})});
    SignOptions options;
    options.keyInfo = DevSts::KeyInfoContent::None;
    EXPECT_EQ(Judge(Signed(options), resolver.get()), "refused: The trusted RSA key has " +
                                                          std::to_string(bits) +
                                                          " bits; at least 2048 are needed.");
  }
}

std::vector<unsigned char> PssValueOf(EVP_PKEY* key, const std::string& text) {
  const OpenSsl::OwnedDigestContext context(EVP_MD_CTX_new());
  EVP_PKEY_CTX* keyContext = nullptr;
  std::vector<unsigned char> value(static_cast<std::size_t>(EVP_PKEY_get_size(key)));
  std::size_t length = value.size();
  const auto* octets = reinterpret_cast<const unsigned char*>(text.data());
  const bool isSigned =
      EVP_DigestSignInit_ex(context.get(), &keyContext, "SHA256", nullptr, nullptr, key, nullptr) ==
          1 &&
      EVP_PKEY_CTX_set_rsa_padding(keyContext, RSA_PKCS1_PSS_PADDING) == 1 &&
      EVP_PKEY_CTX_set_rsa_pss_saltlen(keyContext, RSA_PSS_SALTLEN_DIGEST) == 1 &&
      EVP_DigestSign(context.get(), value.data(), &length, octets, text.size()) == 1;
  return isSigned ? value : std::vector<unsigned char>();
}

// RFC 8017, section 8.1.2, step 1: a value that is shorter is no signature, even if it is the same
// number. OpenSSL alone lets it pass.
TEST(SignatureAttack, AnRsaPssValueWithoutItsLeadingZeroIsInvalid) {
  SignOptions options;
  options.signature = DevSts::SignatureAlgorithm::RsaPssSha256;
  const std::string text = Signed(options);
  const auto writer = CreateStringWriter();
  const auto document = Tests::ParseDocument(text);
  CreateCanonicalizer("http://www.w3.org/2001/10/xml-exc-c14n#")
      ->Canonicalize(Tests::FindElement(document.get(), "SignedInfo"), writer.get());
  const std::string& pem = Tests::Signer().privateKeyPem;
  const OpenSsl::OwnedBio source(BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size())));
  const OpenSsl::OwnedKey key(PEM_read_bio_PrivateKey(source.get(), nullptr, nullptr, nullptr));
  // One value in 256 begins with a zero, and each is another, for its salt is.
  std::vector<unsigned char> value{1};
  for (int attempt = 0; attempt < 10'000 && value.at(0) != 0; ++attempt) {
    value = PssValueOf(key.get(), writer->Text());
  }
  ASSERT_EQ(value.at(0), 0);
  const auto with = [&text](const std::vector<unsigned char>& octets) {
    return ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                           StringUtil::Base64Encode(octets));
  };
  EXPECT_EQ(Judge(with(value)), "valid");
  value.erase(value.begin());
  EXPECT_EQ(Judge(with(value)), "invalid");
}

// Numbers that are the same to who reckons without looking at their size: the order of P-521 leaves
// bits free in its last octet.
TEST(SignatureAttack, AnEcdsaNumberBeyondTheOrderIsInvalid) {
  const std::string text = Tests::ReadTestData("signatures/valid-ecdsa-p521.xml");
  const auto resolver = CreateTrustedCertificatesResolver(
      Crypto::LoadCertificates(std::string(TARNIK_TEST_DATA) + "/signatures/p521.pem"));
  ASSERT_EQ(Judge(text, resolver.get()), "valid");
  std::vector<unsigned char> value;
  StringUtil::Base64Decode(Between(text, "<ds:SignatureValue>", "</ds:SignatureValue>"), value);
  constexpr int kOctets = 66;
  ASSERT_EQ(value.size(), 2U * kOctets);
  EC_GROUP* group = EC_GROUP_new_by_curve_name(NID_secp521r1);
  for (const int start : {0, kOctets}) {
    const OpenSsl::OwnedBigNumber number(BN_bin2bn(value.data() + start, kOctets, nullptr));
    ASSERT_EQ(BN_add(number.get(), number.get(), EC_GROUP_get0_order(group)), 1);
    auto other = value;
    ASSERT_EQ(BN_bn2binpad(number.get(), other.data() + start, kOctets), kOctets);
    EXPECT_EQ(Judge(ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                    StringUtil::Base64Encode(other)),
                    resolver.get()),
              "invalid");
  }
  EC_GROUP_free(group);
}

// What stands in KeyValue is neither used nor decoded.
TEST(SignatureAttack, ABareKeyInTheMessageIsNotLookedAt) {
  SignOptions options;
  options.keyInfo = DevSts::KeyInfoContent::KeyValue;
  const std::string text = Signed(options);
  const std::string strangers = Signed(options, Tests::kUnsigned, Tests::Stranger());
  for (const char* modulus : {"", "AA==", "no Base64 *", "AQ"}) {
    const auto with = [modulus](const std::string& xml) {
      return ReplacedBetween(xml, "Modulus>", "</", modulus);
    };
    EXPECT_EQ(Judge(with(text)), "valid") << modulus;
    EXPECT_EQ(Judge(with(strangers)), "invalid") << modulus;
  }
}

TEST(SignatureAttack, AHundredThousandReferencesAreRefusedUnread) {
  const std::string reference =
      "<ds:Reference URI=\"\"><ds:DigestMethod Algorithm=\"a\"/>"
      "<ds:DigestValue>AA==</ds:DigestValue></ds:Reference>";
  std::string references;
  references.reserve(100'000 * reference.size());
  for (int i = 0; i < 100'000; ++i) {
    references += reference;
  }
  EXPECT_EQ(Judge(Replaced(Signed(), "</ds:SignedInfo>", references + "</ds:SignedInfo>")),
            "syntax: A signature may have no more than 16 references.");
}

}  // namespace
}  // namespace Tarnik::Xml::Security
