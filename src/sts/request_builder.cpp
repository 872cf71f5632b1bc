#include "sts/request_builder.h"

#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/core/writer.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/xml_writer.h>

#include "sts/holder_of_key_check.h"
#include "xml/request_bodies.h"
#include "xml/security_header.h"
#include "xml/signed_envelope.h"
#include "xml/ws_trust_names.h"

namespace SsoClient {

namespace {

using Builder = std::shared_ptr<XMLBaseBuilder>;

constexpr char kByCertificate[] = "acquire token by certificate";
constexpr char kByToken[] = "acquire token by token";
constexpr char kRenew[] = "renew token";

constexpr std::uint32_t kTimestampMinutes = 10;

void CheckLifetime(std::int64_t seconds) {
  if (seconds <= 0) {
    throw Tarnik::InvalidArgumentException("Token lifetime must be positive");
  }
}

void CheckDefaultConfirmation(const TokenSpec& spec, const std::string& operation) {
  if (spec.confirmation != CONFIRMATION_DEFAULT) {
    throw Tarnik::InvalidArgumentException(
        "TokenSpec::confirmation must be CONFIRMATION_DEFAULT for " + operation);
  }
}

void CheckHolderOfKeyToken(const SamlToken& token, const std::string& operation) {
  if (token.ConfirmationType() != HOLDER_OF_KEY) {
    throw Tarnik::InvalidArgumentException("Unable to " + operation +
                                           ": the provided token must be Holder Of Key");
  }
}

// The security header with a token after the timestamp.
Builder BuildHeader(Builder token = nullptr) {
  auto header = std::make_shared<XMLCompositeBuilder>(BuildSecurityHeader(kTimestampMinutes));
  header->Add(std::move(token));
  return header;
}

Builder SignByCertificate(const HolderOfKeyConfig& config, const Builder& header,
                          const Builder& body) {
  CheckPeriodOfValidity(*config.certificate, Tarnik::System::GetUtcDateTime());
  return MakeSignedSoapBuilderForCertificate(header, body, config.privateKey, *config.certificate);
}

// The request carries the token and not the certificate, whose period does not matter then.
Builder SignByToken(const HolderOfKeyConfig& config, const Builder& header, const Builder& body,
                    const SamlToken& token) {
  return MakeSignedSoapBuilderForToken(header, body, config.privateKey, token.Id());
}

std::string Serialise(const XMLBaseBuilder& envelope) {
  Tarnik::Ref<Tarnik::Xml::ElementNode> element;
  envelope.Build(element);
  const auto writer = Tarnik::CreateStringWriter();
  Tarnik::Xml::WriteXml(element.get(), writer.get());
  return writer->TakeText();
}

void Assign(std::string action, const Builder& envelope, SoapRequest& request) {
  std::string body = Serialise(*envelope);
  request.action.swap(action);
  request.body.swap(body);
  Tarnik::StringUtil::Cleanse(body);
}

}  // namespace

RequestBuilderImpl::RequestBuilderImpl(boost::optional<HolderOfKeyConfig> holderOfKeyConfig)
    : holderOfKeyConfig_(std::move(holderOfKeyConfig)) {}

void RequestBuilderImpl::BuildAcquireTokenRequest(const std::string& userName,
                                                  const std::string& password,
                                                  const TokenSpec& spec,
                                                  SoapRequest& request) const {
  CheckLifetime(spec.tokenLifetimeSec);
  const auto header = BuildHeader(BuildUsernamePasswordToken(userName, password));
  const auto body = BuildIssueBodyWithUseKey(KeyTypeFor(spec), spec);
  Assign(kWsTrust13.issueAction, Enclose(spec, header, body), request);
}

void RequestBuilderImpl::BuildInitialNegotiationRequest(const TokenSpec& spec,
                                                        const std::vector<unsigned char>& leg,
                                                        SoapRequest& request) const {
  CheckLifetime(spec.tokenLifetimeSec);
  const auto body = std::make_shared<XMLBodyBuilderInitialSPNego>(KeyTypeFor(spec), spec, leg);
  Assign(kWsTrust13.issueAction, Enclose(spec, BuildHeader(), body), request);
}

void RequestBuilderImpl::BuildContinuedNegotiationRequest(const std::string& contextId,
                                                          const std::vector<unsigned char>& leg,
                                                          SoapRequest& request) const {
  const auto body = std::make_shared<XMLBodyBuilderContinuedSPNego>(contextId, leg);
  Assign(kWsTrust13.continuedIssueAction, BuildEnvelope(BuildHeader(), body), request);
}

void RequestBuilderImpl::BuildAcquireTokenByCertificateRequest(const TokenSpec& spec,
                                                               SoapRequest& request) const {
  CheckLifetime(spec.tokenLifetimeSec);
  const HolderOfKeyConfig& config = RequireHolderOfKey(kByCertificate);
  CheckDefaultConfirmation(spec, kByCertificate);
  const auto body = BuildIssueBodyWithUseKey(KeyTypeFor(spec), spec);
  Assign(kWsTrust13.issueAction, SignByCertificate(config, BuildHeader(), body), request);
}

void RequestBuilderImpl::BuildAcquireTokenByTokenRequest(const SamlToken& token,
                                                         const TokenSpec& spec,
                                                         SoapRequest& request) const {
  CheckLifetime(spec.tokenLifetimeSec);
  const HolderOfKeyConfig& config = RequireHolderOfKey(kByToken);
  const auto header = BuildHeader(MakeTokenElementBuilder(token));
  const auto body = BuildIssueBody(KeyTypeFor(spec), spec);
  Assign(kWsTrust13.issueAction, SignByToken(config, header, body, token), request);
}

void RequestBuilderImpl::BuildValidateRequest(const SamlToken& token, SoapRequest& request) const {
  Assign(kWsTrust13.validateAction, BuildEnvelope(BuildHeader(), BuildValidateBody(token)),
         request);
}

void RequestBuilderImpl::BuildRenewRequest(const SamlToken& token, std::int64_t lifetimeSec,
                                           SoapRequest& request) const {
  CheckLifetime(lifetimeSec);
  const HolderOfKeyConfig& config = RequireHolderOfKey(kRenew);
  CheckHolderOfKeyToken(token, kRenew);
  const auto body = BuildRenewBody(token, lifetimeSec);
  Assign(kWsTrust13.renewAction, SignByCertificate(config, BuildHeader(), body), request);
}

const HolderOfKeyConfig& RequestBuilderImpl::RequireHolderOfKey(
    const std::string& operation) const {
  if (!holderOfKeyConfig_) {
    throw Tarnik::InvalidStateException("No HolderOfKeyConfig provided. Unable to " + operation);
  }
  return *holderOfKeyConfig_;
}

bool RequestBuilderImpl::AsksForHolderOfKey(const TokenSpec& spec) const {
  return holderOfKeyConfig_ && spec.confirmation == CONFIRMATION_DEFAULT;
}

unsigned RequestBuilderImpl::KeyTypeFor(const TokenSpec& spec) const {
  return AsksForHolderOfKey(spec) ? 1 : 0;
}

// A request with an act-as token is not signed, even when it asks for a holder-of-key token.
std::shared_ptr<XMLBaseBuilder> RequestBuilderImpl::Enclose(
    const TokenSpec& spec, const std::shared_ptr<XMLBaseBuilder>& header,
    const std::shared_ptr<XMLBaseBuilder>& body) const {
  if (AsksForHolderOfKey(spec) && !spec.actAsToken) {
    return SignByCertificate(*holderOfKeyConfig_, header, body);
  }
  return BuildEnvelope(header, body);
}

}  // namespace SsoClient
