#ifndef SSOCLIENT_TOKEN_SAML_TOKEN_IMPL_H
#define SSOCLIENT_TOKEN_SAML_TOKEN_IMPL_H

#include <memory>
#include <set>
#include <string>
#include <vector>

#include <ssoclient/saml_token.h>

#include "token/parsed_assertion.h"

namespace SsoClient {

/// The values of one accepted assertion. Its signature keeps the assertion's tree alive.
class SamlTokenImpl final : public SamlToken {
 public:
  SamlTokenImpl(ParsedAssertion&& assertion, std::string xml, long clockToleranceSec);
  /// Cleanses the text from memory: whoever holds the text of a bearer token can use the token.
  ~SamlTokenImpl();

  const std::string& Id() const override { return id_; }
  const Tarnik::System::DateTime& StartTime() const override { return startTime_; }
  const Tarnik::System::DateTime& ExpirationTime() const override { return expirationTime_; }
  Tarnik::System::DateTime ExpirationTimeWithTolerance() const override;
  const PrincipalId& Subject() const override { return *subject_; }
  bool IsRenewable() const override { return renewable_; }
  bool IsDelegable() const override { return delegable_; }
  bool IsSolution() const override { return isSolution_; }
  TokenConfirmationType ConfirmationType() const override { return confirmationType_; }
  void GetSubjectNames(SubjectNames& names) const override { names = names_; }
  void GetGroups(std::vector<PrincipalId>& groups) const override { groups = groups_; }
  void GetDelegationChain(std::vector<Delegate>& chain) const override { chain = delegationChain_; }
  void GetAudiences(std::set<std::string>& audiences) const override { audiences = audiences_; }
  void GetAdvice(std::vector<Advice>& advice) const override { advice = advice_; }
  Tarnik::Ref<const Tarnik::Crypto::Certificate> HolderOfKeyCertificate() const override {
    return holderOfKeyCertificate_;
  }
  const std::string& Issuer() const override { return issuer_; }
  Tarnik::Ref<Tarnik::Xml::Security::Signature> GetSignature() const override { return signature_; }
  const std::string& Xml() const override { return xml_; }

 private:
  std::string id_;
  std::string issuer_;
  std::string xml_;
  Tarnik::System::DateTime startTime_;
  Tarnik::System::DateTime expirationTime_;
  long clockToleranceSec_;
  std::unique_ptr<const PrincipalId> subject_;
  TokenConfirmationType confirmationType_;
  bool renewable_;
  bool delegable_;
  bool isSolution_;
  SubjectNames names_;
  std::vector<PrincipalId> groups_;
  std::vector<Delegate> delegationChain_;
  std::set<std::string> audiences_;
  std::vector<Advice> advice_;
  Tarnik::Ref<const Tarnik::Crypto::Certificate> holderOfKeyCertificate_;
  Tarnik::Ref<Tarnik::Xml::Security::Signature> signature_;
};

}  // namespace SsoClient

#endif
