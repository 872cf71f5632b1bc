#include "signing/signed_info.h"

#include <sstream>
#include <vector>

#include <openssl/rsa.h>

#include "signing/algorithms.h"
#include "signing/canonical_form.h"
#include "signing/openssl_handles.h"
#include "xml/document.h"
#include "xml/namespaces.h"
#include "xml/schema_values.h"

namespace DevSts {
namespace {

void UsePss(EVP_PKEY_CTX* context) {
  if (EVP_PKEY_CTX_set_rsa_padding(context, RSA_PKCS1_PSS_PADDING) <= 0 ||
      EVP_PKEY_CTX_set_rsa_pss_saltlen(context, RSA_PSS_SALTLEN_DIGEST) <= 0) {
    ThrowOpenSslError("RSA-PSS");
  }
}

const unsigned char* AsOctets(const std::string& text) {
  return reinterpret_cast<const unsigned char*>(text.data());
}

std::vector<std::string> InclusivePrefixesOf(const xmlNode* method) {
  std::vector<std::string> prefixes;
  for (const xmlNode* child : ChildElements(method)) {
    std::istringstream list(AttributeOf(child, "PrefixList"));
    for (std::string prefix; list >> prefix;) {
      prefixes.push_back(prefix);
    }
  }
  return prefixes;
}

}  // namespace

xmlNode* SignatureChild(const xmlNode* parent, const char* localName) {
  xmlNode* found = nullptr;
  for (xmlNode* child : ChildElements(parent)) {
    if (!IsElement(child, kDsigNamespace, localName)) {
      continue;
    }
    if (found != nullptr) {
      throw XmlError(std::string("more than one ds:") + localName);
    }
    found = child;
  }
  if (found == nullptr) {
    throw XmlError(std::string("no ds:") + localName);
  }
  return found;
}

std::string SignatureMethodOf(const xmlNode* signature) {
  return AttributeOf(SignatureChild(SignatureChild(signature, "SignedInfo"), "SignatureMethod"),
                     "Algorithm");
}

void SetSignatureMethod(xmlNode* signature, const char* uri) {
  xmlNode* method = SignatureChild(SignatureChild(signature, "SignedInfo"), "SignatureMethod");
  xmlSetNsProp(method, nullptr, AsXml("Algorithm"), AsXml(uri));
}

std::string CanonicalSignedInfo(xmlNode* signature) {
  xmlNode* signedInfo = SignatureChild(signature, "SignedInfo");
  const xmlNode* method = SignatureChild(signedInfo, "CanonicalizationMethod");
  return CanonicalForm(signature->doc, signedInfo,
                       CanonicalModeOf(AttributeOf(method, "Algorithm")),
                       InclusivePrefixesOf(method));
}

void WritePssSignatureValue(xmlNode* signature, std::string_view keyPem) {
  const KeyHandle key = LoadPrivateKey(keyPem);
  const DigestContextHandle context(EVP_MD_CTX_new());
  EVP_PKEY_CTX* keyContext = nullptr;
  const std::string method = SignatureMethodOf(signature);
  if (!context || EVP_DigestSignInit_ex(context.get(), &keyContext, PssDigestOf(method), nullptr,
                                        nullptr, key.get(), nullptr) != 1) {
    ThrowOpenSslError("RSA-PSS signature");
  }
  UsePss(keyContext);
  const std::string text = CanonicalSignedInfo(signature);
  std::size_t size = 0;
  if (EVP_DigestSign(context.get(), nullptr, &size, AsOctets(text), text.size()) != 1) {
    ThrowOpenSslError("RSA-PSS signature");
  }
  Octets octets(size);
  if (EVP_DigestSign(context.get(), octets.data(), &size, AsOctets(text), text.size()) != 1) {
    ThrowOpenSslError("RSA-PSS signature");
  }
  octets.resize(size);
  xmlNodeSetContent(SignatureChild(signature, "SignatureValue"), AsXml(ToBase64(octets).c_str()));
}

bool PssSignatureValueIsRight(xmlNode* signature, std::string_view certificatePem) {
  const CertificateHandle certificate = LoadCertificate(certificatePem);
  const DigestContextHandle context(EVP_MD_CTX_new());
  EVP_PKEY_CTX* keyContext = nullptr;
  const std::string method = SignatureMethodOf(signature);
  EVP_PKEY* key = X509_get0_pubkey(certificate.get());
  if (!context || EVP_PKEY_is_a(key, "RSA") != 1 ||
      EVP_DigestVerifyInit_ex(context.get(), &keyContext, PssDigestOf(method), nullptr, nullptr,
                              key, nullptr) != 1) {
    return false;
  }
  UsePss(keyContext);
  const std::string text = CanonicalSignedInfo(signature);
  const Octets value = FromBase64(ContentOf(SignatureChild(signature, "SignatureValue")));
  return EVP_DigestVerify(context.get(), value.data(), value.size(), AsOctets(text), text.size()) ==
         1;
}

}  // namespace DevSts
