#include "peer.h"

#include <stdexcept>

#include <xmlsec/xmlsec.h>
#include <libxml/parser.h>
#include <libxml/tree.h>
#include <xmlsec/crypto.h>
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

bool VerifyDocument(xmlDocPtr document, xmlSecKeyPtr key) {
  const xmlChar* ids[] = {reinterpret_cast<const xmlChar*>("ID"), nullptr};
  xmlNodePtr root = xmlDocGetRootElement(document);
  xmlSecAddIDs(document, root, ids);
  xmlNodePtr signature = xmlSecFindNode(root, xmlSecNodeSignature, xmlSecDSigNs);
  xmlSecDSigCtxPtr context = xmlSecDSigCtxCreate(nullptr);
  context->signKey = xmlSecKeyDuplicate(key);
  const bool isValid =
      xmlSecDSigCtxVerify(context, signature) == 0 && context->status == xmlSecDSigStatusSucceeded;
  xmlSecDSigCtxDestroy(context);
  return isValid;
}

}  // namespace

struct Peer::State {
  xmlSecKeyPtr key = nullptr;
};

Peer::Peer(const std::string& certificatePem) : state_(std::make_unique<State>()) {
  InitLibraries();
  state_->key =
      xmlSecCryptoAppKeyLoadMemory(reinterpret_cast<const xmlSecByte*>(certificatePem.data()),
                                   static_cast<xmlSecSize>(certificatePem.size()),
                                   xmlSecKeyDataFormatCertPem, nullptr, nullptr, nullptr);
  if (state_->key == nullptr) {
    throw std::runtime_error("xmlsec1 cannot load the certificate");
  }
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
