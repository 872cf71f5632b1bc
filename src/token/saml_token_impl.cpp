#include "token/saml_token_impl.h"

#include <iterator>
#include <utility>

#include <tarnik/text/string_util.h>

#include "support/clock_tolerance.h"

namespace SsoClient {
namespace {

std::set<std::string> MakeAudiences(std::optional<std::vector<std::string>>&& audiences) {
  if (!audiences) {
    return {};
  }
  return {std::make_move_iterator(audiences->begin()), std::make_move_iterator(audiences->end())};
}

}  // namespace

SamlTokenImpl::SamlTokenImpl(ParsedAssertion&& assertion, std::string xml, long clockToleranceSec)
    : id_(std::move(assertion.id)),
      issuer_(std::move(assertion.issuer.value)),
      xml_(std::move(xml)),
      startTime_(assertion.conditions.notBefore),
      expirationTime_(assertion.conditions.notOnOrAfter),
      clockToleranceSec_(clockToleranceSec),
      subject_(std::make_unique<const PrincipalId>(std::move(assertion.subject.principal))),
      confirmationType_(assertion.subject.confirmationMethod),
      renewable_(assertion.conditions.renewRestriction &&
                 assertion.conditions.renewRestriction->count != 0),
      delegable_(assertion.conditions.proxyCount.value_or(0) != 0),
      isSolution_(assertion.attributes.isSolution),
      names_(std::move(assertion.attributes.names)),
      groups_(std::move(assertion.attributes.groups)),
      delegationChain_(
          std::move(assertion.conditions.delegationChain).value_or(std::vector<Delegate>())),
      audiences_(MakeAudiences(std::move(assertion.conditions.audiences))),
      advice_(std::move(assertion.advice)),
      holderOfKeyCertificate_(std::move(assertion.subject.holderOfKeyCertificate)),
      signature_(std::move(assertion.signature)) {}

SamlTokenImpl::~SamlTokenImpl() {
  Tarnik::StringUtil::Cleanse(xml_);
}

Tarnik::System::DateTime SamlTokenImpl::ExpirationTimeWithTolerance() const {
  return AddSeconds(expirationTime_, clockToleranceSec_);
}

}  // namespace SsoClient
