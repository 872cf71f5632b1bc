#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <openssl/ec.h>
#include <openssl/obj_mac.h>
#include <openssl/rsa.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/writer.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/public_key.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/signature.h>

#include "support/algorithm_uris.h"
#include "support/openssl.h"
#include "support/signed_documents.h"
#include "support/test_certificates.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using DevSts::SignOptions;

// If the names of namespaces were not escaped, both documents would have the same canonical text.
TEST(SignatureAttackTest, ANamespaceNameCannotForgeMarkup) {
  const std::string first = "<n xmlns=\"urn:n\" a=\"1\">t</n>";
  const std::string both = first + "<n xmlns=\"urn:n\">u</n>";
  const std::string original = "<Assertion ID=\"_a1\">" + both + "</Assertion>";
  for (const auto mode : {DevSts::CanonicalMode::Inclusive, DevSts::CanonicalMode::Exclusive}) {
    SignOptions options;
    options.canonicalization = mode;
    const std::string text = Signed(options, original);
    EXPECT_EQ(Verdict(text), "valid");
    EXPECT_EQ(Verdict(Replaced(text, first, "<n a='1' xmlns='urn:n'>t</n>")), "valid");
    EXPECT_EQ(Verdict(Replaced(text, first, "<n xmlns='urn:n\" a=\"1'>t</n>")), "invalid");
    EXPECT_EQ(
        Verdict(Replaced(text, both,
                         "<n xmlns='urn:n\" a=\"1\"&gt;t&lt;/n&gt;&lt;n xmlns=\"urn:n'>u</n>")),
        "invalid");
  }
}

class CountingResolver final : public KeyInfoResolver, public ObjectImpl {
 public:
  explicit CountingResolver(Ref<const KeyInfoResolver> inner) : inner_(std::move(inner)) {}
  Ref<const Crypto::PublicKey> Resolve(const Security::KeyInfo& keyInfo) const override {
    ++calls;
    return inner_->Resolve(keyInfo);
  }
  mutable int calls = 0;

 private:
  Ref<const KeyInfoResolver> inner_;
};

// Every reference is checked before anything that the message asks for is done.
TEST(SignatureAttackTest, AnUnsupportedTransformOfTheLastReferenceStopsEverything) {
  const auto resolver = MakeRef<CountingResolver>(Trusting(Signer()));
  const std::string good = Signed();
  EXPECT_EQ(Verdict(good, resolver.get()), "valid");
  EXPECT_EQ(resolver->calls, 1);
  for (const char* algorithm :
       {"http://www.w3.org/TR/1999/REC-xslt-19991116", "http://www.w3.org/2000/09/xmldsig#base64",
        "http://www.w3.org/2002/06/xmldsig-filter2"}) {
    const std::string reference = "<ds:Reference URI=\"\">" + Transforms({algorithm}) +
                                  "<ds:DigestMethod Algorithm=\""
                                  "http://www.w3.org/2001/04/xmlenc#sha256\"/>"
                                  "<ds:DigestValue>AAAA</ds:DigestValue></ds:Reference>";
    EXPECT_EQ(
        Verdict(Replaced(good, "</ds:SignedInfo>", reference + "</ds:SignedInfo>"), resolver.get()),
        std::string("refused: The transform algorithm '") + algorithm + "' is not supported.");
  }
  EXPECT_EQ(resolver->calls, 1);
}

TEST(SignatureAttackTest, RsaKeysBelowTheLimitAreRefused) {
  for (const unsigned bits : {512U, 1024U, 2040U}) {
    const auto key = MakeRsaKey(bits);
    const auto resolver = CreateTrustedCertificatesResolver({MakeCertificate({.key = key.get()})});
    SignOptions options;
    options.keyInfo = DevSts::KeyInfoContent::None;
    EXPECT_EQ(Verdict(Signed(options), resolver.get()), "refused: The trusted RSA key has " +
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

// RFC 8017, section 8.1.2, step 1: a shorter value is not a signature, even if it is the same
// number. OpenSSL by itself accepts it.
TEST(SignatureAttackTest, AnRsaPssValueWithoutItsLeadingZeroIsInvalid) {
  SignOptions options;
  options.signature = DevSts::SignatureAlgorithm::RsaPssSha256;
  const std::string text = Signed(options);
  const auto writer = CreateStringWriter();
  const auto document = ParseXml(text);
  CreateCanonicalizer(kExclusive)
      ->Canonicalize(FindElement(document.get(), "SignedInfo"), writer.get());
  const std::string& pem = Signer().privateKeyPem;
  const OpenSsl::OwnedBio source(BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size())));
  const OpenSsl::OwnedKey key(PEM_read_bio_PrivateKey(source.get(), nullptr, nullptr, nullptr));
  // One value in 256 begins with a zero, and every value differs because its salt does.
  std::vector<unsigned char> value{1};
  for (int attempt = 0; attempt < 10'000 && value.at(0) != 0; ++attempt) {
    value = PssValueOf(key.get(), writer->Text());
  }
  ASSERT_EQ(value.at(0), 0);
  const auto with = [&text](const std::vector<unsigned char>& octets) {
    return ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                           StringUtil::Base64Encode(octets));
  };
  EXPECT_EQ(Verdict(with(value)), "valid");
  value.erase(value.begin());
  EXPECT_EQ(Verdict(with(value)), "invalid");
}

// A number plus the order of the group is the same number modulo the order. The order of P-521
// leaves enough unused bits in its first octet for the sum.
TEST(SignatureAttackTest, AnEcdsaNumberBeyondTheOrderIsInvalid) {
  const std::string text = ReadTestData("signatures/valid-ecdsa-p521.xml");
  const auto resolver = CreateTrustedCertificatesResolver(
      Crypto::LoadCertificates(std::string(TARNIK_TEST_DATA) + "/signatures/p521.pem"));
  ASSERT_EQ(Verdict(text, resolver.get()), "valid");
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
    EXPECT_EQ(Verdict(ReplacedBetween(text, "<ds:SignatureValue>", "</ds:SignatureValue>",
                                      StringUtil::Base64Encode(other)),
                      resolver.get()),
              "invalid");
  }
  EC_GROUP_free(group);
}

// The content of KeyValue is neither used nor decoded.
TEST(SignatureAttackTest, ABareKeyInTheMessageIsIgnored) {
  SignOptions options;
  options.keyInfo = DevSts::KeyInfoContent::KeyValue;
  const std::string text = Signed(options);
  const std::string strangers = Signed(options, kUnsigned, Stranger());
  for (const char* modulus : {"", "AA==", "no Base64 *", "AQ"}) {
    const auto with = [modulus](const std::string& xml) {
      return ReplacedBetween(xml, "Modulus>", "</", modulus);
    };
    EXPECT_EQ(Verdict(with(text)), "valid") << modulus;
    EXPECT_EQ(Verdict(with(strangers)), "invalid") << modulus;
  }
}

TEST(SignatureAttackTest, AHundredThousandReferencesAreRefusedUnread) {
  const std::string reference =
      "<ds:Reference URI=\"\"><ds:DigestMethod Algorithm=\"a\"/>"
      "<ds:DigestValue>AA==</ds:DigestValue></ds:Reference>";
  std::string references;
  references.reserve(100'000 * reference.size());
  for (int i = 0; i < 100'000; ++i) {
    references += reference;
  }
  EXPECT_EQ(Verdict(Replaced(Signed(), "</ds:SignedInfo>", references + "</ds:SignedInfo>")),
            "syntax: A signature may have no more than 16 references.");
}

}  // namespace
}  // namespace Tarnik::Testing
