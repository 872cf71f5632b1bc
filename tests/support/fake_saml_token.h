#ifndef SSOCLIENT_TESTS_SUPPORT_FAKE_SAML_TOKEN_H
#define SSOCLIENT_TESTS_SUPPORT_FAKE_SAML_TOKEN_H

#include <set>
#include <string>
#include <utility>
#include <vector>

#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/security/signature.h>

namespace SsoClient::Testing {

/// A token with a text, a subject and the values that a test sets.
class FakeSamlToken final : public SamlToken {
 public:
  explicit FakeSamlToken(std::string xml, std::string subjectName = "alice")
      : xml_(std::move(xml)), subject_{std::move(subjectName), "CORP"} {}

  std::string id;
  TokenConfirmationType confirmationType = BEARER;

  const std::string& Id() const override { return id; }
  const Tarnik::System::DateTime& StartTime() const override { return time_; }
  const Tarnik::System::DateTime& ExpirationTime() const override { return time_; }
  Tarnik::System::DateTime ExpirationTimeWithTolerance() const override { return time_; }
  const PrincipalId& Subject() const override { return subject_; }
  bool IsRenewable() const override { return false; }
  bool IsDelegable() const override { return false; }
  bool IsSolution() const override { return false; }
  TokenConfirmationType ConfirmationType() const override { return confirmationType; }
  void GetSubjectNames(SubjectNames& names) const override { names = {}; }
  void GetGroups(std::vector<PrincipalId>& groups) const override { groups.clear(); }
  void GetDelegationChain(std::vector<Delegate>& chain) const override { chain.clear(); }
  void GetAudiences(std::set<std::string>& audiences) const override { audiences.clear(); }
  void GetAdvice(std::vector<Advice>& advice) const override { advice.clear(); }
  Tarnik::Ref<const Tarnik::Crypto::Certificate> HolderOfKeyCertificate() const override {
    return nullptr;
  }
  const std::string& Issuer() const override { return empty_; }
  Tarnik::Ref<Tarnik::Xml::Security::Signature> GetSignature() const override { return nullptr; }
  const std::string& Xml() const override { return xml_; }

 private:
  std::string xml_;
  std::string empty_;
  PrincipalId subject_;
  Tarnik::System::DateTime time_;
};

}  // namespace SsoClient::Testing

#endif
