#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <openssl/sha.h>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/assertion_text.h"

// Tokens during a change of the key: several certificates are trusted.
namespace SsoClient::Testing {
namespace {

using DevSts::Credential;
using DevSts::KeyType;
using Tarnik::Ref;
using Tarnik::Xml::Security::KeyInfoResolver;

Credential MakeSigner(KeyType type) {
  DevSts::CertificateSpec spec;
  spec.commonName = "STS";
  spec.keyType = type;
  spec.freshKey = true;
  return DevSts::MakeCertificate(spec);
}

struct Signers {
  Credential old = MakeSigner(KeyType::Rsa2048);
  Credential current = MakeSigner(KeyType::Rsa2048);
  Credential ec = MakeSigner(KeyType::EcP256);
  Credential stranger = MakeSigner(KeyType::Rsa2048);
};

// Created once, since generating RSA keys is slow.
const Signers& AllSigners() {
  static const Signers signers;
  return signers;
}

std::string KeyName() {
  return "<ds:KeyInfo><ds:KeyName>key of the STS</ds:KeyName></ds:KeyInfo>";
}

std::string DigestOf(const Credential& credential) {
  const auto certificate =
      Tarnik::Crypto::CreateCertificatesFromPem(credential.certificatePem).front();
  std::vector<unsigned char> digest(SHA256_DIGEST_LENGTH);
  SHA256(certificate->DerBytes(), certificate->DerLength(), digest.data());
  return R"(<ds:KeyInfo><ds:X509Data>)"
         R"(<dsig11:X509Digest xmlns:dsig11="http://www.w3.org/2009/xmldsig11#" )"
         R"(Algorithm="http://www.w3.org/2001/04/xmlenc#sha256">)" +
         Tarnik::StringUtil::Base64Encode(digest) +
         "</dsig11:X509Digest></ds:X509Data></ds:KeyInfo>";
}

// The KeyInfo is not signed, and is added later, since the oracle would replace an X509Data.
std::string SignedBy(const Credential& signer, const std::string& keyInfo,
                     const std::string& method = "rsa-sha256") {
  AssertionText text;
  std::string& signature = text.signature;
  signature = Replaced(signature, "AAECAwQFBgcICQoLDA0ODxAREhMUFRYXGBkaGxwdHh8=", "");
  signature = Replaced(signature, "AAECAwQF", "");
  signature = Replaced(signature, "ecdsa-sha256", method);
  const std::string xml =
      DevSts::SignXml(text.ToXml(), signer.privateKeyPem, signer.certificatePem);
  return InsertedAfter(xml, "</ds:SignatureValue>", keyInfo);
}

Ref<const KeyInfoResolver> Trusting(const std::vector<Credential>& credentials) {
  std::string pem;
  for (const Credential& credential : credentials) {
    pem += credential.certificatePem;
  }
  return Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::CreateCertificatesFromPem(pem));
}

class SeveralKeysTest : public testing::Test {
 protected:
  /// Empty if the token is accepted, else why it is refused: by the function and by the factory.
  static std::string RefusalOf(const std::string& xml, const KeyInfoResolver* resolver) {
    const std::string refusal = RefusalBy([&] { return CreateSamlToken(xml, resolver); });
    const auto factory = CreateSamlTokenFactory(resolver);
    EXPECT_EQ(RefusalBy([&] { return factory->CreateToken(xml); }), refusal);
    return refusal;
  }

  template <class Create>
  static std::string RefusalBy(Create create) {
    try {
      EXPECT_EQ(create()->Subject().name, "alice");
      return "";
    } catch (const InvalidSignatureException& error) {
      return error.Message();
    }
  }

  static std::string RefusalOf(const std::string& xml) {
    return RefusalOf(xml, Trusting({signers_.old, signers_.current, signers_.ec}).get());
  }

  static std::string NoTrustedKey(const std::string& signer) {
    return "Signature verification error. There is no trusted key for the signature, " + signer;
  }

  static const Signers& signers_;
};

const Signers& SeveralKeysTest::signers_ = AllSigners();

TEST_F(SeveralKeysTest, AcceptsATokenThatNamesNoCertificate) {
  for (const std::string& keyInfo : {std::string(), KeyName()}) {
    EXPECT_EQ(RefusalOf(SignedBy(signers_.old, keyInfo)), "") << keyInfo;
    EXPECT_EQ(RefusalOf(SignedBy(signers_.current, keyInfo)), "") << keyInfo;
    EXPECT_EQ(RefusalOf(SignedBy(signers_.ec, keyInfo, "ecdsa-sha256")), "") << keyInfo;
  }
}

TEST_F(SeveralKeysTest, AcceptsATokenThatNamesItsCertificateByADigest) {
  EXPECT_EQ(RefusalOf(SignedBy(signers_.old, DigestOf(signers_.old))), "");
  EXPECT_EQ(RefusalOf(SignedBy(signers_.current, DigestOf(signers_.current))), "");
  EXPECT_EQ(RefusalOf(SignedBy(signers_.ec, DigestOf(signers_.ec), "ecdsa-sha256")), "");
  // No other trusted key is tried.
  EXPECT_EQ(RefusalOf(SignedBy(signers_.current, DigestOf(signers_.old))),
            "Failed to verify signature: token might have been tampered with.");
}

TEST_F(SeveralKeysTest, RefusesAStrangersTokenWhateverItNames) {
  const auto strangers = Trusting({signers_.stranger, signers_.ec});
  for (const std::string& keyInfo : {std::string(), KeyName(), DigestOf(signers_.stranger)}) {
    const std::string xml = SignedBy(signers_.stranger, keyInfo);
    EXPECT_EQ(RefusalOf(xml, strangers.get()), "") << keyInfo;
    EXPECT_EQ(RefusalOf(xml).rfind(NoTrustedKey(""), 0), 0U) << RefusalOf(xml);
  }
  EXPECT_EQ(RefusalOf(SignedBy(signers_.stranger, DigestOf(signers_.current))),
            "Failed to verify signature: token might have been tampered with.");
}

TEST_F(SeveralKeysTest, RefusesATokenThatWasChanged) {
  const std::string tampered =
      Replaced(SignedBy(signers_.current, KeyName()), "alice@example.com", "admin@example.com");
  EXPECT_EQ(RefusalOf(tampered),
            "Failed to verify signature: token might have been tampered with.");
  // Without a hint, no key is the one of a changed signature value.
  std::string otherValue = SignedBy(signers_.current, "");
  char& first = otherValue.at(otherValue.find("SignatureValue>") + 20);
  first = first == 'A' ? 'B' : 'A';
  EXPECT_EQ(RefusalOf(otherValue), NoTrustedKey("which names no signer."));
}

TEST_F(SeveralKeysTest, RefusesAnAlgorithmOfNoTrustedKey) {
  const auto rsaOnly = Trusting({signers_.old, signers_.current});
  EXPECT_EQ(RefusalOf(SignedBy(signers_.ec, "", "ecdsa-sha256"), rsaOnly.get()),
            "Signature verification error. No trusted key is of the type of the signature "
            "algorithm.");
}

}  // namespace
}  // namespace SsoClient::Testing
