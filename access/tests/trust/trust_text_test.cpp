#include <string>

#include <gtest/gtest.h>

#include <tarnik/crypto/certificate.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Tarnik::System::DateTimeFromUtc;

class TrustTextTest : public ::testing::Test {
 protected:
  TrustTextTest() {
    description.signers.resize(1);
    signer().issuer = kIssuer;
    signer().certificate = certificate;
    signer().path = "/trust/a.pem";
  }

  TrustedSigner& signer() { return description.signers[0]; }

  // The text with this state of the revocation.
  std::string Expected(const std::string& revocation) const {
    return "Trust read at 1970-01-01T00:00:00.000Z, 1 signer\n'https://sts.example': CN=sts-0, "
           "serial number " +
           certificate->SerialNumber() + ", from '/trust/a.pem'\n  valid from " +
           certificate->NotBefore().ToString() + " to " + certificate->NotAfter().ToString() +
           ", " + revocation + ", SHA-256 " + Tarnik::Crypto::FingerprintText(*certificate) + "\n";
  }

  const Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate = Sts(0).ToCertificate();
  TrustDescription description;
};

TEST_F(TrustTextTest, SignerHasItsRevocationState) {
  EXPECT_EQ(description.ToString(), Expected("revocation not checked"));
  signer().isRevocationChecked = true;
  EXPECT_EQ(description.ToString(), Expected("refused, since no revocation list covers it"));
  signer().listUntil = DateTimeFromUtc(1'000'000, false);
  EXPECT_EQ(description.ToString(),
            Expected("not revoked, by a list until 1970-01-01T00:00:01.000Z"));
  signer().revokedSince = DateTimeFromUtc(0, false);
  EXPECT_EQ(description.ToString(), Expected("revoked since 1970-01-01T00:00:00.000Z"));
}

TEST_F(TrustTextTest, SignerOfAnyIssuerThatWasGivenAsAnObject) {
  signer().issuer.clear();
  signer().path.clear();
  const std::string text = description.ToString();
  EXPECT_NE(text.find("\nany issuer: CN=sts-0, "), std::string::npos);
  EXPECT_NE(text.find(", given as an object\n"), std::string::npos);
}

TEST_F(TrustTextTest, IssuersWithoutSignersAreTheLastLines) {
  description.issuersWithoutSigners = {"https://b", "c\nd"};
  const std::string before = Expected("revocation not checked");
  EXPECT_EQ(description.ToString(),
            before + "'https://b': nobody is trusted\n'c?d': nobody is trusted\n");
  description.issuersWithoutSigners = {""};
  EXPECT_EQ(description.ToString(), before + "any issuer: nobody is trusted\n");
}

TEST_F(TrustTextTest, IssuerWithoutSignersHasThoseOfAnyIssuer) {
  signer().issuer.clear();
  description.issuersWithoutSigners = {"https://b"};
  const std::string text = description.ToString();
  EXPECT_TRUE(text.ends_with("\n'https://b': only the signers of any issuer are trusted\n"));
}

TEST_F(TrustTextTest, FailureIsALineOfItsOwn) {
  description.signers.clear();
  description.failure = "No\nway.";
  EXPECT_EQ(description.ToString(),
            "Trust read at 1970-01-01T00:00:00.000Z, 0 signers\n"
            "The files as they are now were not accepted: No?way.\n");
}

TEST_F(TrustTextTest, TextsOfOthersHaveNoControlCharacters) {
  signer().issuer = "a\nb";
  signer().path =
      "c\x1b"
      "d";
  const std::string text = description.ToString();
  EXPECT_NE(text.find("'a?b'"), std::string::npos);
  EXPECT_NE(text.find("'c?d'"), std::string::npos);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
