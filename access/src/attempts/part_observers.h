#ifndef SSOCLIENT_ACCESS_ATTEMPTS_PART_OBSERVERS_H
#define SSOCLIENT_ACCESS_ATTEMPTS_PART_OBSERVERS_H

#include <memory>
#include <vector>

#include <ssoclient/access/failure_kind.h>
#include <ssoclient/negotiation_handler.h>
#include <ssoclient/saml_token_factory.h>

namespace SsoClient::Access {

/// Creates tokens by another factory, and keeps in mind whether that has rejected one. Used for one
/// attempt, by one thread.
class ObservingTokenFactory final : public SamlTokenFactory {
 public:
  explicit ObservingTokenFactory(std::shared_ptr<SamlTokenFactory> inner);

  std::shared_ptr<const SamlToken> CreateToken(const std::string& xml) const override;
  std::shared_ptr<const SamlToken> CreateToken(const std::string& xml,
                                               long clockToleranceSec) const override;
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode* assertion) const override;
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode* assertion,
                                               long clockToleranceSec) const override;

  /// `kBadToken` when the token was rejected, `kLocal` when the factory itself has failed, and
  /// `kNone` otherwise.
  FailureKind Failure() const noexcept { return failure_; }

 private:
  template <class... Arguments>
  std::shared_ptr<const SamlToken> Create(const Arguments&... arguments) const;

  const std::shared_ptr<SamlTokenFactory> inner_;
  mutable FailureKind failure_ = FailureKind::kNone;
};

/// Negotiates by another handler, and keeps in mind whether that has failed. Used for one attempt,
/// by one thread.
class ObservingNegotiationHandler final : public NegotiationHandler {
 public:
  explicit ObservingNegotiationHandler(NegotiationHandler& inner) : inner_(inner) {}

  std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>& serverLeg) override;

  bool HasFailed() const noexcept { return hasFailed_; }

 private:
  NegotiationHandler& inner_;
  bool hasFailed_ = false;
};

}  // namespace SsoClient::Access

#endif
