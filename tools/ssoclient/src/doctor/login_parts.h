#ifndef SSOCLIENT_TOOL_DOCTOR_LOGIN_PARTS_H
#define SSOCLIENT_TOOL_DOCTOR_LOGIN_PARTS_H

#include <atomic>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <ssoclient/negotiation_handler.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>

namespace SsoClient::Tool::Doctor {

/// A factory that keeps the text of the token that it creates or refuses.
class KeepingFactory final : public SamlTokenFactory {
 public:
  explicit KeepingFactory(std::shared_ptr<SamlTokenFactory> inner);
  ~KeepingFactory();
  KeepingFactory(const KeepingFactory&) = delete;
  KeepingFactory& operator=(const KeepingFactory&) = delete;

  std::shared_ptr<const SamlToken> CreateToken(const std::string& xml) const override;
  std::shared_ptr<const SamlToken> CreateToken(const std::string& xml,
                                               long clockToleranceSec) const override;
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode* assertion) const override;
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode* assertion,
                                               long clockToleranceSec) const override;

  /// The text; secret. Empty if no token has arrived. Not while an operation uses the factory.
  const std::string& Text() const noexcept { return text_; }

 private:
  std::shared_ptr<SamlTokenFactory> inner_;
  mutable std::string text_;  // one operation at a time uses this factory
};

/// A handler that notes whether an exception came from it, and not from the service. Another thread
/// may ask for that.
class NotingHandler final : public NegotiationHandler {
 public:
  explicit NotingHandler(std::shared_ptr<NegotiationHandler> inner);

  std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>& serverLeg) override;

  /// True also while it is at work.
  bool HasFailed() const noexcept { return hasFailed_; }

 private:
  std::shared_ptr<NegotiationHandler> inner_;
  std::atomic<bool> hasFailed_ = false;
};

/// A certificate that a token says it is signed with.
struct ClaimedSigner {
  std::string subject{};
  std::string fingerprint{};
};

/// The signers that the token names in its signature. The text need not be trusted. Names that
/// contain `secret`, if it is not empty, are left out.
std::vector<ClaimedSigner> ReadClaimedSigners(const std::string& text, std::string_view secret);

}  // namespace SsoClient::Tool::Doctor

#endif
