#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/one_key_resolver.h"
#include "support/signed_documents.h"
#include "support/test_data.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml::Security;

// Signatures of other implementations: see tests/data/key_info/README.md.
Ref<const Crypto::Certificate> Load(const std::string& name) {
  return Crypto::CreateCertificatesFromPem(ReadTestData("key_info/" + name + ".pem")).front();
}

class KeyInfoFileTest : public testing::TestWithParam<const char*> {
 protected:
  static std::string VerdictWith(std::vector<Ref<const Crypto::Certificate>> trusted) {
    return Verdict(ReadTestData(std::string("key_info/") + GetParam() + ".xml"),
                   CreateTrustedCertificatesResolver(std::move(trusted)).get());
  }
};

class TrustedSignerFileTest : public KeyInfoFileTest {};

TEST_P(TrustedSignerFileTest, IsValidDuringAChangeOfTheKey) {
  EXPECT_EQ(VerdictWith({Load("next"), Load("current"), Load("ec")}), "valid");
  EXPECT_EQ(VerdictWith({Load("ec"), Load("current")}), "valid");
  EXPECT_NE(VerdictWith({Load("next"), Load("stranger")}), "valid");
}

INSTANTIATE_TEST_SUITE_P(Java, TrustedSignerFileTest,
                         testing::Values("java-key-value", "java-der-encoded-key-value",
                                         "java-x509-digest", "java-x509-ski",
                                         "java-x509-issuer-serial", "java-x509-subject-name",
                                         "java-key-name", "java-none", "java-ec-key-value",
                                         "java-ec-der-encoded-key-value", "java-ec-x509-digest",
                                         "java-ec-x509-ski", "java-ec-x509-issuer-serial",
                                         "java-ec-x509-subject-name", "java-ec-key-name",
                                         "java-ec-none"));
INSTANTIATE_TEST_SUITE_P(XmlCrypto, TrustedSignerFileTest,
                         testing::Values("xml-crypto-key-value", "xml-crypto-der-encoded-key-value",
                                         "xml-crypto-x509-digest", "xml-crypto-key-name",
                                         "xml-crypto-none"));
INSTANTIATE_TEST_SUITE_P(XmlSec, TrustedSignerFileTest,
                         testing::Values("xmlsec1-key-value", "xmlsec1-x509-ski",
                                         "xmlsec1-x509-issuer-serial", "xmlsec1-x509-subject-name",
                                         "xmlsec1-key-name", "xmlsec1-none",
                                         "xmlsec1-ec-x509-issuer-serial",
                                         "xmlsec1-ec-x509-subject-name", "xmlsec1-ec-none"));

class RenewedCertificateFileTest : public KeyInfoFileTest {};

// The trusted certificate is another one of the key that has signed.
TEST_P(RenewedCertificateFileTest, IsValid) {
  EXPECT_EQ(VerdictWith({Load("next"), Load("renewed")}), "valid");
  EXPECT_EQ(VerdictWith({Load("next"), Load("renewed"), Load("current")}), "valid");
}

INSTANTIATE_TEST_SUITE_P(Files, RenewedCertificateFileTest,
                         testing::Values("java-key-value", "java-der-encoded-key-value",
                                         "java-x509-ski", "java-x509-subject-name", "java-none",
                                         "xml-crypto-key-value", "xmlsec1-key-value",
                                         "xmlsec1-x509-ski", "xmlsec1-x509-subject-name"));

struct StrangersFile {
  const char* file;
  const char* verdict;  // its start
};

class StrangersFileTest : public testing::TestWithParam<StrangersFile> {};

TEST_P(StrangersFileTest, IsValidOnlyIfTheStrangerIsTrusted) {
  const std::string text = ReadTestData(std::string("key_info/") + GetParam().file + ".xml");
  const auto trusted =
      CreateTrustedCertificatesResolver({Load("next"), Load("current"), Load("ec")});
  EXPECT_EQ(Verdict(text, trusted.get()).find(GetParam().verdict), 0U)
      << Verdict(text, trusted.get());
  const auto key = Load("stranger")->GetPublicKey();
  EXPECT_EQ(Verdict(text, MakeRef<OneKeyResolver>(key).get()), "valid");
}

constexpr const char* kTamperedWith = "invalid";
constexpr const char* kUnknownKey =
    "refused: There is no trusted key for the signature, whose key has the SHA-256 hash '";

INSTANTIATE_TEST_SUITE_P(
    Files, StrangersFileTest,
    testing::Values(
        StrangersFile{"stranger-key-value", kUnknownKey},
        StrangersFile{"stranger-der-encoded-key-value", kUnknownKey},
        StrangersFile{"stranger-x509-digest",
                      "refused: There is no trusted key for the signature, whose certificate has "
                      "the digest '"},
        StrangersFile{"stranger-x509-ski",
                      "refused: There is no trusted key for the signature, whose signer has the "
                      "subject key identifier '"},
        StrangersFile{"stranger-none",
                      "refused: There is no trusted key for the signature, which names no signer."},
        StrangersFile{"stranger-names-trusted-key-value", kTamperedWith},
        StrangersFile{"stranger-names-trusted-der-encoded-key-value", kTamperedWith},
        StrangersFile{"stranger-names-trusted-x509-digest", kTamperedWith},
        StrangersFile{"stranger-names-trusted-x509-ski", kTamperedWith},
        StrangersFile{"stranger-names-trusted-x509-subject-name",
                      "refused: There is no trusted key for the signature, whose certificate is "
                      "of '"}),
    [](const auto& tested) {
      std::string name;
      for (const char c : std::string_view(tested.param.file)) {
        name += c == '-' ? std::string() : std::string(1, c);
      }
      return name;
    });

}  // namespace
}  // namespace Tarnik::Testing
