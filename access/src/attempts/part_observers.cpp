#include "attempts/part_observers.h"

#include <string>
#include <utility>

#include <tarnik/core/exception.h>

namespace SsoClient::Access {

ObservingTokenFactory::ObservingTokenFactory(std::shared_ptr<SamlTokenFactory> inner)
    : inner_(std::move(inner)) {}

template <class... Arguments>
std::shared_ptr<const SamlToken> ObservingTokenFactory::Create(
    const Arguments&... arguments) const {
  try {
    auto token = inner_->CreateToken(arguments...);
    failure_ = token == nullptr ? FailureKind::kBadToken : FailureKind::kNone;
    return token;
  } catch (const Tarnik::Exception& failure) {
    // A factory of the caller may reject tokens with any class of the client.
    failure_ =
        Classify(failure) == FailureKind::kLocal ? FailureKind::kLocal : FailureKind::kBadToken;
    throw;
  } catch (...) {
    failure_ = FailureKind::kLocal;
    throw;
  }
}

std::shared_ptr<const SamlToken> ObservingTokenFactory::CreateToken(const std::string& xml) const {
  return Create(xml);
}

std::shared_ptr<const SamlToken> ObservingTokenFactory::CreateToken(const std::string& xml,
                                                                    long clockToleranceSec) const {
  return Create(xml, clockToleranceSec);
}

std::shared_ptr<const SamlToken> ObservingTokenFactory::CreateToken(
    Tarnik::Xml::ElementNode* assertion) const {
  return Create(assertion);
}

std::shared_ptr<const SamlToken> ObservingTokenFactory::CreateToken(
    Tarnik::Xml::ElementNode* assertion, long clockToleranceSec) const {
  return Create(assertion, clockToleranceSec);
}

std::shared_ptr<const std::vector<unsigned char>> ObservingNegotiationHandler::Negotiate(
    const std::vector<unsigned char>& serverLeg) {
  hasFailed_ = true;
  auto leg = inner_.Negotiate(serverLeg);
  hasFailed_ = leg == nullptr;
  return leg;
}

}  // namespace SsoClient::Access
