// The input makes a document and the template of its signature, which xmlsec1 and OpenSSL fill in,
// and then edits the text. Every signature that is accepted is valid for xmlsec1 too, with the key
// of a trusted certificate. xmlsec1 digests the element that the reference names, and the signature
// uses only the algorithms of the closed list. A signature of a supported form that nobody has
// edited is accepted exactly when its hints select the key of its signer.
#include <algorithm>
#include <array>
#include <string>
#include <vector>

#include <fuzzer/FuzzedDataProvider.h>

#include <tarnik/core/exception.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "fixed_random.h"
#include "input.h"
#include "named_signers.h"
#include "value_model.h"
#include "xml_edits.h"
#include "xml_input.h"
#include "xmlsec.h"

namespace {

using namespace Tarnik;

constexpr char kDsig[] = "http://www.w3.org/2000/09/xmldsig#";
constexpr char kEnveloped[] = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";

// Each list begins with what is supported.
constexpr std::size_t kSupportedMethods = 9;
constexpr std::array kMethods{"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256",
                              "http://www.w3.org/2001/04/xmldsig-more#rsa-sha384",
                              "http://www.w3.org/2001/04/xmldsig-more#rsa-sha512",
                              "http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1",
                              "http://www.w3.org/2007/05/xmldsig-more#sha384-rsa-MGF1",
                              "http://www.w3.org/2007/05/xmldsig-more#sha512-rsa-MGF1",
                              "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256",
                              "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha384",
                              "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512",
                              "http://www.w3.org/2000/09/xmldsig#rsa-sha1",
                              "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha1",
                              "http://www.w3.org/2007/05/xmldsig-more#sha1-rsa-MGF1"};
constexpr std::size_t kSupportedForms = 4;
constexpr std::array kForms{"http://www.w3.org/2001/10/xml-exc-c14n#",
                            "http://www.w3.org/2001/10/xml-exc-c14n#WithComments",
                            "http://www.w3.org/TR/2001/REC-xml-c14n-20010315",
                            "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#WithComments",
                            "http://www.w3.org/2006/12/xml-c14n11",
                            "http://www.w3.org/2000/09/xmldsig#base64",
                            "http://www.w3.org/2000/09/xmldsig#enveloped-signature"};
constexpr std::size_t kSupportedDigests = 3;
constexpr std::array kDigests{
    "http://www.w3.org/2001/04/xmlenc#sha256", "http://www.w3.org/2001/04/xmldsig-more#sha384",
    "http://www.w3.org/2001/04/xmlenc#sha512", "http://www.w3.org/2000/09/xmldsig#sha1",
    "http://www.w3.org/2001/04/xmldsig-more#md5"};
// The last supported one is the element that contains the signature.
constexpr std::size_t kSupportedTargets = 6;
constexpr std::array kTargets{"",    "#_root", "#_a", "#_w",          "#_d",
                              "#_c", "#_none", "#",   "#xpointer(/)", "#xpointer(id('_a'))"};

bool Encloses(const std::string& target) {
  return target.empty() || target == "#_root" || target == "#_c";
}

template <class List>
bool IsAmong(const List& list, std::size_t supported, const std::string& text) {
  return std::find(list.begin(), list.begin() + supported, text) != list.begin() + supported;
}

/// Makes documents with a template, and knows whether the signature is of a supported form.
class Maker {
 public:
  explicit Maker(FuzzedDataProvider& input) : input_(input) {}

  std::string Make(bool isEc) {
    const std::string method = Method(isEc);
    isSupported_ = isSupported_ && (method.find("ecdsa") != std::string::npos) == isEc;
    std::string info = "<ds:CanonicalizationMethod Algorithm=\"" + Pick(kForms, kSupportedForms) +
                       "\"/><ds:SignatureMethod Algorithm=\"" + method + "\"/>";
    const int references = input_.ConsumeIntegralInRange(1, 3);
    for (int i = 0; i < references; ++i) {
      info += Reference();
    }
    const std::string signature = std::string("<ds:Signature xmlns:ds=\"") + kDsig +
                                  "\"><ds:SignedInfo>" + info +
                                  "</ds:SignedInfo><ds:SignatureValue/></ds:Signature>";
    return "<r:root xmlns:r=\"urn:r\" xmlns:unused=\"urn:u\" ID=\"_root\" xml:lang=\"en\">\n"
           "<p/><q/><s/><a Id=\"_a\" b=\"2\" a=\"1&#10;\">x<!-- a remark --> &amp; y&#13;</a>"
           "<w xmlns:u=\"http://docs.oasis-open.org/wss/2004/01/"
           "oasis-200401-wss-wssecurity-utility-1.0.xsd\" u:Id=\"_w\"><v xmlns=\"urn:v\"/></w>"
           "<c id=\"_c\"><r:before/>" +
           signature +
           "<after/></c><d xml:id=\"_d\"><?pi data?><e xmlns:e=\"urn:e\" e:f=\"\"/></d>" +
           "</r:root>";
  }

  bool IsSupported() const { return isSupported_; }

 private:
  // Mostly a supported one.
  template <class List>
  std::string Pick(const List& list, std::size_t supported) {
    const auto choice = input_.ConsumeIntegralInRange<std::size_t>(0, 16 * list.size() - 1);
    const std::size_t index = choice < list.size() ? choice : choice % supported;
    isSupported_ = isSupported_ && index < supported;
    return list[index];
  }

  // Mostly one for the type of the key.
  std::string Method(bool isEc) {
    constexpr std::size_t kRsaMethods = 6;
    if (input_.ConsumeIntegralInRange(0, 7) == 7) {
      return Pick(kMethods, kSupportedMethods);
    }
    const auto choice = input_.ConsumeIntegralInRange<std::size_t>(0, kRsaMethods - 1);
    return kMethods[isEc ? kRsaMethods + choice % 3 : choice];
  }

  std::string Form() {
    const std::string form = Pick(kForms, kSupportedForms);
    return form.find("exc-c14n") == std::string::npos ? "<ds:Transform Algorithm=\"" + form + "\"/>"
                                                      : Transform(form);
  }

  // Some signers also write InclusiveNamespaces where they have no effect.
  std::string Transform(const std::string& algorithm) {
    if (input_.ConsumeBool()) {
      return "<ds:Transform Algorithm=\"" + algorithm + "\"/>";
    }
    return "<ds:Transform Algorithm=\"" + algorithm +
           "\"><i:InclusiveNamespaces xmlns:i=\"http://www.w3.org/2001/10/xml-exc-c14n#\" "
           "PrefixList=\"unused #default r\"/></ds:Transform>";
  }

  std::string Reference() {
    const std::string target = Pick(kTargets, kSupportedTargets);
    std::string transforms;
    const bool isEnveloped =
        input_.ConsumeIntegralInRange(0, 7) == 0 ? !Encloses(target) : Encloses(target);
    isSupported_ = isSupported_ && isEnveloped == Encloses(target);
    if (isEnveloped) {
      transforms = Transform(kEnveloped);
    }
    for (int forms = input_.ConsumeIntegralInRange(0, 4) * 2 / 5; forms > 0; --forms) {
      transforms += Form();
    }
    if (!transforms.empty()) {
      transforms = "<ds:Transforms>" + transforms + "</ds:Transforms>";
    }
    return "<ds:Reference URI=\"" + target + "\">" + transforms + "<ds:DigestMethod Algorithm=\"" +
           Pick(kDigests, kSupportedDigests) + "\"/><ds:DigestValue/></ds:Reference>";
  }

  FuzzedDataProvider& input_;
  bool isSupported_ = true;
};

const Xml::ElementNode* FirstSignature(const Xml::Document& document) {
  for (const Xml::ElementNode* element = document.RootElement(); element != nullptr;
       element = element->NextElement(nullptr)) {
    if (element->LocalName() == "Signature" && element->NamespaceUri() == kDsig) {
      return element;
    }
  }
  return nullptr;
}

/// The URIs of the references of a valid signature; nothing for any other.
std::optional<std::vector<std::string>> AcceptedReferences(const std::string& xml,
                                                           const Fuzz::Trust& trust) {
  const auto document = Fuzz::ParseXml(xml);
  const Xml::ElementNode* element = document == nullptr ? nullptr : FirstSignature(*document);
  if (element == nullptr || Fuzz::HasOddNamespace(*document)) {
    return std::nullopt;
  }
  const auto resolver = Fuzz::ResolverFor(trust);
  std::vector<std::string> uris;
  try {
    const auto signature =
        Xml::Security::CreateSignatureFromDom(const_cast<Xml::ElementNode*>(element));
    if (!signature->Verify(resolver.get())) {
      return std::nullopt;
    }
    for (const auto& reference : signature->References()) {
      uris.push_back(reference.uri);
    }
  } catch (const Xml::Security::XmlSecurityException&) {
    return std::nullopt;
  }
  return uris;
}

// The first tag of what was digested has the id.
bool Covers(const Fuzz::ReadReference& reference) {
  if (reference.uri.empty()) {
    return true;
  }
  const std::string tag = reference.octets.substr(0, reference.octets.find('>'));
  return tag.find("=\"" + reference.uri.substr(1) + "\"") != std::string::npos;
}

void CheckAccepted(const std::vector<std::string>& uris, const Fuzz::ReadSignature& second) {
  Fuzz::Require(second.isValid && second.references.size() == uris.size());
  for (std::size_t i = 0; i < uris.size(); ++i) {
    Fuzz::Require(second.references[i].uri == uris[i] && Covers(second.references[i]));
  }
  Fuzz::Require(IsAmong(kMethods, kSupportedMethods, second.signatureMethod) &&
                IsAmong(kForms, kSupportedForms, second.canonicalizationMethod));
  for (const std::string& digest : second.digestMethods) {
    Fuzz::Require(IsAmong(kDigests, kSupportedDigests, digest));
  }
  for (const std::string& transform : second.transforms) {
    Fuzz::Require(transform == kEnveloped || IsAmong(kForms, kSupportedForms, transform));
  }
}

// Mostly all signers but the strangers, so that hints have to select one.
Fuzz::Trust TrustFor(std::size_t signer, FuzzedDataProvider& input) {
  Fuzz::Trust trust;
  trust.isByIssuer = input.ConsumeIntegralInRange(0, 5) == 5;
  if (input.ConsumeIntegralInRange(0, 3) == 3 && signer < Fuzz::kTrustedSigners) {
    trust.signers = {signer};
    return trust;
  }
  for (std::size_t i = 0; i < Fuzz::kTrustedSigners; ++i) {
    trust.signers.push_back(i);
  }
  if (input.ConsumeBool()) {
    std::reverse(trust.signers.begin(), trust.signers.end());
  }
  return trust;
}

// Mostly those that name the signer.
std::vector<Fuzz::Hint> HintsFor(std::size_t signer, FuzzedDataProvider& input) {
  std::vector<Fuzz::Hint> hints;
  for (int left = input.ConsumeIntegralInRange(0, 6) * 2 / 5; left > 0; --left) {
    const auto kind =
        static_cast<Fuzz::HintKind>(input.ConsumeIntegralInRange(0, Fuzz::kHintKinds - 1));
    const auto named = input.ConsumeIntegralInRange<std::size_t>(0, 2 * Fuzz::kSigners - 1);
    hints.push_back({kind, named < Fuzz::kSigners ? named : signer});
  }
  return hints;
}

// As signers do that omit leading zeros which both halves of an ECDSA value have.
void ShortenValue(std::string& xml) {
  const std::string tag = "<ds:SignatureValue>";
  const std::size_t begin = xml.find(tag) + tag.size();
  const std::size_t end = xml.find("</ds:SignatureValue>");
  auto value = Fuzz::BytesOf(xml.substr(begin, end - begin)).value();
  while (value[0] == 0 && value[value.size() / 2] == 0) {
    value.erase(value.begin() + static_cast<std::ptrdiff_t>(value.size() / 2));
    value.erase(value.begin());
  }
  xml.replace(begin, end - begin, Fuzz::Base64Of(value.data(), value.size()));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::vector<Fuzz::NamedSigner>& signers = Fuzz::NamedSigners();
  Fuzz::FixRandomness(size);
  FuzzedDataProvider input(data, size);
  const auto index = input.ConsumeIntegralInRange<std::size_t>(0, Fuzz::kSigners - 1);
  const Fuzz::NamedSigner& signer = signers[index];
  const Fuzz::Trust trust = TrustFor(index, input);
  const std::vector<Fuzz::Hint> hints = HintsFor(index, input);
  const bool isShort = signer.isEc && input.ConsumeBool();
  const int edits = std::max(input.ConsumeIntegralInRange(-1, 3), 0);
  Maker maker(input);
  const std::string text = maker.Make(signer.isEc);
  std::string xml = Fuzz::SignWithXmlSec(text, signer.key.get());
  const bool isTrusted = index < Fuzz::kStrongSigners;
  const bool isSelected = isTrusted && Fuzz::IsSelected(index, trust, hints);
  const bool isAcceptable = maker.IsSupported() && isSelected;
  if (xml.empty()) {
    Fuzz::Require(!isAcceptable);
    xml = text;
  } else if (isShort) {
    ShortenValue(xml);
  }
  xml.insert(xml.find("</ds:Signature>"), Fuzz::KeyInfoOf(hints));
  for (int i = 0; i < edits; ++i) {
    Fuzz::EditXml(xml, input);
  }
  const auto accepted = AcceptedReferences(xml, trust);
  if (accepted) {
    Fuzz::Require(isTrusted && (edits > 0 || isSelected));
    CheckAccepted(*accepted, Fuzz::VerifyWithXmlSec(xml, signer.key.get()));
  } else {
    Fuzz::Require(edits > 0 || !isAcceptable);
  }
  return 0;
}
