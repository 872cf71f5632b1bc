#include <cstddef>
#include <new>
#include <string>

#include <gtest/gtest.h>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_writer.h>

#include "faults/fault_injection.h"
#include "support/parse_xml.h"

// If a call fails while a signature is made, the signature is blank again, and signing once more
// results in a signature that an independent verifier accepts.
namespace SsoClient::Testing {
namespace {

using Tarnik::Ref;
using Tarnik::Crypto::CreatePrivateKeyFromPem;
using Tarnik::Crypto::PrivateKey;
using Tarnik::Xml::CreateElementNode;
using Tarnik::Xml::ElementNode;
using Tarnik::Xml::Security::CreateBlankSignature;
using Tarnik::Xml::Security::Signature;
using Tarnik::Xml::Security::XmlSecurityException;

constexpr const char* kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr const char* kSha256 = "http://www.w3.org/2001/04/xmlenc#sha256";
constexpr const char* kRsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";

enum class Outcome { kSigned, kRefused, kOutOfMemory };

class SigningFaultsTest : public testing::Test {
 protected:
  SigningFaultsTest() : signer_(MakeSigner()) {
    key_ = CreatePrivateKeyFromPem(signer_.privateKeyPem);
    // Set up once per key or per process before the test, so that no call fails there.
    Prepare();
    EXPECT_EQ(Sign(), Outcome::kSigned);
  }

  static DevSts::Credential MakeSigner() {
    DevSts::CertificateSpec spec;
    spec.commonName = "signer";
    spec.keyType = DevSts::KeyType::Rsa2048;
    return DevSts::MakeCertificate(spec);
  }

  /// Makes a request with a blank signature that covers its body.
  void Prepare() {
    CreateElementNode("", "Request", request_);
    Ref<ElementNode> body;
    CreateElementNode("", "Body", body);
    body->SetAttribute("Id", "body");
    request_->AppendChild(body.get());
    CreateBlankSignature(request_.get(), kExclusive, kRsaSha256, "ds", signature_);
    signature_->AddReference("#body", kSha256)->AddTransform(kExclusive);
  }

  Outcome Sign() {
    try {
      signature_->Sign(key_.get());
      return Outcome::kSigned;
    } catch (const std::bad_alloc&) {
      return Outcome::kOutOfMemory;
    } catch (const XmlSecurityException&) {
      return Outcome::kRefused;
    }
  }

  /// Signs with each call of `kind` failing in turn; returns the number of calls.
  std::size_t FailEachCall(FaultKind kind, int result, Outcome expected) {
    for (std::size_t index = 0;; ++index) {
      Prepare();
      const std::string blank = XmlText(signature_->Element());
      Outcome outcome;
      bool happened = false;
      {
        const InjectedFault fault(kind, index, result);
        outcome = Sign();
        happened = fault.HasHappened();
      }
      if (!happened) {
        EXPECT_EQ(outcome, Outcome::kSigned);
        return index;
      }
      EXPECT_EQ(outcome, expected) << index;
      EXPECT_EQ(XmlText(signature_->Element()), blank) << index;
      EXPECT_EQ(Sign(), Outcome::kSigned) << index;
      request_->AppendChild(signature_->Element());
      EXPECT_TRUE(DevSts::VerifyXml(XmlText(request_.get()), signer_.certificatePem)) << index;
    }
  }

  const DevSts::Credential signer_;
  Ref<const PrivateKey> key_;
  Ref<ElementNode> request_;
  Ref<Signature> signature_;
};

TEST_F(SigningFaultsTest, LeaveABlankSignatureWhenMemoryRunsOut) {
  EXPECT_GT(FailEachCall(FaultKind::kAllocation, 0, Outcome::kOutOfMemory), 10U);
}

TEST_F(SigningFaultsTest, LeaveABlankSignatureWhenTheCryptographicLibraryFails) {
  for (const int result : {0, -1}) {
    // Two digests with at least three calls each, and one signature.
    EXPECT_GE(FailEachCall(FaultKind::kCrypto, result, Outcome::kRefused), 7U);
  }
}

// OpenSSL blinds an RSA key anew after some signatures, and reports a wrong value as a success when
// memory runs out then.
TEST_F(SigningFaultsTest, MakeNoWrongSignatureWhenMemoryRunsOutInTheCryptographicLibrary) {
  constexpr std::size_t kSignatures = 400;
  constexpr std::size_t kFirstAllocations = 12;
  std::size_t refused = 0;
  for (std::size_t i = 0; i < kSignatures; ++i) {
    Prepare();
    Outcome outcome;
    {
      const InjectedFault fault(FaultKind::kOpenSslAllocation, i % kFirstAllocations);
      outcome = Sign();
    }
    if (outcome != Outcome::kSigned) {
      ++refused;
      continue;
    }
    request_->AppendChild(signature_->Element());
    EXPECT_TRUE(DevSts::VerifyXml(XmlText(request_.get()), signer_.certificatePem)) << i;
  }
  EXPECT_GT(refused, 0U);
}

// Whichever construction step fails, nothing leaks, and no incomplete object is returned.
TEST_F(SigningFaultsTest, LeakNothingWhenASignatureCannotBeCreated) {
  std::size_t failures = 0;
  for (bool happened = true; happened; ++failures) {
    Ref<Signature> made;
    const InjectedFault fault(FaultKind::kAllocation, failures);
    try {
      CreateBlankSignature(request_.get(), kExclusive, kRsaSha256, "ds", made);
    } catch (const std::bad_alloc&) {
      EXPECT_EQ(made, nullptr);
    }
    happened = fault.HasHappened();
    EXPECT_EQ(made == nullptr, happened) << failures;
  }
  EXPECT_GT(failures, 5U);
}

TEST_F(SigningFaultsTest, LeaveABlankSignatureWhenAReferenceCannotBeAdded) {
  std::size_t failures = 0;
  for (bool happened = true; happened; ++failures) {
    Prepare();
    const std::string blank = XmlText(signature_->Element());
    {
      const InjectedFault fault(FaultKind::kAllocation, failures);
      try {
        signature_->AddReference("#body", kSha256);
      } catch (const std::bad_alloc&) {
      }
      happened = fault.HasHappened();
    }
    EXPECT_EQ(XmlText(signature_->Element()) == blank, happened) << failures;
    EXPECT_EQ(Sign(), Outcome::kSigned) << failures;
  }
  EXPECT_GT(failures, 5U);
}

}  // namespace
}  // namespace SsoClient::Testing
