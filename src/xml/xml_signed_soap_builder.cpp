#include "xml/xml_signed_soap_builder.h"

#include <string>
#include <utility>

#include <tarnik/text/string_util.h>
#include <tarnik/xml/security/signature.h>

#include "xml/envelope.h"
#include "xml/namespaces.h"
#include "xml/own_ids.h"

namespace SsoClient {

namespace {

using Tarnik::Ref;
using Tarnik::Xml::ElementNode;
using Tarnik::Xml::Security::Signature;

constexpr char kSignatureMethod[] = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
constexpr char kExclusiveC14n[] = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr char kSha256[] = "http://www.w3.org/2001/04/xmlenc#sha256";

// The wsu:Id of an element, which is given one if it has none.
std::string IdOf(ElementNode& element) {
  if (const auto id = element.FindAttribute(kWsuNamespace, "Id")) {
    return std::string(*id);
  }
  std::string id = std::string(element.LocalName()) + Tarnik::StringUtil::GenerateUuid();
  element.SetAttribute("xmlns:wsu", kWsuNamespace);
  element.SetAttribute("wsu:Id", id);
  return id;
}

void AddReference(Signature& signature, ElementNode& element) {
  signature.AddReference("#" + IdOf(element), kSha256)->AddTransform(kExclusiveC14n);
}

void SetKeyInfo(Signature& signature, const XMLBaseBuilder& keyInfo) {
  Ref<ElementNode> content;
  keyInfo.Build(content);
  signature.SetKeyInfo(content.get());
}

}  // namespace

XMLSignedSoapBuilder::XMLSignedSoapBuilder(std::shared_ptr<XMLBaseBuilder> header,
                                           std::shared_ptr<XMLBaseBuilder> body,
                                           Ref<const Tarnik::Crypto::PrivateKey> privateKey,
                                           std::shared_ptr<XMLBaseBuilder> keyInfo)
    : header_(std::move(header)),
      body_(std::move(body)),
      privateKey_(std::move(privateKey)),
      keyInfo_(std::move(keyInfo)) {}

void XMLSignedSoapBuilder::Build(Ref<ElementNode>& out) const {
  BuildEnvelope(header_, body_)->Build(out);
  RequireOwnIds(*out);
  ElementNode* body = out->FirstChildElement(kSoapNamespace, "Body");
  ElementNode* security = out->FirstChildElement(kSoapNamespace, "Header")
                              ->FirstChildElement(kWsseNamespace, "Security");
  ElementNode* timestamp = security->FirstChildElement(kWsuNamespace, "Timestamp");
  Ref<Signature> signature;
  Tarnik::Xml::Security::CreateBlankSignature(out.get(), kExclusiveC14n, kSignatureMethod, "ds",
                                              signature);
  AddReference(*signature, *body);
  AddReference(*signature, *timestamp);
  if (keyInfo_ != nullptr) {
    SetKeyInfo(*signature, *keyInfo_);
  }
  signature->Sign(privateKey_.get());
  signature->Element()->SetAttribute("Id", kProofSignatureId);
  security->AppendChild(signature->Element());
}

}  // namespace SsoClient
