#include "signed_request.h"

#include <array>
#include <memory>
#include <stdexcept>
#include <vector>

#include <openssl/bio.h>
#include <openssl/evp.h>
#include <openssl/pem.h>

#include "devsts/xml_security.h"
#include "raw_client.h"

namespace DevSts::Testing {
namespace {

constexpr char kWsse[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
constexpr char kWsse11[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.1.xsd";
constexpr char kWsu[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";
constexpr char kDsig[] = "http://www.w3.org/2000/09/xmldsig#";
constexpr char kExclusive[] = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr char kBase64Binary[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary";
constexpr char kX509[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-x509-token-profile-1.0#X509v3";
constexpr char kSamlTokenType[] =
    "http://docs.oasis-open.org/wss/oasis-wss-saml-tokenprofile-1.1#SAMLV2.0";
constexpr char kSamlId[] = "http://docs.oasis-open.org/wss/oasis-wss-saml-token-profile-1.1#SAMLID";

std::string Base64(const std::vector<unsigned char>& octets) {
  std::string text(4 * ((octets.size() + 2) / 3) + 1, '\0');
  text.resize(
      static_cast<std::size_t>(EVP_EncodeBlock(reinterpret_cast<unsigned char*>(text.data()),
                                               octets.data(), static_cast<int>(octets.size()))));
  return text;
}

std::string Sha256Of(const std::string& text) {
  std::vector<unsigned char> digest(32);
  if (EVP_Digest(text.data(), text.size(), digest.data(), nullptr, EVP_sha256(), nullptr) != 1) {
    throw std::runtime_error("SHA-256");
  }
  return Base64(digest);
}

std::string RsaSha256Of(const std::string& text, const std::string& keyPem) {
  const std::unique_ptr<BIO, decltype(&BIO_free)> bio(
      BIO_new_mem_buf(keyPem.data(), static_cast<int>(keyPem.size())), BIO_free);
  const std::unique_ptr<EVP_PKEY, decltype(&EVP_PKEY_free)> key(
      PEM_read_bio_PrivateKey(bio.get(), nullptr, nullptr, nullptr), EVP_PKEY_free);
  const std::unique_ptr<EVP_MD_CTX, decltype(&EVP_MD_CTX_free)> context(EVP_MD_CTX_new(),
                                                                        EVP_MD_CTX_free);
  std::vector<unsigned char> value(1024);
  std::size_t size = value.size();
  if (EVP_DigestSignInit(context.get(), nullptr, EVP_sha256(), nullptr, key.get()) != 1 ||
      EVP_DigestSign(context.get(), value.data(), &size,
                     reinterpret_cast<const unsigned char*>(text.data()), text.size()) != 1) {
    throw std::runtime_error("signing a request");
  }
  value.resize(size);
  return Base64(value);
}

// The Base64 lines of the PEM encode the certificate's octets.
std::string Base64Of(const std::string& certificatePem) {
  std::string text;
  for (std::size_t at = 0; at < certificatePem.size();) {
    const std::size_t end = certificatePem.find('\n', at);
    const std::string line = certificatePem.substr(at, end - at);
    if (line.find("-----") == std::string::npos) {
      text += line;
    }
    at = end + 1;
  }
  return text;
}

std::string SignatureTemplate(const std::string& reference) {
  return std::string("<ds:Signature xmlns:ds=\"") + kDsig +
         "\" Id=\"holderOfKeyProofSignature\"><ds:SignedInfo><ds:CanonicalizationMethod "
         "Algorithm=\"" +
         kExclusive +
         "\"/><ds:SignatureMethod "
         "Algorithm=\"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256\"/>" +
         ReferenceTo(kBodyId) + ReferenceTo(kTimestampId) +
         "</ds:SignedInfo><ds:SignatureValue>VALUE</ds:SignatureValue><ds:KeyInfo>" + reference +
         "</ds:KeyInfo></ds:Signature>";
}

void FillIn(std::string& envelope, const std::string& id, const char* path) {
  const std::string place = ">DIGEST-" + id + "<";
  while (envelope.find(place) != std::string::npos) {
    const std::string text = Canonicalize(envelope, path, CanonicalMode::Exclusive);
    envelope = Replaced(envelope, place, ">" + Sha256Of(text) + "<");
  }
}

}  // namespace

ProofRequest ByCertificate(const Credential& holder, const std::string& body,
                           const std::string& tokens) {
  ProofRequest request;
  request.tokens = tokens + "<wsse:BinarySecurityToken EncodingType=\"" + kBase64Binary +
                   "\" ValueType=\"" + kX509 + "\" wsu:Id=\"holderOfKeyCertificate\" xmlns:wsu=\"" +
                   kWsu + "\">" + Base64Of(holder.certificatePem) + "</wsse:BinarySecurityToken>";
  request.reference = std::string("<wsse:SecurityTokenReference xmlns:wsse=\"") + kWsse +
                      "\"><wsse:Reference URI=\"#holderOfKeyCertificate\" ValueType=\"" + kX509 +
                      "\"/></wsse:SecurityTokenReference>";
  request.body = body;
  return request;
}

ProofRequest ByToken(const std::string& assertion, const std::string& body) {
  ProofRequest request;
  request.tokens = assertion;
  request.reference = std::string("<wsse:SecurityTokenReference wsse11:TokenType=\"") +
                      kSamlTokenType + "\" xmlns:wsse=\"" + kWsse + "\" xmlns:wsse11=\"" + kWsse11 +
                      "\"><wsse:KeyIdentifier ValueType=\"" + kSamlId + "\">" +
                      IdOfAssertion(assertion) +
                      "</wsse:KeyIdentifier></wsse:SecurityTokenReference>";
  request.body = body;
  return request;
}

std::string ReferenceTo(const std::string& id) {
  return "<ds:Reference URI=\"#" + id + "\"><ds:Transforms><ds:Transform Algorithm=\"" +
         kExclusive +
         "\"/></ds:Transforms><ds:DigestMethod "
         "Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"/><ds:DigestValue>DIGEST-" +
         id + "</ds:DigestValue></ds:Reference>";
}

std::string Sign(const ProofRequest& request, const Credential& key, const Edits& edits) {
  const std::string wsuId = std::string(" xmlns:wsu=\"") + kWsu + "\" wsu:Id=\"";
  std::string envelope =
      Edited(Envelope(request.tokens + SignatureTemplate(request.reference), request.body),
             {{"<soapenv:Body", "<soapenv:Body" + wsuId + kBodyId + "\""},
              {"<wsu:Timestamp", std::string("<wsu:Timestamp wsu:Id=\"") + kTimestampId + "\""}});
  envelope = Edited(std::move(envelope), edits);
  FillIn(envelope, kBodyId, "/*/*[local-name()='Body']");
  FillIn(envelope, kTimestampId, "/*/*/*/*[local-name()='Timestamp']");
  const std::string signedInfo =
      Canonicalize(envelope, "/*/*/*/*[local-name()='Signature']/*[local-name()='SignedInfo']",
                   CanonicalMode::Exclusive);
  return Replaced(envelope, ">VALUE<", ">" + RsaSha256Of(signedInfo, key.privateKeyPem) + "<");
}

std::string Edited(std::string text, const Edits& edits) {
  for (const auto& [from, to] : edits) {
    text = Replaced(std::move(text), from, to);
  }
  return text;
}

Credential Holder(const std::string& commonName) {
  CertificateSpec spec;
  spec.commonName = commonName;
  spec.keyType = KeyType::Rsa2048;
  return MakeCertificate(spec);
}

std::string Ask(const Server& server, const std::string& envelope, const std::string& action) {
  RawClient client(server.HttpPort());
  client.Send(PostOf(envelope, action));
  return client.ReadAnswer();
}

std::string HolderToken(const Server& server, const Credential& holder, const std::string& more) {
  const std::string answer =
      Ask(server, Sign(ByCertificate(holder, IssueBody("PublicKey", more),
                                     UsernameToken("alice@EXAMPLE.COM", "secret")),
                       holder));
  std::string assertion = AssertionIn(answer);
  if (assertion.empty()) {
    throw std::runtime_error("no token: " + answer);
  }
  return assertion;
}

std::string IdOfAssertion(const std::string& assertion) {
  const std::size_t from = assertion.find(" ID=\"") + 5;
  return assertion.substr(from, assertion.find('"', from) - from);
}

std::string WithoutSignature(const std::string& assertion) {
  const std::string close = "</ds:Signature>";
  const std::size_t from = assertion.find("<ds:Signature ");
  const std::size_t end = assertion.find(close) + close.size();
  return assertion.substr(0, from) + assertion.substr(end);
}

}  // namespace DevSts::Testing
