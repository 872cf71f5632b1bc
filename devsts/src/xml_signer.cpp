#include <xmlsec/openssl/app.h>
#include <xmlsec/openssl/evp.h>
#include <xmlsec/openssl/x509.h>
#include <xmlsec/xmldsig.h>

#include "algorithms.h"
#include "devsts/xml_security.h"
#include "namespaces.h"
#include "signature_template.h"
#include "signed_info.h"
#include "xml_library.h"

namespace DevSts {
namespace {

using XmlSecKeyHandle = std::unique_ptr<xmlSecKey, FreeWith<xmlSecKeyDestroy>>;
using SignatureContextHandle = std::unique_ptr<xmlSecDSigCtx, FreeWith<xmlSecDSigCtxDestroy>>;

const xmlSecByte* AsOctets(std::string_view text) {
  return reinterpret_cast<const xmlSecByte*>(text.data());
}

XmlSecKeyHandle LoadSigningKey(std::string_view keyPem, std::string_view certificatePem) {
  XmlSecKeyHandle key(xmlSecOpenSSLAppKeyLoadMemory(
      AsOctets(keyPem), keyPem.size(), xmlSecKeyDataFormatPem, nullptr, nullptr, nullptr));
  if (!key) {
    throw XmlError("signing key does not load: " + TakeXmlSecErrors());
  }
  if (xmlSecOpenSSLAppKeyCertLoadMemory(key.get(), AsOctets(certificatePem), certificatePem.size(),
                                        xmlSecKeyDataFormatPem) < 0) {
    throw XmlError("signing certificate does not load: " + TakeXmlSecErrors());
  }
  return key;
}

void SignWithXmlSec(xmlNode* signature, std::string_view keyPem, std::string_view certificatePem) {
  TakeXmlSecErrors();
  const SignatureContextHandle context(xmlSecDSigCtxCreate(nullptr));
  if (!context) {
    throw XmlError("no memory for a signature context");
  }
  context->signKey = LoadSigningKey(keyPem, certificatePem).release();
  if (xmlSecDSigCtxSign(context.get(), signature) < 0) {
    throw XmlError("xmlsec1 cannot sign: " + TakeXmlSecErrors());
  }
}

}  // namespace

std::string SignXml(std::string_view xml, std::string_view keyPem, std::string_view certificatePem,
                    const SignOptions& options) {
  const DocumentHandle document = ParseXml(xml);
  xmlNode* root = xmlDocGetRootElement(document.get());
  const std::vector<xmlNode*> templates = FindElements(root, kDsigNamespace, "Signature");
  xmlNode* signature = templates.empty()
                           ? AddSignatureTemplate(ElementToSign(document.get(), options), options)
                           : templates.front();
  RegisterIds(document.get());

  const std::string method = SignatureMethodOf(signature);
  if (PssDigestOf(method) == nullptr) {
    SignWithXmlSec(signature, keyPem, certificatePem);
    return WriteXml(document.get());
  }
  // xmlsec1 fills in digests and KeyInfo; its signature value is replaced.
  SetSignatureMethod(signature, UriOf(SignatureAlgorithm::RsaSha256));
  SignWithXmlSec(signature, keyPem, certificatePem);
  SetSignatureMethod(signature, method.c_str());
  WritePssSignatureValue(signature, keyPem);
  return WriteXml(document.get());
}

}  // namespace DevSts
