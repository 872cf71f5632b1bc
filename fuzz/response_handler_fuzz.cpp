// Each of the four parsers returns a result exactly when the model reads one in libxml2's tree of
// the answer, and the same one: the token, the verdict, or the leg of a negotiation with its
// context. A fault is thrown as the exception of its kind.
#include <initializer_list>
#include <optional>
#include <utility>

#include <devsts/xml_security.h>
#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>

#include "answer_model.h"
#include "input.h"
#include "sts/response_handler.h"
#include "xml_input.h"
#include "xml_mutator.h"
#include "xml_tree.h"

namespace {

using Fuzz::ModelFault;
using SsoClient::NegotiationResponse;
using SsoClient::ResponseHandlerImpl;

/// What a parser returns, or the kind of its exception.
template <class Value>
struct Outcome {
  std::optional<Value> value;
  ModelFault fault = ModelFault::kNone;
};

template <class Value, class Parse>
Outcome<Value> OutcomeOf(const std::string& text, const Parse& parse) {
  const auto reader = Tarnik::CreateStringReader(text);
  Outcome<Value> outcome;
  try {
    outcome.value = parse(reader.get());
  } catch (const SsoClient::PasswordExpiredException&) {
    outcome.fault = ModelFault::kPasswordExpired;
  } catch (const SsoClient::InvalidCredentialsException&) {
    outcome.fault = ModelFault::kCredentials;
  } catch (const Tarnik::Exception&) {
    outcome.fault = ModelFault::kOther;
  }
  return outcome;
}

struct Answer {
  Outcome<std::string> issued;
  Outcome<std::string> renewed;
  Outcome<bool> verdict;
  Outcome<NegotiationResponse> negotiation;
};

Answer Parse(const std::string& text) {
  const ResponseHandlerImpl handler;
  Answer answer;
  answer.issued = OutcomeOf<std::string>(text, [&](Tarnik::Reader* reader) {
    std::string assertion;
    handler.ParseIssueResponse(reader, assertion);
    return assertion;
  });
  answer.renewed = OutcomeOf<std::string>(text, [&](Tarnik::Reader* reader) {
    std::string assertion;
    handler.ParseRenewResponse(reader, assertion);
    return assertion;
  });
  answer.verdict = OutcomeOf<bool>(
      text, [&](Tarnik::Reader* reader) { return handler.ParseValidateResponse(reader); });
  answer.negotiation = OutcomeOf<NegotiationResponse>(text, [&](Tarnik::Reader* reader) {
    NegotiationResponse response;
    handler.ParseNegotiationResponse(reader, response);
    return response;
  });
  return answer;
}

void RequireFault(const Answer& answer, ModelFault fault) {
  for (const ModelFault thrown : {answer.issued.fault, answer.renewed.fault, answer.verdict.fault,
                                  answer.negotiation.fault}) {
    Fuzz::Require(thrown == fault);
  }
}

/// The canonical text of the element at the end of a path of first children with these names.
std::string TextAt(const std::string& xml, std::initializer_list<const char*> names) {
  std::string path = "/*";
  for (const char* name : names) {
    path.append("/*[local-name()='").append(name).append("'][1]");
  }
  return DevSts::Canonicalize(xml, path, DevSts::CanonicalMode::Inclusive);
}

std::string IssuedAt(const std::string& xml) {
  return TextAt(xml, {"Body", "RequestSecurityTokenResponseCollection",
                      "RequestSecurityTokenResponse", "RequestedSecurityToken", "Assertion"});
}

std::string RenewedAt(const std::string& xml) {
  return TextAt(xml,
                {"Body", "RequestSecurityTokenResponse", "RequestedSecurityToken", "Assertion"});
}

void RequireNegotiation(const std::string& xml, const NegotiationResponse& negotiation,
                        const Fuzz::ModelNegotiation& model) {
  Fuzz::Require(negotiation.contextId == model.contextId);
  Fuzz::Require(negotiation.leg == model.leg);
  Fuzz::Require(negotiation.token == (model.hasToken ? IssuedAt(xml) : ""));
}

void RequireResults(const std::string& xml, const Answer& answer, const xmlNode* envelope) {
  Fuzz::Require(answer.issued.value.has_value() == Fuzz::HasIssuedToken(envelope));
  Fuzz::Require(!answer.issued.value || *answer.issued.value == IssuedAt(xml));
  Fuzz::Require(answer.renewed.value.has_value() == Fuzz::HasRenewedToken(envelope));
  Fuzz::Require(!answer.renewed.value || *answer.renewed.value == RenewedAt(xml));
  Fuzz::Require(answer.verdict.value == Fuzz::VerdictOf(envelope));
  const auto model = Fuzz::NegotiationOf(envelope);
  Fuzz::Require(answer.negotiation.value.has_value() == model.has_value());
  if (model) {
    RequireNegotiation(xml, *answer.negotiation.value, *model);
  }
}

}  // namespace

extern "C" std::size_t LLVMFuzzerCustomMutator(std::uint8_t* data, std::size_t size,
                                               std::size_t maxSize, unsigned seed) {
  return Fuzz::MutateXml(data, size, maxSize, seed);
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  const Answer answer = Parse(text);
  const auto document = Fuzz::ParseXml(text);
  if (document == nullptr) {
    RequireFault(answer, ModelFault::kOther);
    return 0;
  }
  if (Fuzz::HasOddNamespace(*document) || Fuzz::HasRelativeNamespace(*document)) {
    return 0;
  }
  const Fuzz::XmlTree tree = Fuzz::ParseByLibXml2(text);
  Fuzz::Require(tree != nullptr);
  const xmlNode* envelope = xmlDocGetRootElement(tree.get());
  const ModelFault fault = Fuzz::FaultOf(envelope);
  if (fault != ModelFault::kNone) {
    RequireFault(answer, fault);
    return 0;
  }
  RequireResults(text, answer, envelope);
  return 0;
}
