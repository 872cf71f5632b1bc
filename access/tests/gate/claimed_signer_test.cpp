#include "gate/claimed_signer.h"

#include <string>
#include <vector>

#include <ssoclient/access/trust_store.h>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using Tarnik::Xml::Security::KeyInfo;

/// A gate with a real trust store, which selects by each kind of hint.
class ClaimedSignerTest : public GateFixture {
 protected:
  ClaimedSignerTest() {
    TrustStoreConfig store;
    store.isWatching = false;
    store.issuers.resize(1);
    store.issuers[0].issuer = kTokenIssuer;
    store.issuers[0].certificates = {CertificateOf(TrustedCredential())};
    config.trust = CreateTrustStore(store);
  }
  // Of a token that is signed by the trusted signer with this KeyInfo.
  std::string ClaimOf(const std::string& keyInfo) const {
    DevSts::SignOptions options;
    options.keyInfo = DevSts::KeyInfoContent::None;
    const Verdict verdict =
        Check(InsertedAfter(text.ToSignedXml(TrustedCredential(), options), "</ds:SignatureValue>",
                            "<ds:KeyInfo>" + keyInfo + "</ds:KeyInfo>"));
    ExpectRefused(verdict, Reason::kUnknownSigner, CheckKind::kSignerKnown);
    const std::string compared = RecordOf(verdict, CheckKind::kSignerKnown).compared;
    const std::string begin =
        "issuer 'https://sts.example.com/STS'; of 1 that may sign for it, the token may mean "
        "none; it names ";
    EXPECT_EQ(compared.rfind(begin, 0), 0U) << compared;
    return compared.substr(begin.size());
  }
  std::string ClaimOfX509(const std::string& data) const {
    return ClaimOf("<ds:X509Data>" + data + "</ds:X509Data>");
  }
};

// The operator compares the fingerprint.
TEST_F(ClaimedSignerTest, CertificateWithItsWholeFingerprint) {
  const auto stranger = CertificateOf(StrangerCredential());
  const Verdict verdict = Check(text.ToSignedXml(StrangerCredential()));
  ExpectRefused(verdict, Reason::kUnknownSigner, CheckKind::kSignerKnown);
  const std::string claim = "it names the certificate '" + stranger->SubjectName() + "' (SHA-256 " +
                            Tarnik::Crypto::FingerprintText(*stranger) + ")";
  EXPECT_NE(verdict.Message().find(claim + "."), std::string::npos) << verdict.Message();
  EXPECT_NE(RecordOf(verdict, CheckKind::kSignerKnown).compared.find(claim), std::string::npos);
}

TEST_F(ClaimedSignerTest, TrustedSignersHaveShortFingerprints) {
  const auto trusted = CertificateOf(TrustedCredential());
  EXPECT_EQ(RecordOf(Check(text), CheckKind::kSignerRevoked).compared,
            trusted->SubjectName() + " (SHA-256 " +
                Tarnik::Crypto::FingerprintText(*trusted).substr(0, 23) +
                "...): revocation is not checked");
  const std::string whole = Tarnik::Crypto::FingerprintText(*trusted);
  EXPECT_NE(config.trust->Describe().ToString().find(whole), std::string::npos);
}

TEST_F(ClaimedSignerTest, CertificateThatCannotBeRead) {
  EXPECT_EQ(ClaimOfX509("<ds:X509Certificate>AAAA</ds:X509Certificate>"),
            "a certificate that cannot be read");
}

TEST_F(ClaimedSignerTest, IssuerAndSerialNumber) {
  EXPECT_EQ(ClaimOfX509("<ds:X509IssuerSerial><ds:X509IssuerName>CN=CA</ds:X509IssuerName>"
                        "<ds:X509SerialNumber>17</ds:X509SerialNumber></ds:X509IssuerSerial>"),
            "a certificate that was issued by 'CN=CA' with the serial number '17'");
}

TEST_F(ClaimedSignerTest, SubjectKeyIdentifier) {
  EXPECT_EQ(ClaimOfX509("<ds:X509SKI>AQr/</ds:X509SKI>"),
            "a certificate with the subject key identifier 01:0A:FF");
}

TEST_F(ClaimedSignerTest, SubjectName) {
  EXPECT_EQ(ClaimOfX509("<ds:X509SubjectName>CN=other&#10;line</ds:X509SubjectName>"),
            "a certificate of 'CN=other?line'");
}

TEST_F(ClaimedSignerTest, LongTextsAreCut) {
  KeyInfo keyInfo;
  keyInfo.subjectKeyIdentifiers = {std::vector<unsigned char>(10'000, 0xAB)};
  EXPECT_LT(ClaimedSigner(keyInfo).size(), 250U);
  keyInfo = {};
  keyInfo.issuerSerials = {{std::string(10'000, 'x'), std::string(10'000, '1')}};
  EXPECT_LT(ClaimedSigner(keyInfo).size(), 350U);
}

TEST_F(ClaimedSignerTest, KeyName) {
  KeyInfo keyInfo;
  EXPECT_EQ(ClaimedSigner(keyInfo), "no certificate");
  keyInfo.keyNames = {"sts-2027"};
  EXPECT_EQ(ClaimedSigner(keyInfo), "a key by the name 'sts-2027'");
}

}  // namespace
}  // namespace SsoClient::Access::Testing
