// Each of the four parsers returns a result or throws one of the documented exceptions. A result is
// the content that libxml2 finds at the same place, and its answer contains no fault.
#include <initializer_list>
#include <optional>

#include <devsts/xml_security.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>

#include "input.h"
#include "sts/response_handler.h"
#include "xml_input.h"

namespace {

using SsoClient::NegotiationResponse;
using SsoClient::ResponseHandlerImpl;

const std::string kStatus = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/";

/// The result of a parser, or nothing if it refuses the text.
template <class Parse>
auto ResultOf(const std::string& text, const Parse& parse)
    -> std::optional<decltype(parse(std::declval<Tarnik::Reader*>()))> {
  const auto reader = Tarnik::CreateStringReader(text);
  try {
    return parse(reader.get());
  } catch (const Tarnik::Exception&) {
    return std::nullopt;
  }
}

/// The canonical text of the element at the end of a path of first children with these names, or
/// nothing if there is no such element.
std::optional<std::string> TextAt(const std::string& xml,
                                  std::initializer_list<const char*> names) {
  std::string path = "/*";
  for (const char* name : names) {
    path.append("/*[local-name()='").append(name).append("'][1]");
  }
  try {
    return DevSts::Canonicalize(xml, path, DevSts::CanonicalMode::Inclusive);
  } catch (const DevSts::XmlError&) {
    return std::nullopt;
  }
}

std::optional<std::string> IssuedAt(const std::string& xml, bool inCollection) {
  if (inCollection) {
    return TextAt(xml, {"Body", "RequestSecurityTokenResponseCollection",
                        "RequestSecurityTokenResponse", "RequestedSecurityToken", "Assertion"});
  }
  return TextAt(xml,
                {"Body", "RequestSecurityTokenResponse", "RequestedSecurityToken", "Assertion"});
}

void CheckNegotiation(const std::string& xml, const NegotiationResponse& negotiation) {
  Fuzz::Require(negotiation.token.empty() ? !negotiation.leg.empty()
                                          : negotiation.token == IssuedAt(xml, true));
  Fuzz::Require(negotiation.token.empty() ==
                TextAt(xml, {"Body", "RequestSecurityTokenResponse"}).has_value());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  const ResponseHandlerImpl handler;
  const auto issued = ResultOf(text, [&](Tarnik::Reader* reader) {
    std::string assertion;
    handler.ParseIssueResponse(reader, assertion);
    return assertion;
  });
  const auto renewed = ResultOf(text, [&](Tarnik::Reader* reader) {
    std::string assertion;
    handler.ParseRenewResponse(reader, assertion);
    return assertion;
  });
  const auto verdict =
      ResultOf(text, [&](Tarnik::Reader* reader) { return handler.ParseValidateResponse(reader); });
  const auto negotiation = ResultOf(text, [&](Tarnik::Reader* reader) {
    NegotiationResponse response;
    handler.ParseNegotiationResponse(reader, response);
    return response;
  });
  if (!issued && !renewed && !verdict && !negotiation) {
    return 0;
  }
  const auto document = Fuzz::ParseXml(text);
  Fuzz::Require(document != nullptr);
  if (Fuzz::HasOddNamespace(*document) || Fuzz::HasRelativeNamespace(*document)) {
    return 0;
  }
  Fuzz::Require(!TextAt(text, {"Body", "Fault"}));
  Fuzz::Require(!issued || issued == IssuedAt(text, true));
  Fuzz::Require(!renewed || renewed == IssuedAt(text, false));
  if (verdict) {
    const auto code = TextAt(text, {"Body", "RequestSecurityTokenResponse", "Status", "Code"});
    const std::string status = ">" + kStatus + (*verdict ? "valid<" : "invalid<");
    Fuzz::Require(code && code->find(status) != std::string::npos);
  }
  if (negotiation) {
    CheckNegotiation(text, *negotiation);
  }
  return 0;
}
