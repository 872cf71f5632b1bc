#include "sts/request_builder_impl.h"

#include <cstdint>
#include <memory>

#include <tarnik/core/exception.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/xml_writer.h>

#include "xml/envelope.h"
#include "xml/issue_body.h"
#include "xml/security_header.h"
#include "xml/username_token.h"

namespace SsoClient {

namespace {

constexpr char kIssueAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";
constexpr std::uint32_t kTimestampMinutes = 10;
constexpr unsigned kBearer = 0;

void CheckLifetime(std::int64_t seconds) {
  if (seconds <= 0) {
    throw Tarnik::InvalidArgumentException("Token lifetime must be positive");
  }
}

std::string Serialise(const XMLBaseBuilder& envelope) {
  Tarnik::Ref<Tarnik::Xml::ElementNode> element;
  envelope.Build(element);
  const auto writer = Tarnik::CreateStringWriter();
  Tarnik::Xml::WriteXml(element.get(), writer.get());
  return writer->TakeText();
}

void Assign(std::string action, std::string body, SoapRequest& request) noexcept {
  request.action.swap(action);
  request.body.swap(body);
  Tarnik::StringUtil::Cleanse(body);
}

}  // namespace

void RequestBuilderImpl::BuildAcquireTokenRequest(const std::string& userName,
                                                  const std::string& password,
                                                  const TokenSpec& spec,
                                                  SoapRequest& request) const {
  CheckLifetime(spec.tokenLifetimeSec);
  const auto header = std::make_shared<XMLCompositeBuilder>(BuildSecurityHeader(kTimestampMinutes));
  header->Add(BuildUsernamePasswordToken(userName, password));
  const auto body = BuildIssueBodyWithUseKey(kBearer, spec);
  Assign(kIssueAction, Serialise(*BuildEnvelope(header, body)), request);
}

}  // namespace SsoClient
