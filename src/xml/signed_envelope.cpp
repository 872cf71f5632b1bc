#include "xml/signed_envelope.h"

#include <cstddef>
#include <string>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/security/ids.h>
#include <tarnik/xml/security/signature.h>

#include "support/namespaces.h"
#include "xml/security_header.h"
#include "xml/ws_trust_names.h"

namespace SsoClient {

namespace {

using Tarnik::Ref;
using Tarnik::Xml::ElementNode;
using Tarnik::Xml::Security::Signature;

constexpr char kSignatureMethod[] = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
constexpr char kExclusiveC14n[] = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr char kSha256[] = "http://www.w3.org/2001/04/xmlenc#sha256";

bool HasId(const ElementNode& element, std::string_view id) {
  for (std::size_t i = 0; i < element.AttributeCount(); ++i) {
    if (Tarnik::Xml::Security::PossibleId(element.AttributeAt(i)) == id) {
      return true;
    }
  }
  return false;
}

[[noreturn]] void ThrowReservedId(const char* id) {
  throw Tarnik::InvalidArgumentException(std::string("A token in the request carries the id '") +
                                         id + "', which is the request's own");
}

// The wsu:Id of `element`, generated if it has none.
std::string EnsureId(ElementNode& element) {
  if (const auto id = element.FindAttribute(kWsuNamespace, "Id")) {
    return std::string(*id);
  }
  std::string id = std::string(element.LocalName()) + Tarnik::StringUtil::GenerateUuid();
  element.SetAttribute("xmlns:wsu", kWsuNamespace);
  element.SetAttribute("wsu:Id", id);
  return id;
}

void AddReference(Signature& signature, ElementNode& element) {
  signature.AddReference("#" + EnsureId(element), kSha256)->AddTransform(kExclusiveC14n);
}

void SetKeyInfo(Signature& signature, const XMLBaseBuilder& keyInfo) {
  Ref<ElementNode> content;
  keyInfo.Build(content);
  signature.SetKeyInfo(content.get());
}

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildEnvelope(const std::shared_ptr<XMLBaseBuilder>& header,
                                                   const std::shared_ptr<XMLBaseBuilder>& body) {
  auto headerElement = MakeCompositeBuilder("soapenv", "Header");
  headerElement->Add(header);
  auto bodyElement =
      MakeCompositeBuilder("soapenv", "Body", {{"xmlns:wst", kWsTrust13.namespaceUri}});
  bodyElement->Add(body);
  auto envelope = MakeCompositeBuilder("soapenv", "Envelope", {{"xmlns:soapenv", kSoapNamespace}});
  envelope->Add(headerElement).Add(bodyElement);
  return envelope;
}

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
  RejectReservedIds(*out);
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

std::shared_ptr<XMLSignedSoapBuilder> MakeSignedSoapBuilderForToken(
    const std::shared_ptr<XMLBaseBuilder>& header, const std::shared_ptr<XMLBaseBuilder>& body,
    const Ref<const Tarnik::Crypto::PrivateKey>& privateKey, std::string_view assertionId) {
  return std::make_shared<XMLSignedSoapBuilder>(header, body, privateKey,
                                                BuildSamlTokenReference(assertionId));
}

std::shared_ptr<XMLSignedSoapBuilder> MakeSignedSoapBuilderForCertificate(
    const std::shared_ptr<XMLBaseBuilder>& header, const std::shared_ptr<XMLBaseBuilder>& body,
    const Ref<const Tarnik::Crypto::PrivateKey>& privateKey,
    const Tarnik::Crypto::Certificate& certificate) {
  auto headerWithCertificate = std::make_shared<XMLCompositeBuilder>(header);
  headerWithCertificate->Add(BuildBinarySecurityToken(kCertificateId, certificate));
  return std::make_shared<XMLSignedSoapBuilder>(headerWithCertificate, body, privateKey,
                                                BuildCertificateReference());
}

void RejectReservedIds(const ElementNode& envelope) {
  int certificates = 0;
  for (const ElementNode* element = &envelope; element != nullptr;
       element = element->NextElement(&envelope)) {
    if (HasId(*element, kProofSignatureId)) {
      ThrowReservedId(kProofSignatureId);
    }
    if (HasId(*element, kCertificateId) && ++certificates > 1) {
      ThrowReservedId(kCertificateId);
    }
  }
}

}  // namespace SsoClient
