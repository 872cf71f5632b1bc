#ifndef SSOCLIENT_ACCESS_TESTS_SUPPORT_ISSUED_TOKEN_H
#define SSOCLIENT_ACCESS_TESTS_SUPPORT_ISSUED_TOKEN_H

#include <set>
#include <string>
#include <utility>
#include <vector>

#include <ssoclient/saml_token.h>
#include <tarnik/core/object_impl.h>

namespace SsoClient::Access::Testing {

/// A certificate of which only the bytes matter.
class NamedCertificate final : public Tarnik::Crypto::Certificate, public Tarnik::ObjectImpl {
 public:
  explicit NamedCertificate(std::string name) : name_(std::move(name)) {}

  const unsigned char* DerBytes() const noexcept override {
    return reinterpret_cast<const unsigned char*>(name_.data());
  }
  std::size_t DerLength() const noexcept override { return name_.size(); }
  const std::string& SubjectName() const override { return name_; }
  const std::string& IssuerName() const override { return name_; }
  const std::string& SerialNumber() const override { return name_; }
  Tarnik::System::DateTime NotBefore() const override { return {}; }
  Tarnik::System::DateTime NotAfter() const override { return {}; }
  const std::vector<unsigned char>& SubjectKeyIdentifier() const override { return noBytes_; }
  Tarnik::Ref<const Tarnik::Crypto::PublicKey> GetPublicKey() const override { return nullptr; }

 private:
  const std::string name_;
  const std::vector<unsigned char> noBytes_;
};

/// A token whose properties the test sets.
class IssuedToken final : public SamlToken {
 public:
  IssuedToken(std::string id, long startMicroseconds, long endMicroseconds)
      : id_(std::move(id)),
        xml_("<Assertion ID=\"" + id_ + "\"/>"),
        start_(Tarnik::System::DateTimeFromUtc(startMicroseconds, false)),
        end_(Tarnik::System::DateTimeFromUtc(endMicroseconds, false)) {}

  bool isRenewable = false;
  Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate;

  const std::string& Id() const override { return id_; }
  const Tarnik::System::DateTime& StartTime() const override { return start_; }
  const Tarnik::System::DateTime& ExpirationTime() const override { return end_; }
  Tarnik::System::DateTime ExpirationTimeWithTolerance() const override { return end_; }
  const PrincipalId& Subject() const override { return subject_; }
  bool IsRenewable() const override { return isRenewable; }
  bool IsDelegable() const override { return false; }
  bool IsSolution() const override { return false; }
  TokenConfirmationType ConfirmationType() const override {
    return certificate == nullptr ? BEARER : HOLDER_OF_KEY;
  }
  void GetSubjectNames(SubjectNames& names) const override { names = {}; }
  void GetGroups(std::vector<PrincipalId>& groups) const override { groups.clear(); }
  void GetDelegationChain(std::vector<Delegate>& chain) const override { chain.clear(); }
  void GetAudiences(std::set<std::string>& audiences) const override { audiences.clear(); }
  void GetAdvice(std::vector<Advice>& advice) const override { advice.clear(); }
  Tarnik::Ref<const Tarnik::Crypto::Certificate> HolderOfKeyCertificate() const override {
    return certificate;
  }
  const std::string& Issuer() const override { return subject_.domain; }
  Tarnik::Ref<Tarnik::Xml::Security::Signature> GetSignature() const override { return nullptr; }
  const std::string& Xml() const override { return xml_; }

 private:
  const std::string id_;
  const std::string xml_;
  const Tarnik::System::DateTime start_;
  const Tarnik::System::DateTime end_;
  const PrincipalId subject_{"alice", "CORP"};
};

}  // namespace SsoClient::Access::Testing

#endif
