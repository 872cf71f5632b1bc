#include "xmlsec.h"

#include <memory>
#include <optional>
#include <string_view>
#include <utility>

#include <xmlsec/xmlsec.h>
#include <libxml/parser.h>
#include <libxml/valid.h>
#include <openssl/ecdsa.h>
#include <openssl/rsa.h>
#include <xmlsec/errors.h>
#include <xmlsec/openssl/app.h>
#include <xmlsec/openssl/crypto.h>
#include <xmlsec/openssl/evp.h>
#include <xmlsec/xmldsig.h>
#include <xmlsec/xmltree.h>

#include "input.h"
#include "support/openssl.h"
#include "value_model.h"
#include "xml_tree.h"

// xmlsec1 does not free everything when it refuses a document.
extern "C" const char* __lsan_default_suppressions() {
  return "leak:libxmlsec1\n";
}

namespace Fuzz {
namespace {

template <auto free>
struct FreeWith {
  template <typename T>
  void operator()(T* object) const {
    free(object);
  }
};
using Context = std::unique_ptr<xmlSecDSigCtx, FreeWith<xmlSecDSigCtxDestroy>>;
using ElementText = std::unique_ptr<xmlChar, void (*)(void*)>;

constexpr char kWsu[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";
// A method that xmlsec1 knows, in place of one that it does not.
constexpr char kKnownMethod[] = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";

struct Method {
  std::string_view uri;
  const char* digest;
  int keyType;
  bool isPss;
};
constexpr Method kMethods[] = {
    {"http://www.w3.org/2000/09/xmldsig#rsa-sha1", "SHA1", EVP_PKEY_RSA, false},
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256", "SHA256", EVP_PKEY_RSA, false},
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha384", "SHA384", EVP_PKEY_RSA, false},
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha512", "SHA512", EVP_PKEY_RSA, false},
    {"http://www.w3.org/2007/05/xmldsig-more#sha1-rsa-MGF1", "SHA1", EVP_PKEY_RSA, true},
    {"http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1", "SHA256", EVP_PKEY_RSA, true},
    {"http://www.w3.org/2007/05/xmldsig-more#sha384-rsa-MGF1", "SHA384", EVP_PKEY_RSA, true},
    {"http://www.w3.org/2007/05/xmldsig-more#sha512-rsa-MGF1", "SHA512", EVP_PKEY_RSA, true},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha1", "SHA1", EVP_PKEY_EC, false},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256", "SHA256", EVP_PKEY_EC, false},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha384", "SHA384", EVP_PKEY_EC, false},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512", "SHA512", EVP_PKEY_EC, false},
};

const Method* FindMethod(std::string_view uri) {
  for (const Method& method : kMethods) {
    if (method.uri == uri) {
      return &method;
    }
  }
  return nullptr;
}

void IgnoreError(const char* /*file*/, int /*line*/, const char* /*function*/,
                 const char* /*object*/, const char* /*subject*/, int /*reason*/,
                 const char* /*message*/) {}

void IgnoreMessage(void* /*context*/, const char* /*format*/, ...) {}

void Initialise() {
  static const bool isReady = [] {
    xmlInitParser();
    const bool isDone =
        xmlSecInit() >= 0 && xmlSecOpenSSLAppInit(nullptr) >= 0 && xmlSecOpenSSLInit() >= 0;
    xmlSecErrorsSetCallback(IgnoreError);
    xmlSetGenericErrorFunc(nullptr, IgnoreMessage);
    return isDone;
  }();
  Require(isReady);
}

const xmlChar* AsXml(std::string_view text) {
  return reinterpret_cast<const xmlChar*>(text.data());
}

std::string OctetsIn(xmlSecBuffer* buffer) {
  return buffer == nullptr ? ""
                           : std::string(reinterpret_cast<const char*>(xmlSecBufferGetData(buffer)),
                                         xmlSecBufferGetSize(buffer));
}

std::string AlgorithmOf(xmlNode* element) {
  const ElementText value(xmlGetNoNsProp(element, AsXml("Algorithm")), xmlFree);
  return TextOf(value.get());
}

xmlNode* Find(xmlNode* from, const char* name) {
  return from == nullptr ? nullptr : xmlSecFindNode(from, AsXml(name), xmlSecDSigNs);
}

bool IsId(const xmlAttr& attribute) {
  const std::string name = TextOf(attribute.name);
  if (attribute.ns == nullptr) {
    return name == "ID" || name == "Id" || name == "id";
  }
  return name == "Id" && TextOf(attribute.ns->href) == kWsu;
}

// libxml2 itself registers each xml:id.
void RegisterIds(xmlDoc* document, xmlNode* element) {
  for (xmlAttr* attribute = element->properties; attribute != nullptr;
       attribute = attribute->next) {
    if (IsId(*attribute)) {
      const ElementText value(xmlNodeListGetString(document, attribute->children, 1), xmlFree);
      if (value != nullptr && xmlGetID(document, value.get()) == nullptr) {
        xmlAddID(nullptr, document, value.get(), attribute);
      }
    }
  }
  for (xmlNode* child = element->children; child != nullptr; child = child->next) {
    if (child->type == XML_ELEMENT_NODE) {
      RegisterIds(document, child);
    }
  }
}

xmlNode* FindSignature(xmlDoc* document, const std::string& id) {
  if (id.empty()) {
    return Find(document->children, "Signature");
  }
  const xmlAttr* attribute = xmlGetID(document, AsXml(id));
  return attribute == nullptr ? nullptr : attribute->parent;
}

/// Null for a text that libxml2 refuses, and for one with a document type declaration.
XmlTree Parse(const std::string& xml) {
  Initialise();
  XmlTree document = ParseByLibXml2(xml);
  if (document == nullptr || xmlGetIntSubset(document.get()) != nullptr) {
    return nullptr;
  }
  RegisterIds(document.get(), xmlDocGetRootElement(document.get()));
  return document;
}

std::string Write(xmlDoc* document) {
  xmlChar* text = nullptr;
  int size = 0;
  xmlDocDumpMemoryEnc(document, &text, &size, "UTF-8");
  const ElementText owner(text, xmlFree);
  return {reinterpret_cast<const char*>(text), static_cast<std::size_t>(size)};
}

Context MakeContext(EVP_PKEY* key) {
  Context context(xmlSecDSigCtxCreate(nullptr));
  context->flags =
      XMLSEC_DSIG_FLAGS_STORE_SIGNEDINFO_REFERENCES | XMLSEC_DSIG_FLAGS_STORE_SIGNATURE;
  context->enabledReferenceUris = xmlSecTransformUriTypeEmpty | xmlSecTransformUriTypeSameDocument;
  EVP_PKEY_up_ref(key);
  xmlSecKeyDataPtr value = xmlSecOpenSSLEvpKeyAdopt(key);
  Require(value != nullptr);
  context->signKey = xmlSecKeyCreate();
  xmlSecKeySetValue(context->signKey, value);
  return context;
}

void CollectAlgorithms(xmlNode* signedInfo, ReadSignature& reading) {
  for (xmlNode* part = xmlSecGetNextElementNode(signedInfo->children); part != nullptr;
       part = xmlSecGetNextElementNode(part->next)) {
    if (TextOf(part->name) == "CanonicalizationMethod") {
      reading.canonicalizationMethod = AlgorithmOf(part);
    }
    if (TextOf(part->name) != "Reference") {
      continue;
    }
    for (xmlNode* node = Find(part, "Transform"); node != nullptr;
         node = xmlSecGetNextElementNode(node->next)) {
      reading.transforms.push_back(AlgorithmOf(node));
    }
    reading.digestMethods.push_back(AlgorithmOf(Find(part, "DigestMethod")));
  }
}

/// Whether every reference has succeeded.
bool CollectReferences(xmlSecDSigCtx* context, ReadSignature& reading) {
  bool isRight = true;
  const xmlSecSize count = xmlSecPtrListGetSize(&context->signedInfoReferences);
  for (xmlSecSize i = 0; i < count; ++i) {
    auto* reference = static_cast<xmlSecDSigReferenceCtx*>(
        xmlSecPtrListGetItem(&context->signedInfoReferences, i));
    isRight = isRight && reference->status == xmlSecDSigStatusSucceeded;
    reading.references.push_back(
        {TextOf(reference->uri), OctetsIn(xmlSecDSigReferenceCtxGetPreDigestBuffer(reference))});
  }
  return isRight && count > 0;
}

// The octets that are signed, if `method` was replaced by `kKnownMethod` before.
std::string SignedOctets(xmlSecDSigCtx* context, const Method& method) {
  std::string octets = OctetsIn(xmlSecDSigCtxGetPreSignBuffer(context));
  const std::size_t element = octets.find("SignatureMethod");
  const std::size_t place =
      element == std::string::npos ? element : octets.find(kKnownMethod, element);
  return place == std::string::npos
             ? ""
             : octets.replace(place, std::string_view(kKnownMethod).size(), method.uri);
}

bool StartPss(EVP_PKEY_CTX* context) {
  return EVP_PKEY_CTX_set_rsa_padding(context, RSA_PKCS1_PSS_PADDING) == 1 &&
         EVP_PKEY_CTX_set_rsa_pss_saltlen(context, RSA_PSS_SALTLEN_DIGEST) == 1;
}

bool IsPssValue(const std::string& octets, xmlNode* signature, const Method& method,
                EVP_PKEY* key) {
  const ElementText content(xmlNodeGetContent(Find(signature, "SignatureValue")), xmlFree);
  const auto value = BytesOf(TextOf(content.get()));
  const Tarnik::OpenSsl::OwnedDigestContext context(EVP_MD_CTX_new());
  EVP_PKEY_CTX* parameters = nullptr;
  return value && EVP_PKEY_get_base_id(key) == method.keyType &&
         EVP_DigestVerifyInit_ex(context.get(), &parameters, method.digest, nullptr, nullptr, key,
                                 nullptr) == 1 &&
         StartPss(parameters) &&
         EVP_DigestVerify(context.get(), value->data(), value->size(), AsXml(octets),
                          octets.size()) == 1;
}

// r and s of equal length instead of their DER (XML Signature 1.1, section 6.4.3).
std::string AsPair(const std::string& der, EVP_PKEY* key) {
  const unsigned char* position = AsXml(der);
  const Tarnik::OpenSsl::Owned<ECDSA_SIG, ECDSA_SIG_free> pair(
      d2i_ECDSA_SIG(nullptr, &position, static_cast<long>(der.size())));
  const int half = (EVP_PKEY_get_bits(key) + 7) / 8;
  std::string value(static_cast<std::size_t>(2 * half), '\0');
  auto* bytes = reinterpret_cast<unsigned char*>(value.data());
  BN_bn2binpad(ECDSA_SIG_get0_r(pair.get()), bytes, half);
  BN_bn2binpad(ECDSA_SIG_get0_s(pair.get()), bytes + half, half);
  return value;
}

std::optional<std::string> ValueOf(const std::string& octets, const Method& method, EVP_PKEY* key) {
  const Tarnik::OpenSsl::OwnedDigestContext context(EVP_MD_CTX_new());
  EVP_PKEY_CTX* parameters = nullptr;
  std::string value(static_cast<std::size_t>(EVP_PKEY_get_size(key)), '\0');
  std::size_t size = value.size();
  if (EVP_PKEY_get_base_id(key) != method.keyType ||
      EVP_DigestSignInit_ex(context.get(), &parameters, method.digest, nullptr, nullptr, key,
                            nullptr) != 1 ||
      (method.isPss && !StartPss(parameters)) ||
      EVP_DigestSign(context.get(), reinterpret_cast<unsigned char*>(value.data()), &size,
                     AsXml(octets), octets.size()) != 1) {
    return std::nullopt;
  }
  value.resize(size);
  return method.keyType == EVP_PKEY_EC ? AsPair(value, key) : value;
}

}  // namespace

ReadSignature VerifyWithXmlSec(const std::string& xml, EVP_PKEY* key,
                               const std::string& signatureId) {
  ReadSignature reading;
  const XmlTree document = Parse(xml);
  xmlNode* signature = document == nullptr ? nullptr : FindSignature(document.get(), signatureId);
  xmlNode* methodElement = Find(signature, "SignatureMethod");
  if (methodElement == nullptr) {
    return reading;
  }
  reading.signatureMethod = AlgorithmOf(methodElement);
  CollectAlgorithms(methodElement->parent, reading);
  const Method* method = FindMethod(reading.signatureMethod);
  const bool isPss = method != nullptr && method->isPss;
  if (isPss) {
    xmlSetProp(methodElement, AsXml("Algorithm"), AsXml(kKnownMethod));
  }
  const Context context = MakeContext(key);
  const bool isProcessed = xmlSecDSigCtxVerify(context.get(), signature) >= 0;
  const bool areReferencesRight = CollectReferences(context.get(), reading);
  const bool isValueRight =
      isPss ? IsPssValue(SignedOctets(context.get(), *method), signature, *method, key)
            : context->status == xmlSecDSigStatusSucceeded;
  reading.isValid = isProcessed && areReferencesRight && isValueRight;
  return reading;
}

std::string SignWithXmlSec(const std::string& xml, EVP_PKEY* key) {
  static const Tarnik::OpenSsl::OwnedKey known(
      EVP_PKEY_Q_keygen(nullptr, nullptr, "RSA", std::size_t{2048}));
  const XmlTree document = Parse(xml);
  xmlNode* signature = document == nullptr ? nullptr : Find(document->children, "Signature");
  xmlNode* methodElement = Find(signature, "SignatureMethod");
  const Method* method = FindMethod(methodElement == nullptr ? "" : AlgorithmOf(methodElement));
  if (method == nullptr) {
    return "";
  }
  xmlSetProp(methodElement, AsXml("Algorithm"), AsXml(kKnownMethod));
  const Context context = MakeContext(known.get());
  if (xmlSecDSigCtxSign(context.get(), signature) < 0) {
    return "";
  }
  xmlSetProp(methodElement, AsXml("Algorithm"), AsXml(method->uri));
  const auto value = ValueOf(SignedOctets(context.get(), *method), *method, key);
  if (!value) {
    return "";
  }
  xmlNodeSetContent(Find(signature, "SignatureValue"), AsXml(Base64Of(*value)));
  return Write(document.get());
}

}  // namespace Fuzz
