#include "peer.h"

#include <stdexcept>

#include <xmlsec/xmlsec.h>
#include <libxml/parser.h>
#include <libxml/tree.h>
#include <libxml/valid.h>
#include <openssl/pem.h>
#include <openssl/x509.h>
#include <xmlsec/crypto.h>
#include <xmlsec/keys.h>
#include <xmlsec/openssl/evp.h>
#include <xmlsec/xmldsig.h>
#include <xmlsec/xmltree.h>

namespace Bench {
namespace {

void InitLibraries() {
  static const bool isReady = [] {
    xmlInitParser();
    return xmlSecInit() == 0 && xmlSecCryptoAppInit(nullptr) == 0 && xmlSecCryptoInit() == 0;
  }();
  if (!isReady) {
    throw std::runtime_error("xmlsec1 failed");
  }
}

// Only the id of the assertion itself, since nothing else is referred to.
void RegisterId(xmlDocPtr document, xmlNodePtr root) {
  xmlAttrPtr attribute = xmlHasProp(root, reinterpret_cast<const xmlChar*>("ID"));
  xmlChar* id = xmlNodeListGetString(document, attribute->children, 1);
  xmlAddID(nullptr, document, id, attribute);
  xmlFree(id);
}

bool VerifyDocument(xmlDocPtr document, xmlSecKeyPtr key) {
  xmlNodePtr root = xmlDocGetRootElement(document);
  RegisterId(document, root);
  xmlNodePtr signature = xmlSecFindNode(root, xmlSecNodeSignature, xmlSecDSigNs);
  xmlSecDSigCtxPtr context = xmlSecDSigCtxCreate(nullptr);
  // Lent for this check: a context would destroy a key that it still has at its end.
  context->signKey = key;
  const bool isValid =
      xmlSecDSigCtxVerify(context, signature) == 0 && context->status == xmlSecDSigStatusSucceeded;
  context->signKey = nullptr;
  xmlSecDSigCtxDestroy(context);
  return isValid;
}

struct FreeBio {
  void operator()(BIO* bio) const { BIO_free(bio); }
};
struct FreeCertificate {
  void operator()(X509* certificate) const { X509_free(certificate); }
};

// A bare public key. A key that xmlsec1 loads from a certificate keeps the certificate, and parts
// of both are then copied for each check.
xmlSecKeyPtr MakeKey(const std::string& certificatePem) {
  const std::unique_ptr<BIO, FreeBio> source(
      BIO_new_mem_buf(certificatePem.data(), static_cast<int>(certificatePem.size())));
  const std::unique_ptr<X509, FreeCertificate> certificate(
      PEM_read_bio_X509(source.get(), nullptr, nullptr, nullptr));
  EVP_PKEY* publicKey = certificate == nullptr ? nullptr : X509_get_pubkey(certificate.get());
  // Takes over the public key.
  xmlSecKeyDataPtr value = publicKey == nullptr ? nullptr : xmlSecOpenSSLEvpKeyAdopt(publicKey);
  xmlSecKeyPtr key = value == nullptr ? nullptr : xmlSecKeyCreate();
  if (key == nullptr || xmlSecKeySetValue(key, value) != 0) {
    throw std::runtime_error("xmlsec1 cannot load the public key");
  }
  return key;
}

}  // namespace

struct Peer::State {
  xmlSecKeyPtr key = nullptr;
};

Peer::Peer(const std::string& certificatePem) : state_(std::make_unique<State>()) {
  InitLibraries();
  state_->key = MakeKey(certificatePem);
}

Peer::~Peer() {
  xmlSecKeyDestroy(state_->key);
}

bool Peer::Check(const std::string& xml) {
  xmlDocPtr document =
      xmlReadMemory(xml.data(), static_cast<int>(xml.size()), nullptr, nullptr, XML_PARSE_NONET);
  if (document == nullptr) {
    return false;
  }
  const bool isValid = VerifyDocument(document, state_->key);
  xmlFreeDoc(document);
  return isValid;
}

}  // namespace Bench
