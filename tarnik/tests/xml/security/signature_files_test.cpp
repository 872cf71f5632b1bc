#include <string>

#include <gtest/gtest.h>

#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/signature.h>

#include "support/signed_documents.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;

struct FileCase {
  const char* file;
  const char* verdict;
  const char* signer = "signer";
};

constexpr const char* kXPathRefused =
    "refused: The transform algorithm 'http://www.w3.org/TR/1999/REC-xpath-19991116' is not "
    "supported.";
constexpr const char* kXsltRefused =
    "refused: The transform algorithm 'http://www.w3.org/TR/1999/REC-xslt-19991116' is not "
    "supported.";

const FileCase kFiles[] = {
    {"valid.xml", "valid"},
    {"valid-ecdsa-p521.xml", "valid", "p521"},
    {"valid-inclusive.xml", "valid"},
    {"valid-whole-document.xml", "valid"},
    {"valid-no-canonicalization.xml", "valid"},
    {"valid-line-ends.xml", "valid"},
    {"valid-namespace-with-apostrophes.xml", "valid"},
    {"strangers-key.xml",
     "refused: There is no trusted key for the signature, whose certificate is of "
     "'CN=stranger,O=Test', issued by 'CN=stranger,O=Test' with the serial number "
     "'344872046231744251335646724077188031672883184384'."},
    {"rsa-1024.xml", "refused: The trusted RSA key has 1024 bits; at least 2048 are needed.",
     "weak"},
    {"sha1-digest.xml",
     "refused: The digest algorithm 'http://www.w3.org/2000/09/xmldsig#sha1' is not supported."},
    {"sha1-signature.xml",
     "refused: The signature algorithm 'http://www.w3.org/2000/09/xmldsig#rsa-sha1' is not "
     "supported."},
    {"xpath-hides-subject.xml", kXPathRefused},
    {"xslt-hides-everything.xml", kXsltRefused},
    {"changed-subject.xml", "invalid"},
    {"comment-in-digest-value.xml", "syntax: Element 'ds:DigestValue' may hold nothing but text."},
    {"instruction-in-signature-value.xml",
     "syntax: Element 'ds:SignatureValue' may hold nothing but text."},
    {"second-signed-info.xml",
     "syntax: Element 'ds:Signature' holds 'ds:SignedInfo' where 'SignatureValue' of "
     "XML-Signature is expected."},
    {"signed-info-in-object.xml",
     "syntax: Element 'ds:Signature' holds 'ds:Object' where 'SignedInfo' of XML-Signature is "
     "expected."},
    {"second-id.xml", "refused: More than one element has the id '_a1' of a reference."},
    {"upper-case-algorithm.xml",
     "refused: The signature algorithm 'http://www.w3.org/2001/04/xmldsig-more#RSA-SHA256' is not "
     "supported."},
    {"hmac-algorithm.xml",
     "refused: The signature algorithm 'http://www.w3.org/2001/04/xmldsig-more#hmac-sha256' is "
     "not supported."},
    {"retrieval-method.xml", "syntax: Element 'ds:KeyInfo' may not hold 'ds:RetrievalMethod'."},
};

class SignatureFileTest : public testing::TestWithParam<FileCase> {};

TEST_P(SignatureFileTest, HasTheExpectedVerdict) {
  const FileCase& tested = GetParam();
  const auto resolver = CreateTrustedCertificatesResolver(Crypto::LoadCertificates(
      std::string(TARNIK_TEST_DATA) + "/signatures/" + tested.signer + ".pem"));
  const std::string text = ReadTestData(std::string("signatures/") + tested.file);
  EXPECT_EQ(Verdict(text, resolver.get()), tested.verdict);
}

INSTANTIATE_TEST_SUITE_P(Files, SignatureFileTest, testing::ValuesIn(kFiles),
                         [](const auto& tested) {
                           std::string name;
                           for (const char c : std::string(tested.param.file)) {
                             name.push_back(c == '-' || c == '.' ? '_' : c);
                           }
                           return name;
                         });

}  // namespace
}  // namespace Tarnik::Testing
