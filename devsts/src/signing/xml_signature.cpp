#include "signing/xml_signature.h"

#include <functional>
#include <memory>

#include <xmlsec/openssl/app.h>
#include <xmlsec/openssl/evp.h>
#include <xmlsec/openssl/x509.h>
#include <xmlsec/xmldsig.h>

#include "signing/algorithms.h"
#include "signing/openssl_handles.h"
#include "signing/signature_template.h"
#include "signing/signed_info.h"
#include "xml/document.h"
#include "xml/namespaces.h"

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

XmlSecKeyHandle PublicKeyOf(X509* certificate) {
  EVP_PKEY* publicKey = X509_get_pubkey(certificate);
  xmlSecKeyDataPtr value = xmlSecOpenSSLEvpKeyAdopt(publicKey);
  if (value == nullptr) {
    EVP_PKEY_free(publicKey);
    throw XmlError("xmlsec1 does not accept the certificate's key: " + TakeXmlSecErrors());
  }
  XmlSecKeyHandle key(xmlSecKeyCreate());
  if (!key || xmlSecKeySetValue(key.get(), value) < 0) {
    xmlSecKeyDataDestroy(value);
    throw XmlError("no memory for a key");
  }
  return key;
}

SignatureContextHandle VerifyingContext(X509* certificate) {
  SignatureContextHandle context(xmlSecDSigCtxCreate(nullptr));
  if (!context) {
    throw XmlError("no memory for a signature context");
  }
  context->enabledReferenceUris = xmlSecTransformUriTypeEmpty | xmlSecTransformUriTypeSameDocument;
  context->signKey = PublicKeyOf(certificate).release();
  return context;
}

std::string ReasonOr(const char* otherwise) {
  const std::string errors = TakeXmlSecErrors();
  return errors.empty() ? otherwise : errors;
}

bool EveryReferenceIsRight(xmlSecDSigCtx* context) {
  const xmlSecSize count = xmlSecPtrListGetSize(&context->signedInfoReferences);
  for (xmlSecSize i = 0; i < count; ++i) {
    const auto* reference = static_cast<const xmlSecDSigReferenceCtx*>(
        xmlSecPtrListGetItem(&context->signedInfoReferences, i));
    if (reference->status != xmlSecDSigStatusSucceeded) {
      return false;
    }
  }
  return count > 0;
}

void VerifyWithXmlSec(xmlNode* signature, X509* certificate, VerifyResult& result) {
  const SignatureContextHandle context = VerifyingContext(certificate);
  if (xmlSecDSigCtxVerify(context.get(), signature) < 0) {
    result.reason = ReasonOr("xmlsec1 cannot process the signature");
    return;
  }
  if (!EveryReferenceIsRight(context.get())) {
    result.reason = ReasonOr("a reference's digest is wrong");
    return;
  }
  if (context->status != xmlSecDSigStatusSucceeded) {
    result.reason = ReasonOr("the signature value is wrong");
    return;
  }
  result.valid = true;
}

void VerifyPss(xmlNode* signature, X509* certificate, std::string_view certificatePem,
               VerifyResult& result) {
  if (!PssSignatureValueIsRight(signature, certificatePem)) {
    result.reason = "the signature value is wrong";
    return;
  }
  // xmlsec1 verifies the references with a signature method that it supports; its result for the
  // signature value is ignored.
  SetSignatureMethod(signature, UriOf(SignatureAlgorithm::RsaSha256));
  const SignatureContextHandle context = VerifyingContext(certificate);
  if (xmlSecDSigCtxVerify(context.get(), signature) < 0) {
    result.reason = ReasonOr("xmlsec1 cannot process the signature");
    return;
  }
  result.valid = EveryReferenceIsRight(context.get());
  result.reason = result.valid ? "" : "a reference's digest is wrong";
}

void VerifyIn(xmlNode* signature, std::string_view certificatePem, VerifyResult& result) {
  const CertificateHandle certificate = LoadCertificate(certificatePem);
  for (xmlNode* reference :
       FindElements(SignatureChild(signature, "SignedInfo"), kDsigNamespace, "Reference")) {
    result.referenceUris.push_back(AttributeOf(reference, "URI"));
  }
  if (PssDigestOf(SignatureMethodOf(signature)) != nullptr) {
    VerifyPss(signature, certificate.get(), certificatePem, result);
    return;
  }
  VerifyWithXmlSec(signature, certificate.get(), result);
}

void VerifyFirst(std::string_view xml, std::string_view certificatePem, VerifyResult& result) {
  const DocumentHandle document = ParseXml(xml);
  xmlNode* root = xmlDocGetRootElement(document.get());
  const std::vector<xmlNode*> signatures = FindElements(root, kDsigNamespace, "Signature");
  if (signatures.empty()) {
    result.reason = "no signature";
    return;
  }
  RegisterIds(document.get());
  VerifyIn(signatures.front(), certificatePem, result);
}

VerifyResult ResultOf(const std::function<void(VerifyResult&)>& verify) {
  InitializeXmlLibraries();
  TakeXmlSecErrors();
  VerifyResult result;
  try {
    verify(result);
  } catch (const std::runtime_error& error) {
    result.valid = false;
    result.reason = error.what();
  }
  return result;
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
  // xmlsec1 fills in the digests and KeyInfo; its signature value is then replaced.
  SetSignatureMethod(signature, UriOf(SignatureAlgorithm::RsaSha256));
  SignWithXmlSec(signature, keyPem, certificatePem);
  SetSignatureMethod(signature, method.c_str());
  WritePssSignatureValue(signature, keyPem);
  return WriteXml(document.get());
}

VerifyResult VerifySignature(xmlNode* signature, std::string_view certificatePem) {
  return ResultOf([&](VerifyResult& result) { VerifyIn(signature, certificatePem, result); });
}

VerifyResult VerifyXml(std::string_view xml, std::string_view certificatePem) {
  try {
    LoadCertificate(certificatePem);
  } catch (const std::runtime_error& error) {
    throw XmlError(error.what());
  }
  return ResultOf([&](VerifyResult& result) { VerifyFirst(xml, certificatePem, result); });
}

}  // namespace DevSts
