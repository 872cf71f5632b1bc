#include "signing/signature_template.h"

#include <string>

#include "signing/algorithms.h"
#include "xml/document.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

constexpr char kEnveloped[] = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";

class TemplateWriter {
 public:
  TemplateWriter() : signature_(xmlNewNode(nullptr, AsXml("Signature"))) {
    namespace_ = xmlNewNs(signature_, AsXml(kDsigNamespace), AsXml("ds"));
    xmlSetNs(signature_, namespace_);
  }

  xmlNode* Signature() const { return signature_; }

  xmlNode* Add(xmlNode* parent, const char* name, const char* algorithm = nullptr) {
    xmlNode* node = xmlNewChild(parent, namespace_, AsXml(name), nullptr);
    if (algorithm != nullptr) {
      xmlNewProp(node, AsXml("Algorithm"), AsXml(algorithm));
    }
    return node;
  }

 private:
  xmlNode* signature_;
  xmlNs* namespace_;
};

// Exclusive XML Canonicalization 1.0, section 4; the inclusive forms have no prefix list.
void AddInclusiveNamespaces(xmlNode* transform, const SignOptions& options) {
  if (!IsExclusive(options.canonicalization) || options.inclusivePrefixes.empty()) {
    return;
  }
  std::string list;
  for (const std::string& prefix : options.inclusivePrefixes) {
    list += (list.empty() ? "" : " ") + prefix;
  }
  xmlNode* node = xmlNewChild(transform, nullptr, AsXml("InclusiveNamespaces"), nullptr);
  xmlSetNs(node, xmlNewNs(node, AsXml(UriOf(CanonicalMode::Exclusive)), AsXml("ec")));
  xmlNewProp(node, AsXml("PrefixList"), AsXml(list.c_str()));
}

void AddKeyInfo(TemplateWriter& writer, KeyInfoContent content) {
  if (content == KeyInfoContent::None) {
    return;
  }
  xmlNode* keyInfo = writer.Add(writer.Signature(), "KeyInfo");
  if (content == KeyInfoContent::KeyValue) {
    writer.Add(keyInfo, "KeyValue");
    return;
  }
  writer.Add(writer.Add(keyInfo, "X509Data"), "X509Certificate");
}

std::string ReferenceUriFor(const xmlNode* element, const SignOptions& options) {
  if (!options.referenceUri.empty()) {
    return options.referenceUri;
  }
  const std::string id = AttributeOf(element, "ID");
  return id.empty() ? std::string() : "#" + id;
}

}  // namespace

xmlNode* ElementToSign(xmlDoc* document, const SignOptions& options) {
  xmlNode* root = xmlDocGetRootElement(document);
  xmlNode* found = nullptr;
  for (xmlNode* node = root; node != nullptr; node = NextElement(root, node)) {
    const bool wanted =
        options.id.empty() ? LocalName(node) == "Assertion" : AttributeOf(node, "ID") == options.id;
    if (!wanted) {
      continue;
    }
    if (found != nullptr) {
      throw XmlError("more than one element could be signed");
    }
    found = node;
  }
  if (found != nullptr) {
    return found;
  }
  if (!options.id.empty()) {
    throw XmlError("no element has the ID " + options.id);
  }
  return root;
}

xmlNode* AddSignatureTemplate(xmlNode* element, const SignOptions& options) {
  TemplateWriter writer;
  xmlNode* signedInfo = writer.Add(writer.Signature(), "SignedInfo");
  writer.Add(signedInfo, "CanonicalizationMethod", UriOf(options.canonicalization));
  writer.Add(signedInfo, "SignatureMethod", UriOf(options.signature));
  xmlNode* reference = writer.Add(signedInfo, "Reference");
  xmlNewProp(reference, AsXml("URI"), AsXml(ReferenceUriFor(element, options).c_str()));
  xmlNode* transforms = writer.Add(reference, "Transforms");
  writer.Add(transforms, "Transform", kEnveloped);
  AddInclusiveNamespaces(writer.Add(transforms, "Transform", UriOf(options.canonicalization)),
                         options);
  writer.Add(reference, "DigestMethod", UriOf(options.digest));
  writer.Add(reference, "DigestValue");
  writer.Add(writer.Signature(), "SignatureValue");
  AddKeyInfo(writer, options.keyInfo);

  const std::vector<xmlNode*> children = ChildElements(element);
  if (children.empty()) {
    return xmlAddChild(element, writer.Signature());
  }
  if (LocalName(children.front()) == "Issuer") {
    return xmlAddNextSibling(children.front(), writer.Signature());
  }
  return xmlAddPrevSibling(children.front(), writer.Signature());
}

}  // namespace DevSts
