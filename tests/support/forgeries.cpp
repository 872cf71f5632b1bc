#include "support/forgeries.h"

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "support/assertion_text.h"

namespace SsoClient::Testing {
namespace {

AssertionText ForgedText(ForgedId id) {
  AssertionText text;
  text.subject = Replaced(text.subject, "alice@", "admin@");
  if (id == ForgedId::kNew) {
    text.attributes = Replaced(text.attributes, "_a1", "_b2");
  }
  if (id == ForgedId::kNone) {
    text.attributes = Replaced(text.attributes, "ID=\"_a1\" ", "");
  }
  return text;
}

// `xml` with `content` before the last `endTag`, or "" if it has no such tag.
std::string AtEndOf(const std::string& xml, std::string_view endTag, const std::string& content) {
  const std::size_t at = xml.rfind(endTag);
  return at == std::string::npos ? "" : xml.substr(0, at) + content + xml.substr(at);
}

// A signature made by the independent implementation has no prefix.
std::string AtEndOfSignature(const std::string& xml, const std::string& content) {
  const std::string prefixed = AtEndOf(xml, "</ds:Signature>", content);
  return prefixed.empty() ? AtEndOf(xml, "</Signature>", content) : prefixed;
}

std::string InDs(const std::string& localName, const std::string& content) {
  return "<ds:" + localName + ">" + content + "</ds:" + localName + ">";
}

// In the KeyInfo of the signature, which is added if it is missing.
std::string InKeyInfo(const std::string& xml, const std::string& content) {
  for (const char* endTag : {"</ds:KeyInfo>", "</KeyInfo>"}) {
    const std::string result = AtEndOf(xml, endTag, content);
    if (!result.empty()) {
      return result;
    }
  }
  return AtEndOfSignature(xml, InDs("KeyInfo", content));
}

std::string InX509Data(const std::string& xml, const std::string& content) {
  const std::string prefixed = AtEndOf(xml, "</ds:X509Data>", content);
  return prefixed.empty() ? AtEndOf(xml, "</X509Data>", content) : prefixed;
}

std::string InSoap(const std::string& header, const std::string& body) {
  return "<e:Envelope xmlns:e=\"http://schemas.xmlsoap.org/soap/envelope/\"><e:Header>" + header +
         "</e:Header><e:Body>" + body + "</e:Body></e:Envelope>";
}

}  // namespace

const std::vector<Place>& AllPlaces() {
  static const std::vector<Place> places = [] {
    std::vector<Place> all;
    for (int place = 0; place <= static_cast<int>(Place::kForgedInSoapHeader); ++place) {
      all.push_back(static_cast<Place>(place));
    }
    return all;
  }();
  return places;
}

const std::vector<ForgedId>& AllForgedIds() {
  static const std::vector<ForgedId> ids{ForgedId::kSame, ForgedId::kNew, ForgedId::kNone};
  return ids;
}

const std::vector<ForgedSignature>& AllForgedSignatures() {
  static const std::vector<ForgedSignature> signatures{
      ForgedSignature::kOriginal, ForgedSignature::kStranger, ForgedSignature::kUnsigned,
      ForgedSignature::kMadeUp};
  return signatures;
}

std::string OriginalAssertion() {
  static const std::string original = AssertionText().ToSignedXml(TrustedCredential());
  return original;
}

std::string SignatureOf(const std::string& assertion) {
  for (const char* name : {"ds:Signature", "Signature"}) {
    const std::size_t begin = assertion.find(std::string("<") + name);
    const std::string end = std::string("</") + name + ">";
    if (begin != std::string::npos) {
      return assertion.substr(begin, assertion.find(end) + end.size() - begin);
    }
  }
  return "";
}

std::string ForgedAssertion(ForgedId id, ForgedSignature signature, const std::string& original) {
  AssertionText text = ForgedText(id);
  switch (signature) {
    case ForgedSignature::kOriginal:
      text.signature = SignatureOf(original);
      return text.ToXml();
    case ForgedSignature::kStranger:
      return text.ToSignedXml(StrangerCredential());
    case ForgedSignature::kUnsigned:
      text.signature.clear();
      return text.ToXml();
    case ForgedSignature::kMadeUp:
      text.signature = MadeUpSignature(id == ForgedId::kNew ? "#_b2" : "#_a1");
      return text.ToXml();
  }
  return "";
}

std::string Arranged(Place place, const std::string& forged, const std::string& original) {
  switch (place) {
    case Place::kBefore:
      return "<r>" + forged + original + "</r>";
    case Place::kAfter:
      return "<r>" + original + forged + "</r>";
    case Place::kParentInObject:
      return AtEndOfSignature(forged, InDs("Object", original));
    case Place::kParentInObjectWithoutSignature:
      return AtEndOfSignature(forged,
                              InDs("Object", Replaced(original, SignatureOf(original), "")));
    case Place::kParentInKeyInfo:
      return InKeyInfo(forged, original);
    case Place::kParentInAdvice:
      return AtEndOf(forged, "</saml2:Advice>", original);
    case Place::kParentInAttributeValue:
      return AtEndOf(forged, "</saml2:AttributeValue>", original);
    case Place::kParentAtEnd:
      return AtEndOf(forged, "</saml2:Assertion>", original);
    case Place::kChildInObject:
      return AtEndOfSignature(original, InDs("Object", forged));
    case Place::kChildInKeyInfo:
      return InKeyInfo(original, forged);
    case Place::kChildInX509Data:
      return InX509Data(original, forged);
    case Place::kChildInAdvice:
      return AtEndOf(original, "</saml2:Advice>", forged);
    case Place::kChildInAttributeValue:
      return AtEndOf(original, "</saml2:AttributeValue>", forged);
    case Place::kChildAtEnd:
      return AtEndOf(original, "</saml2:Assertion>", forged);
    case Place::kOriginalInSoapHeader:
      return InSoap(original, forged);
    case Place::kForgedInSoapHeader:
      return InSoap(forged, original);
  }
  return "";
}

}  // namespace SsoClient::Testing
