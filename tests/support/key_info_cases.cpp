// Token cases about the key that a signature names, and about signers whom nobody trusts.
#include <string>
#include <vector>

#include "support/assertion_text.h"
#include "support/forgeries.h"
#include "support/token_cases.h"

namespace SsoClient::Testing {
namespace {

std::string X509(const std::string& content) {
  return "<ds:X509Data>" + content + "</ds:X509Data>";
}

std::string CertificateIn(const DevSts::Credential& credential) {
  return X509("<ds:X509Certificate>" + CertificateBody(credential.certificatePem) +
              "</ds:X509Certificate>");
}

// The KeyInfo is not signed.
std::string WithKeyInfo(const DevSts::Credential& signer, const std::string& content) {
  DevSts::SignOptions options;
  options.keyInfo = DevSts::KeyInfoContent::None;
  return InsertedAfter(AssertionText().ToSignedXml(signer, options), "</ds:SignatureValue>",
                       content.empty() ? "" : "<ds:KeyInfo>" + content + "</ds:KeyInfo>");
}

struct Hint {
  const char* name;
  std::string content;
  Fate ofTrusted;  // when the trusted credential has signed
  Fate ofStranger = Fate::kBadSignature;
};

std::vector<Hint> Hints() {
  const std::string trusted = CertificateIn(TrustedCredential());
  const std::string stranger = CertificateIn(StrangerCredential());
  const std::string d = "xmlns:d=\"http://www.w3.org/2009/xmldsig11#\"";
  return {
      {"nothing", "", Fate::kAccepted},
      {"trusted certificate", trusted, Fate::kAccepted},
      {"stranger's certificate", stranger, Fate::kNoTrustedKey, Fate::kNoTrustedKey},
      {"both certificates", stranger + trusted, Fate::kAccepted},
      {"key name", "<ds:KeyName>STS</ds:KeyName>", Fate::kAccepted},
      {"subject of both", X509("<ds:X509SubjectName>CN=STS</ds:X509SubjectName>"), Fate::kAccepted},
      {"subject of nobody", X509("<ds:X509SubjectName>CN=X</ds:X509SubjectName>"),
       Fate::kNoTrustedKey, Fate::kNoTrustedKey},
      {"certificate that is no Base64", X509("<ds:X509Certificate>*</ds:X509Certificate>"),
       Fate::kNotAToken, Fate::kNotAToken},
      {"certificate that cannot be decoded", X509("<ds:X509Certificate>AAAA</ds:X509Certificate>"),
       Fate::kNoTrustedKey, Fate::kNoTrustedKey},
      {"retrieval from a file", R"(<ds:RetrievalMethod URI="file:///etc/ssl/certs/ca.pem"/>)",
       Fate::kNotAToken, Fate::kNotAToken},
      {"retrieval from a server", R"(<ds:RetrievalMethod URI="http://127.0.0.1:1/key"/>)",
       Fate::kNotAToken, Fate::kNotAToken},
      {"reference to a KeyInfo", "<d:KeyInfoReference " + d + " URI=\"#k\"/>", Fate::kNotAToken,
       Fate::kNotAToken},
      {"empty modulus",
       "<ds:KeyValue><ds:RSAKeyValue><ds:Modulus></ds:Modulus><ds:Exponent>AQAB</ds:Exponent>"
       "</ds:RSAKeyValue></ds:KeyValue>",
       Fate::kAccepted},
      {"encoded key that is broken", "<d:DEREncodedKeyValue " + d + ">AAAA</d:DEREncodedKeyValue>",
       Fate::kAccepted},
      {"an assertion", "<saml2:Assertion/>", Fate::kNotAToken, Fate::kNotAToken}};
}

}  // namespace

std::vector<TokenCase> KeyInfoCases() {
  std::vector<TokenCase> cases;
  for (const Hint& hint : Hints()) {
    cases.push_back({std::string("trusted: ") + hint.name,
                     WithKeyInfo(TrustedCredential(), hint.content), hint.ofTrusted});
    cases.push_back({std::string("stranger: ") + hint.name,
                     WithKeyInfo(StrangerCredential(), hint.content), hint.ofStranger});
  }
  return cases;
}

std::vector<TokenCase> UntrustedCases() {
  AssertionText other;
  other.issuer = Replaced(other.issuer, "https://sts.example.com/STS", "https://other.example");
  AssertionText bare;
  bare.signature.clear();
  AssertionText otherBare = other;
  otherBare.signature.clear();
  return {{"of the trusted signer", OriginalAssertion(), Fate::kAccepted},
          {"of a stranger", AssertionText().ToSignedXml(StrangerCredential()), Fate::kNoTrustedKey},
          {"of another issuer and a stranger", other.ToSignedXml(StrangerCredential()),
           Fate::kNoTrustedKey},
          {"unsigned", bare.ToXml(), Fate::kNotAToken},
          {"unsigned, of another issuer", otherBare.ToXml(), Fate::kNotAToken},
          {"with a made-up signature", AssertionText().ToXml(), Fate::kBadSignature},
          {"about somebody else",
           Replaced(OriginalAssertion(), "alice@example.com", "admin@example.com"),
           Fate::kBadSignature}};
}

}  // namespace SsoClient::Testing
