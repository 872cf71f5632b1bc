// The input determines a request: operation, spec, names, passwords, tokens, legs and the time.
// libxml2 reads back exactly that request, and xmlsec1 verifies its signature over the Body and the
// Timestamp. A request is refused with a documented exception only if XML cannot represent it, or
// it breaks a rule in `IsRefused`.
#include <algorithm>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include <fuzzer/FuzzedDataProvider.h>

#include <tarnik/core/exception.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "fixed_clock.h"
#include "fixed_random.h"
#include "input.h"
#include "request_model.h"
#include "sts/request_builder.h"
#include "support/fake_saml_token.h"
#include "support/key_texts.h"
#include "support/test_certificates.h"
#include "value_model.h"
#include "xml_input.h"
#include "xmlsec.h"

namespace {

using Fuzz::Operation;
using Fuzz::RequestCase;
using SsoClient::Testing::FakeSamlToken;

// The certificate's period of validity, in microseconds since 1970.
constexpr long kNotBefore = 1'709'622'489'000'000;
constexpr long kNotAfter = 4'076'464'089'000'000;
constexpr long kTolerance = 600'000'000;

struct Holder {
  Tarnik::OpenSsl::OwnedKey key;
  SsoClient::HolderOfKeyConfig config;
  std::string certificate;
};

const Holder& TheHolder() {
  static const Holder holder = [] {
    Fuzz::FixRandomness(1);
    Holder made{Tarnik::Testing::MakeRsaKey(2048), {}, {}};
    Tarnik::Testing::CertificateRecipe recipe;
    recipe.key = made.key.get();
    made.config.certificate = Tarnik::Testing::MakeCertificate(recipe);
    made.config.privateKey =
        Tarnik::Crypto::CreatePrivateKeyFromPem(Tarnik::Testing::ToPkcs8Pem(made.key.get()));
    made.certificate =
        Fuzz::Base64Of(made.config.certificate->DerBytes(), made.config.certificate->DerLength());
    return made;
  }();
  return holder;
}

// Texts that are hard to write, in front of the input's own.
std::string Text(FuzzedDataProvider& input) {
  static const char* const kHard[] = {"",
                                      "&<>\"'",
                                      "\r\n\t ",
                                      "]]>",
                                      "<!--",
                                      " a  b ",
                                      "&#13;",
                                      "\xE2\x80\xA8",
                                      "\xC2\x85",
                                      "\xF0\x9F\x98\x80",
                                      "\xEF\xBF\xBE",
                                      "\xED\xA0\x80",
                                      "\xC1\x81",
                                      "holderOfKeyCertificate"};
  const auto index = input.ConsumeIntegralInRange<std::size_t>(0, 3 * std::size(kHard));
  const std::string own = input.ConsumeRandomLengthString(12);
  return index < std::size(kHard) ? kHard[index] + own : own;
}

std::string TokenText(FuzzedDataProvider& input, const std::string& id) {
  static const char* const kBegins[] = {"<Assertion", "<s:Assertion xmlns:s=\"urn:s\"",
                                        "<Assertion xmlns=\"urn:a\" xml:lang=\"en\"",
                                        "<?xml version=\"1.0\"?><!-- c --><s:Assertion "
                                        "xmlns:s='urn:s' s:Id=\"holderOfKeyCertificate\"",
                                        "<Assertion id=\"holderOfKeyProofSignature\""};
  const std::string begin = input.PickValueInArray(kBegins);
  const std::string name =
      begin.find("s:Assertion") == std::string::npos ? "Assertion" : "s:Assertion";
  return begin + " ID=\"" + id +
         "\"><wst:x xmlns:wst=\"urn:w\" wst:y='&#9;'/>&#13;<![CDATA[<&>]]>" +
         input.ConsumeRandomLengthString(16) + "</" + name + ">";
}

SsoClient::TokenSpec Spec(FuzzedDataProvider& input, const std::string& actAs) {
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = input.ConsumeIntegralInRange(0, 7) == 7
                              ? input.ConsumeIntegral<std::int64_t>()
                              : input.ConsumeIntegralInRange<std::int64_t>(1, 1L << 32);
  spec.delegable = input.ConsumeBool();
  spec.renewable = input.ConsumeBool();
  spec.confirmation = input.ConsumeIntegralInRange(0, 3) == 0 ? SsoClient::CONFIRMATION_BEARER
                                                              : SsoClient::CONFIRMATION_DEFAULT;
  if (input.ConsumeBool()) {
    spec.delegateTo = Text(input);
  }
  if (input.ConsumeIntegralInRange(0, 3) == 0) {
    spec.actAsToken = std::make_shared<const FakeSamlToken>(actAs);
  }
  for (int count = input.ConsumeIntegralInRange(0, 2); count > 0; --count) {
    spec.audienceRestriction.insert(Text(input));
  }
  for (int count = input.ConsumeIntegralInRange(0, 2); count > 0; --count) {
    SsoClient::Advice advice{Text(input), {}};
    for (int attributes = input.ConsumeIntegralInRange(0, 2); attributes > 0; --attributes) {
      advice.attributes.push_back({Text(input), {}});
      for (int values = input.ConsumeIntegralInRange(0, 2); values > 0; --values) {
        advice.attributes.back().values.push_back(Text(input));
      }
    }
    spec.advice.push_back(advice);
  }
  return spec;
}

RequestCase CaseOf(FuzzedDataProvider& input) {
  RequestCase request;
  request.operation = static_cast<Operation>(input.ConsumeIntegralInRange(0, 6));
  request.certificate = input.ConsumeIntegralInRange(0, 3) == 0 ? "" : TheHolder().certificate;
  constexpr long kLongLater = 3 * kNotAfter;
  request.now = input.ConsumeIntegralInRange(0, 3) == 0
                    ? input.ConsumeIntegralInRange<long>(0, kLongLater)
                    : kNotBefore + input.ConsumeIntegralInRange<long>(0, kTolerance);
  request.tokenId = Text(input);
  request.token = TokenText(input, input.ConsumeBool() ? "_id" : request.tokenId);
  request.actAs = TokenText(input, "_act");
  request.spec = Spec(input, request.actAs);
  request.userName = Text(input);
  request.password = Text(input);
  request.contextId = Text(input);
  request.leg = input.ConsumeRandomLengthString(40);
  return request;
}

// What is sent as text.
std::vector<std::string> TextsOf(const RequestCase& request) {
  std::vector<std::string> texts;
  if (request.operation == Operation::kPassword) {
    texts = {request.userName, request.password};
  } else if (request.operation == Operation::kNextLeg) {
    texts = {request.contextId};
  } else if (request.operation == Operation::kToken) {
    texts = {request.tokenId};
  }
  if (!request.SendsSpec()) {
    return texts;
  }
  const auto& spec = request.spec;
  texts.insert(texts.end(), spec.audienceRestriction.begin(), spec.audienceRestriction.end());
  texts.push_back(spec.delegateTo.value_or(""));
  for (const auto& advice : spec.advice) {
    texts.push_back(advice.source);
    for (const auto& attribute : advice.attributes) {
      texts.push_back(attribute.name);
      texts.insert(texts.end(), attribute.values.begin(), attribute.values.end());
    }
  }
  return texts;
}

std::vector<std::string> TokensOf(const RequestCase& request) {
  std::vector<std::string> tokens;
  if (request.SendsToken()) {
    tokens.push_back(request.token);
  }
  if (request.SendsSpec() && request.spec.actAsToken) {
    tokens.push_back(request.actAs);
  }
  return tokens;
}

// In any spelling that some receiver may take for an id, if `inAnyForm`.
bool IsId(const std::string& name, const std::string& value, const std::string& id,
          bool inAnyForm) {
  const std::string local = name.substr(name.find('}') + 1);
  if (!inAnyForm) {
    return value == id && (local == "Id" || local == "ID" || local == "id");
  }
  const bool isId = local.size() == 2 && (local[0] | 0x20) == 'i' && (local[1] | 0x20) == 'd';
  return (isId || local == "AssertionID") && value.find(id) != std::string::npos;
}

int CountIds(const Fuzz::Element& element, const std::string& id, bool inAnyForm) {
  int count = 0;
  for (const auto& [name, value] : element.attributes) {
    count += IsId(name, value, id, inAnyForm) ? 1 : 0;
  }
  for (const Fuzz::Element& child : element.children) {
    count += CountIds(child, id, inAnyForm);
  }
  return count;
}

// A signed request does not repeat an id of its own (XML Signature 1.1, section 4.4.3.1).
bool RepeatsId(const RequestCase& request, bool inAnyForm) {
  int signatures = 1;
  int certificates = request.operation == Operation::kToken ? 0 : 1;
  for (const std::string& token : TokensOf(request)) {
    const Fuzz::Element root = *Fuzz::ReadWithLibXml2(token);
    signatures += CountIds(root, "holderOfKeyProofSignature", inAnyForm);
    certificates += CountIds(root, "holderOfKeyCertificate", inAnyForm);
  }
  return signatures > 1 || certificates > 1;
}

// Two tokens with the same ids may be refused.
bool MayBeRefused(const RequestCase& request) {
  return request.IsSigned() && (RepeatsId(request, true) || TokensOf(request).size() > 1);
}

bool IsOutsideOfPeriod(const RequestCase& request) {
  return request.now < kNotBefore - kTolerance || request.now > kNotAfter + kTolerance;
}

bool IsRefused(const RequestCase& request) {
  const Operation operation = request.operation;
  const bool needsKey = operation == Operation::kCertificate || operation == Operation::kToken ||
                        operation == Operation::kRenew;
  const bool hasLifetime = operation != Operation::kNextLeg && operation != Operation::kValidate;
  if ((hasLifetime && request.spec.tokenLifetimeSec <= 0) || (needsKey && !request.HasKey()) ||
      (operation == Operation::kCertificate &&
       request.spec.confirmation != SsoClient::CONFIRMATION_DEFAULT)) {
    return true;
  }
  if (request.IsSigned() && operation != Operation::kToken && IsOutsideOfPeriod(request)) {
    return true;
  }
  for (const std::string& token : TokensOf(request)) {
    if (!Fuzz::ReadWithLibXml2(token)) {
      return true;
    }
  }
  for (const std::string& text : TextsOf(request)) {
    if (!Fuzz::IsXmlText(text)) {
      return true;
    }
  }
  return request.IsSigned() && RepeatsId(request, false);
}

void Build(const RequestCase& request, SsoClient::SoapRequest& built) {
  boost::optional<SsoClient::HolderOfKeyConfig> config;
  if (request.HasKey()) {
    config = TheHolder().config;
  }
  const SsoClient::RequestBuilderImpl builder(config);
  FakeSamlToken token(request.token);
  token.id = request.tokenId;
  token.confirmationType = SsoClient::HOLDER_OF_KEY;
  const std::vector<unsigned char> leg(request.leg.begin(), request.leg.end());
  switch (request.operation) {
    case Operation::kPassword:
      return builder.BuildAcquireTokenRequest(request.userName, request.password, request.spec,
                                              built);
    case Operation::kFirstLeg:
      return builder.BuildInitialNegotiationRequest(request.spec, leg, built);
    case Operation::kNextLeg:
      return builder.BuildContinuedNegotiationRequest(request.contextId, leg, built);
    case Operation::kCertificate:
      return builder.BuildAcquireTokenByCertificateRequest(request.spec, built);
    case Operation::kToken:
      return builder.BuildAcquireTokenByTokenRequest(token, request.spec, built);
    case Operation::kValidate:
      return builder.BuildValidateRequest(token, built);
    case Operation::kRenew:
      return builder.BuildRenewRequest(token, request.spec.tokenLifetimeSec, built);
  }
}

/// The envelope, or nothing if the request is refused with a documented exception.
std::optional<std::string> BodyOf(const RequestCase& request) {
  Fuzz::FixClock(Tarnik::System::DateTimeFromUtc(request.now, false));
  SsoClient::SoapRequest built;
  try {
    Build(request, built);
    return built.body;
  } catch (const Tarnik::InvalidArgumentException&) {
  } catch (const Tarnik::InvalidStateException&) {
  } catch (const Tarnik::Xml::XMLParseException&) {
  }
  Fuzz::Require(built.body.empty() && built.action.empty());
  return std::nullopt;
}

void CheckSignature(const std::string& body) {
  const auto signature =
      Fuzz::VerifyWithXmlSec(body, TheHolder().key.get(), "holderOfKeyProofSignature");
  Fuzz::Require(signature.isValid && signature.references.size() == 2);
  Fuzz::Require(signature.references[0].octets.starts_with("<soapenv:Body ") &&
                signature.references[1].octets.starts_with("<wsu:Timestamp "));
}

// libxml2 and the parser differ in such texts.
bool IsComparable(const RequestCase& request) {
  for (const std::string& token : TokensOf(request)) {
    const auto document = Fuzz::ParseXml(token);
    if ((document == nullptr) == Fuzz::ReadWithLibXml2(token).has_value() ||
        (document != nullptr &&
         (Fuzz::HasOddNamespace(*document) || Fuzz::HasRelativeNamespace(*document)))) {
      return false;
    }
  }
  return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  TheHolder();
  Fuzz::FixRandomness(size);
  FuzzedDataProvider input(data, size);
  const RequestCase request = CaseOf(input);
  if (!IsComparable(request)) {
    return 0;
  }
  const auto body = BodyOf(request);
  const bool isRefused = IsRefused(request);
  if (!body) {
    Fuzz::Require(isRefused || MayBeRefused(request));
    return 0;
  }
  Fuzz::Require(!isRefused);
  const auto read = Fuzz::ReadWithLibXml2(*body);
  Fuzz::Require(read.has_value());
  Fuzz::Require(Fuzz::WithoutValues(*read) == Fuzz::WithoutValues(Fuzz::ExpectedRequest(request)));
  if (request.IsSigned()) {
    CheckSignature(*body);
  }
  return 0;
}
