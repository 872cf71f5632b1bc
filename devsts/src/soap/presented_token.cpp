#include "soap/presented_token.h"

#include <charconv>
#include <stdexcept>

#include "signing/certificates.h"
#include "soap/fault.h"
#include "xml/document.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

// Reads one assertion. Every fault names it.
class TokenReader {
 public:
  TokenReader(xmlNode* assertion, const std::string& place)
      : assertion_(assertion), place_(place) {}

  PresentedToken Read() const {
    PresentedToken token;
    token.id = AttributeOf(assertion_, "ID");
    token.subject = ContentOf(Child(Subject(), kSamlNamespace, "NameID"));
    xmlNode* conditions = Child(assertion_, kSamlNamespace, "Conditions");
    token.notBefore = TimeAttribute(conditions, "NotBefore");
    token.notOnOrAfter = TimeAttribute(conditions, "NotOnOrAfter");
    token.delegates = DelegatesOf(conditions);
    token.proxyCount = ProxyCountOf(conditions);
    token.renewal = RenewalOf(conditions);
    if (IsHolderOfKey()) {
      token.holderCertificatePem = HolderCertificate();
    }
    return token;
  }

  bool IsHolderOfKey() const { return AttributeOf(Confirmation(), "Method") == kHolderOfKeyMethod; }

  std::string HolderCertificate() const {
    const xmlNode* data = Child(Confirmation(), kSamlNamespace, "SubjectConfirmationData");
    const xmlNode* keyInfo = Child(data, kDsigNamespace, "KeyInfo");
    const xmlNode* x509Data = Child(keyInfo, kDsigNamespace, "X509Data");
    try {
      return CertificateFromBase64(ContentOf(Child(x509Data, kDsigNamespace, "X509Certificate")));
    } catch (const Fault&) {
      throw;
    } catch (const std::runtime_error& error) {
      ThrowInvalidSecurityToken(place_ + " contains no certificate: " + error.what());
    }
  }

 private:
  xmlNode* Child(const xmlNode* parent, const char* namespaceUri, const char* localName) const {
    xmlNode* child = FirstChild(parent, namespaceUri, localName);
    if (child == nullptr) {
      ThrowInvalidSecurityToken(place_ + " has no " + localName);
    }
    return child;
  }

  xmlNode* Subject() const { return Child(assertion_, kSamlNamespace, "Subject"); }
  xmlNode* Confirmation() const { return Child(Subject(), kSamlNamespace, "SubjectConfirmation"); }

  Time TimeAttribute(const xmlNode* element, const char* name) const {
    const std::optional<Time> time = TimeFromText(AttributeOf(element, name));
    if (!time) {
      ThrowInvalidSecurityToken(place_ + "'s " + name + " is not a time");
    }
    return *time;
  }

  unsigned CountOf(const xmlNode* element) const {
    const std::string text = AttributeOf(element, "Count");
    unsigned count = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), count);
    if (error != std::errc() || end != text.data() + text.size()) {
      ThrowInvalidSecurityToken(place_ + "'s Count is not a number: " + text);
    }
    return count;
  }

  std::vector<DelegateEntry> DelegatesOf(xmlNode* conditions) const {
    std::vector<DelegateEntry> delegates;
    for (const xmlNode* node : FindElements(conditions, kDelegationNamespace, "Delegate")) {
      delegates.push_back({ContentOf(Child(node, kSamlNamespace, "NameID")),
                           TimeAttribute(node, "DelegationInstant")});
    }
    return delegates;
  }

  unsigned ProxyCountOf(xmlNode* conditions) const {
    const std::vector<xmlNode*> proxies =
        FindElements(conditions, kSamlNamespace, "ProxyRestriction");
    return proxies.empty() ? 0 : CountOf(proxies.front());
  }

  // The only Condition with a Count is the renew restriction.
  std::optional<RenewRestriction> RenewalOf(xmlNode* conditions) const {
    for (const xmlNode* node : FindElements(conditions, kSamlNamespace, "Condition")) {
      if (HasAttribute(node, "Count")) {
        return RenewRestriction{CountOf(node), AttributeOf(node, "Postdatable") == "true",
                                AttributeOf(node, "RenewExpired") == "true"};
      }
    }
    return std::nullopt;
  }

  xmlNode* assertion_;
  const std::string& place_;
};

}  // namespace

PresentedToken ReadPresentedToken(xmlNode* assertion, const std::string& place) {
  return TokenReader(assertion, place).Read();
}

std::string HolderCertificateOf(xmlNode* assertion, const std::string& place) {
  const TokenReader reader(assertion, place);
  if (!reader.IsHolderOfKey()) {
    ThrowInvalidSecurityToken(place + " is not a holder-of-key token");
  }
  return reader.HolderCertificate();
}

}  // namespace DevSts
