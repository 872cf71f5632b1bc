#include "gate/tolerant_token.h"

#include <utility>

namespace SsoClient::Access {

namespace {

using Tarnik::System::DateTime;

class TolerantToken final : public SamlToken {
 public:
  TolerantToken(std::shared_ptr<const SamlToken> token, std::chrono::seconds tolerance)
      : token_(std::move(token)),
        end_(Tarnik::System::DateTimeFromUtc(
            Tarnik::System::SaturatingAdd(token_->ExpirationTime().GetUtcTime(),
                                          std::chrono::microseconds(tolerance).count()),
            false)) {}

  const std::string& Id() const override { return token_->Id(); }
  const DateTime& StartTime() const override { return token_->StartTime(); }
  const DateTime& ExpirationTime() const override { return token_->ExpirationTime(); }
  DateTime ExpirationTimeWithTolerance() const override { return end_; }
  const PrincipalId& Subject() const override { return token_->Subject(); }
  bool IsRenewable() const override { return token_->IsRenewable(); }
  bool IsDelegable() const override { return token_->IsDelegable(); }
  bool IsSolution() const override { return token_->IsSolution(); }
  TokenConfirmationType ConfirmationType() const override { return token_->ConfirmationType(); }
  void GetSubjectNames(SubjectNames& names) const override { token_->GetSubjectNames(names); }
  void GetGroups(std::vector<PrincipalId>& groups) const override { token_->GetGroups(groups); }
  void GetDelegationChain(std::vector<Delegate>& chain) const override {
    token_->GetDelegationChain(chain);
  }
  void GetAudiences(std::set<std::string>& audiences) const override {
    token_->GetAudiences(audiences);
  }
  void GetAdvice(std::vector<Advice>& advice) const override { token_->GetAdvice(advice); }
  Tarnik::Ref<const Tarnik::Crypto::Certificate> HolderOfKeyCertificate() const override {
    return token_->HolderOfKeyCertificate();
  }
  const std::string& Issuer() const override { return token_->Issuer(); }
  Tarnik::Ref<Tarnik::Xml::Security::Signature> GetSignature() const override {
    return token_->GetSignature();
  }
  const std::string& Xml() const override { return token_->Xml(); }

 private:
  const std::shared_ptr<const SamlToken> token_;
  const DateTime end_;
};

}  // namespace

std::shared_ptr<const SamlToken> WithTolerance(std::shared_ptr<const SamlToken> token,
                                               std::chrono::seconds tolerance) {
  return std::make_shared<const TolerantToken>(std::move(token), tolerance);
}

}  // namespace SsoClient::Access
