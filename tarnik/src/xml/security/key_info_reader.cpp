#include "xml/security/key_info_reader.h"

#include <algorithm>
#include <array>
#include <utility>

#include <tarnik/xml/security/xml_security_exception.h>

#include "support/quote.h"
#include "xml/security/content_reader.h"

namespace Tarnik::Xml::Security {
namespace {

[[noreturn]] void Refuse(const ElementNode* parent, const ElementNode* child) {
  throw SignatureSyntaxException("Element " + Quote(parent->QualifiedNameText()) +
                                 " may not hold " + Quote(child->QualifiedNameText()) + ".");
}

void RequireContent(const ElementNode* element, const ContentReader& content) {
  if (content.Peek() == nullptr) {
    throw SignatureSyntaxException("Element " + Quote(element->QualifiedNameText()) + " is empty.");
  }
}

std::string PlainTextOf(const ElementNode* element) {
  ExpectAttributes(element, {});
  return TextOf(element);
}

std::vector<unsigned char> PlainBytesOf(const ElementNode* element) {
  ExpectAttributes(element, {});
  return BytesOf(element);
}

KeyInfo::IssuerSerial ReadIssuerSerial(const ElementNode* element) {
  ExpectAttributes(element, {});
  ContentReader content(element);
  KeyInfo::IssuerSerial issuerSerial;
  issuerSerial.issuerName = PlainTextOf(content.Take("X509IssuerName"));
  issuerSerial.serialNumber = PlainTextOf(content.Take("X509SerialNumber"));
  content.ExpectEnd();
  return issuerSerial;
}

// XML Signature 1.1, section 4.5.4.
void ReadX509Data(const ElementNode* element, KeyInfo& keyInfo) {
  ExpectAttributes(element, {});
  ContentReader content(element);
  RequireContent(element, content);
  while (content.Peek() != nullptr) {
    if (const ElementNode* certificate = content.TakeIf("X509Certificate")) {
      keyInfo.certificates.push_back(PlainBytesOf(certificate));
    } else if (const ElementNode* issuerSerial = content.TakeIf("X509IssuerSerial")) {
      keyInfo.issuerSerials.push_back(ReadIssuerSerial(issuerSerial));
    } else if (const ElementNode* identifier = content.TakeIf("X509SKI")) {
      keyInfo.subjectKeyIdentifiers.push_back(PlainBytesOf(identifier));
    } else if (const ElementNode* subject = content.TakeIf("X509SubjectName")) {
      keyInfo.subjectNames.push_back(PlainTextOf(subject));
    } else if (content.IsAt("X509CRL") || content.Peek()->NamespaceUri() != kDsNamespace) {
      content.TakeAny();
    } else {
      Refuse(element, content.Peek());
    }
  }
}

// Rejected, since a message must not make the reader fetch a key.
bool RefersToKeyElsewhere(const ElementNode* element) {
  return element->NamespaceUri() == kDs11Namespace && element->LocalName() == "KeyInfoReference";
}

bool IsSkipped(const ElementNode* element) {
  static constexpr std::array<std::string_view, 4> kKinds{"KeyValue", "PGPData", "SPKIData",
                                                          "MgmtData"};
  if (element->NamespaceUri() != kDsNamespace) {
    return !RefersToKeyElsewhere(element);
  }
  return std::find(kKinds.begin(), kKinds.end(), element->LocalName()) != kKinds.end();
}

}  // namespace

KeyInfo ReadKeyInfo(const ElementNode* element) {
  ExpectAttributes(element, {"Id"});
  KeyInfo keyInfo;
  keyInfo.element = element;
  ContentReader content(element);
  RequireContent(element, content);
  while (content.Peek() != nullptr) {
    if (const ElementNode* data = content.TakeIf("X509Data")) {
      ReadX509Data(data, keyInfo);
    } else if (const ElementNode* name = content.TakeIf("KeyName")) {
      keyInfo.keyNames.push_back(PlainTextOf(name));
    } else if (IsSkipped(content.Peek())) {
      content.TakeAny();
    } else {
      Refuse(element, content.Peek());
    }
  }
  return keyInfo;
}

}  // namespace Tarnik::Xml::Security
