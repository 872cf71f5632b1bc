#include "soap/assertion_writer.h"

#include "signing/certificates.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

constexpr char kUpnFormat[] = "http://schemas.xmlsoap.org/claims/UPN";
constexpr char kEntityFormat[] = "urn:oasis:names:tc:SAML:2.0:nameid-format:entity";
constexpr char kBearerMethod[] = "urn:oasis:names:tc:SAML:2.0:cm:bearer";
constexpr char kUriNameFormat[] = "urn:oasis:names:tc:SAML:2.0:attrname-format:uri";
constexpr char kClaims[] = "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/";

class AssertionWriter {
 public:
  AssertionWriter(const TokenContent& content, const AssertionOptions& shape,
                  const std::string& vendorHost, const std::string& solutionHost)
      : content_(content),
        shape_(shape),
        vendorHost_(vendorHost),
        solutionHost_(solutionHost),
        xml_(shape.indent) {}

  std::string Write() {
    XmlWriter::Attributes attributes;
    if (!shape_.inheritNamespaces) {
      attributes = AssertionNamespaces(vendorHost_);
    }
    attributes.insert(
        attributes.end(),
        {{"ID", content_.id}, {"IssueInstant", TimeToText(content_.issued)}, {"Version", "2.0"}});
    xml_.Open("saml2:Assertion", attributes);
    WriteIssuer();
    WriteSubject();
    WriteConditions();
    WriteAdvice();
    WriteAuthnStatement();
    WriteAttributeStatement();
    xml_.Close();
    return xml_.Text();
  }

 private:
  void WriteIssuer() {
    if (shape_.issuerFormat) {
      xml_.Leaf("saml2:Issuer", {{"Format", kEntityFormat}}, content_.issuer);
      return;
    }
    xml_.Leaf("saml2:Issuer", content_.issuer);
  }

  void WriteNameId(const std::string& name) {
    xml_.Leaf("saml2:NameID", {{"Format", kUpnFormat}}, name);
  }

  void WriteSubject() {
    xml_.Open("saml2:Subject");
    WriteNameId(content_.subject);
    xml_.Open("saml2:SubjectConfirmation", {{"Method", Method()}});
    if (!content_.delegates.empty()) {
      WriteNameId(content_.delegates.back().name);
    }
    WriteSubjectConfirmationData();
    xml_.Close();
    xml_.Close();
  }

  const char* Method() const {
    return content_.holderCertificatePem ? kHolderOfKeyMethod : kBearerMethod;
  }

  // SAML 2.0 Profiles, section 3.1: the holder's key.
  void WriteSubjectConfirmationData() {
    XmlWriter::Attributes attributes{{"NotOnOrAfter", TimeToText(content_.notOnOrAfter)}};
    if (!content_.holderCertificatePem) {
      xml_.Leaf("saml2:SubjectConfirmationData", attributes, "");
      return;
    }
    attributes.push_back({"xsi:type", "saml2:KeyInfoConfirmationDataType"});
    xml_.Open("saml2:SubjectConfirmationData", attributes);
    xml_.Open("ds:KeyInfo", {{"xmlns:ds", kDsigNamespace}});
    xml_.Open("ds:X509Data");
    xml_.Leaf("ds:X509Certificate", CertificateToBase64(*content_.holderCertificatePem));
    xml_.Close();
    xml_.Close();
    xml_.Close();
  }

  void WriteConditions() {
    xml_.Open("saml2:Conditions", {{"NotBefore", TimeToText(content_.notBefore)},
                                   {"NotOnOrAfter", TimeToText(content_.notOnOrAfter)}});
    if (content_.proxyCount) {
      xml_.Leaf("saml2:ProxyRestriction", {{"Count", std::to_string(*content_.proxyCount)}}, "");
    }
    WriteRenewal();
    WriteDelegates();
    WriteAudiences();
    xml_.Close();
  }

  void WriteRenewal() {
    if (!content_.renewal) {
      return;
    }
    xml_.Leaf("saml2:Condition",
              {{"Count", std::to_string(content_.renewal->count)},
               {"Postdatable", content_.renewal->postdatable ? "true" : "false"},
               {"RenewExpired", content_.renewal->renewExpired ? "true" : "false"},
               {"xsi:type", "rsa:RenewRestrictionType"}},
              "");
  }

  // SAML 2.0 Condition for Delegation Restriction, section 2.
  void WriteDelegates() {
    if (content_.delegates.empty()) {
      return;
    }
    xml_.Open("saml2:Condition", {{"xsi:type", "del:DelegationRestrictionType"}});
    for (const DelegateEntry& delegate : content_.delegates) {
      xml_.Open("del:Delegate", {{"DelegationInstant", TimeToText(delegate.instant)}});
      WriteNameId(delegate.name);
      xml_.Close();
    }
    xml_.Close();
  }

  void WriteAudiences() {
    if (content_.audiences.empty()) {
      return;
    }
    xml_.Open("saml2:AudienceRestriction");
    for (const std::string& audience : content_.audiences) {
      xml_.Leaf("saml2:Audience", audience);
    }
    xml_.Close();
  }

  void WriteAdvice() {
    if (content_.advice.empty()) {
      return;
    }
    xml_.Open("saml2:Advice");
    for (const AdviceRequest& advice : content_.advice) {
      xml_.Open("rsa:RSAAdvice", {{"AdviceSource", advice.source}});
      for (const auto& [name, values] : advice.attributes) {
        WriteAttribute(name, "", values);
      }
      xml_.Close();
    }
    xml_.Close();
  }

  void WriteAuthnStatement() {
    xml_.Open("saml2:AuthnStatement", {{"AuthnInstant", TimeToText(content_.authenticated)}});
    xml_.Open("saml2:AuthnContext");
    xml_.Leaf("saml2:AuthnContextClassRef", content_.authenticationClass);
    xml_.Close();
    xml_.Close();
  }

  void WriteAttributeStatement() {
    xml_.Open("saml2:AttributeStatement");
    if (!content_.user.groups.empty()) {
      WriteAttribute("http://" + vendorHost_ + "/schemas/attr-names/2009/01/GroupIdentity",
                     "Groups", content_.user.groups);
    }
    const std::string solutionName =
        "http://" + solutionHost_ + "/schemas/attr-names/2011/07/isSolution";
    WriteAttribute(solutionName, "Solution", {content_.user.isSolution ? "true" : "false"});
    WriteName("givenname", "givenName", content_.user.givenName);
    WriteName("surname", "surname", content_.user.surname);
    xml_.Close();
  }

  void WriteName(const std::string& claim, const std::string& friendlyName,
                 const std::string& value) {
    if (!value.empty()) {
      WriteAttribute(kClaims + claim, friendlyName, {value});
    }
  }

  void WriteAttribute(const std::string& name, const std::string& friendlyName,
                      const std::vector<std::string>& values) {
    XmlWriter::Attributes attributes{{"Name", name}};
    if (!friendlyName.empty()) {
      attributes.insert(attributes.begin(), {"FriendlyName", friendlyName});
      attributes.push_back({"NameFormat", kUriNameFormat});
    }
    if (values.empty()) {
      xml_.Leaf("saml2:Attribute", attributes, "");
      return;
    }
    XmlWriter::Attributes type;
    if (shape_.attributeValueTypes) {
      type.push_back({"xsi:type", "xs:string"});
    }
    xml_.Open("saml2:Attribute", attributes);
    for (const std::string& value : values) {
      xml_.Leaf("saml2:AttributeValue", type, value);
    }
    xml_.Close();
  }

  const TokenContent& content_;
  const AssertionOptions& shape_;
  const std::string& vendorHost_;
  const std::string& solutionHost_;
  XmlWriter xml_;
};

}  // namespace

XmlWriter::Attributes AssertionNamespaces(const std::string& vendorHost) {
  return {{"xmlns:saml2", kSamlNamespace},
          {"xmlns:del", kDelegationNamespace},
          {"xmlns:rsa", "http://" + vendorHost + "/names/2009/12/std-ext/SAML2.0"},
          {"xmlns:xs", kSchemaNamespace},
          {"xmlns:xsi", kSchemaInstanceNamespace}};
}

std::string WriteAssertion(const TokenContent& content, const AssertionOptions& shape,
                           const std::string& vendorHost, const std::string& solutionHost) {
  return AssertionWriter(content, shape, vendorHost, solutionHost).Write();
}

}  // namespace DevSts
