#include "misbehavior_names.h"

#include <cstddef>
#include <map>
#include <string>
#include <utility>

#include "fault_names.h"
#include "value_forms.h"

namespace DevSts::Program {
namespace {

constexpr std::size_t kMaxPadding = std::size_t{1} << 30U;

FaultAnswer& FaultOf(Misbehavior& target) {
  if (!target.fault) {
    target.fault = FaultAnswer{};
    SetFaultCode("wst:RequestFailed", *target.fault);
    target.fault->faultString = "The service is configured to fail";
  }
  return *target.fault;
}

HttpAnswer& HttpOf(Misbehavior& target) {
  if (!target.httpAnswer) {
    target.httpAnswer.emplace();
  }
  return *target.httpAnswer;
}

// The reason phrases of RFC 9110, section 15; a client ignores them.
std::string ReasonOf(int status) {
  static const std::map<int, std::string> kReasons{
      {200, "OK"},
      {301, "Moved Permanently"},
      {302, "Found"},
      {303, "See Other"},
      {307, "Temporary Redirect"},
      {308, "Permanent Redirect"},
      {400, "Bad Request"},
      {401, "Unauthorized"},
      {403, "Forbidden"},
      {404, "Not Found"},
      {405, "Method Not Allowed"},
      {407, "Proxy Authentication Required"},
      {408, "Request Timeout"},
      {413, "Content Too Large"},
      {429, "Too Many Requests"},
      {500, "Internal Server Error"},
      {502, "Bad Gateway"},
      {503, "Service Unavailable"},
      {504, "Gateway Timeout"},
  };
  const auto reason = kReasons.find(status);
  return reason != kReasons.end() ? reason->second : "";
}

// Keeps a reason that was given before the status.
void SetHttpStatus(int status, HttpAnswer& answer) {
  if (answer.reason == HttpAnswer{}.reason) {
    answer.reason = ReasonOf(status);
  }
  answer.status = status;
}

std::size_t SizeFrom(const std::string& value) {
  return static_cast<std::size_t>(NumberFrom(value, kMaxPadding));
}

Stall StallFrom(const std::string& value) {
  return ChoiceFrom<Stall>(value, {{"before-handshake", Stall::BeforeTlsHandshake},
                                   {"before-request", Stall::BeforeRequest},
                                   {"before-answer", Stall::BeforeAnswer},
                                   {"after-headers", Stall::AfterHeaders},
                                   {"in-body", Stall::InMidBody}});
}

CutOff CutOffFrom(const std::string& value) {
  const auto [octets, style] = HalvesFrom(value);
  CutOff cutOff;
  cutOff.afterBytes = SizeFrom(octets);
  if (!style.empty()) {
    cutOff.style = ChoiceFrom<CutStyle>(style, {{"orderly", CutStyle::Orderly},
                                                {"without-notice", CutStyle::WithoutNotice},
                                                {"reset", CutStyle::Reset}});
  }
  return cutOff;
}

Drip DripFrom(const std::string& value) {
  const auto [octets, interval] = HalvesFrom(value);
  Drip drip;
  drip.bytes = SizeFrom(octets);
  if (drip.bytes == 0) {
    throw std::invalid_argument("at least one octet is sent at a time");
  }
  if (!interval.empty()) {
    drip.interval = TimeFrom(interval);
  }
  return drip;
}

std::vector<std::size_t> SizesFrom(const std::string& value) {
  std::vector<std::size_t> sizes;
  for (const std::string& part : ListFrom(value)) {
    sizes.push_back(SizeFrom(part));
    if (sizes.back() == 0) {
      throw std::invalid_argument("a chunk has at least one octet");
    }
  }
  return sizes;
}

void AddEdit(const std::string& value, Misbehavior& target) {
  target.editEnvelope = [before = std::move(target.editEnvelope),
                         edit = SubstitutionFrom(value)](std::string& envelope) {
    if (before) {
      before(envelope);
    }
    edit(envelope);
  };
}

using Value = const std::string&;

Vocabulary<Misbehavior> AnswerNames() {
  return {
      {"fault", "CODE", "answers with a SOAP fault; see CODE above",
       [](Value value, Misbehavior& target) { SetFaultCode(value, FaultOf(target)); }},
      {"fault-text", "TEXT", "the faultstring of the fault",
       [](Value value, Misbehavior& target) { FaultOf(target).faultString = OctetsFrom(value); }},
      {"fault-without-text", "", "the fault has no faultstring",
       [](Value, Misbehavior& target) { FaultOf(target).omitFaultString = true; }},
      {"fault-status", "N", "the HTTP status of the fault (500)",
       [](Value value, Misbehavior& target) {
         FaultOf(target).httpStatus = HttpStatusFrom(value);
       }},
      {"http-status", "N", "answers over HTTP with this status and without SOAP",
       [](Value value, Misbehavior& target) {
         SetHttpStatus(HttpStatusFrom(value), HttpOf(target));
       }},
      {"http-reason", "TEXT", "another reason phrase for that status",
       [](Value value, Misbehavior& target) { HttpOf(target).reason = OctetsFrom(value); }},
      {"http-header", "NAME: VALUE", "a header field of that answer; may be repeated",
       [](Value value, Misbehavior& target) {
         HttpOf(target).headers.push_back(HeaderFrom(value));
       }},
      {"http-body", "TEXT", "the body of that answer",
       [](Value value, Misbehavior& target) { HttpOf(target).body = OctetsFrom(value); }},
      {"raw-answer", "TEXT", "sends these octets in place of an HTTP answer",
       [](Value value, Misbehavior& target) { target.rawAnswer = OctetsFrom(value); }},
      {"raw-prefix", "TEXT", "sends these octets before the answer",
       [](Value value, Misbehavior& target) { target.rawPrefix = OctetsFrom(value); }},
      {"edit-envelope", "/FROM/TO/", "replaces a text in the SOAP envelope; may be repeated",
       AddEdit},
  };
}

Vocabulary<Misbehavior> LegNames() {
  return {
      {"leg-context", "TEXT", "answers a leg with another Context",
       [](Value value, Misbehavior& target) { target.leg.context = OctetsFrom(value); }},
      {"leg-without-context", "", "answers a leg without its Context",
       [](Value, Misbehavior& target) { target.leg.omitContext = true; }},
      {"leg-octets", "TEXT", "answers a leg with these octets",
       [](Value value, Misbehavior& target) { target.leg.leg = OctetsFrom(value); }},
      {"leg-without-octets", "", "answers a leg without the BinaryExchange",
       [](Value, Misbehavior& target) { target.leg.omitLeg = true; }},
      {"leg-without-cookie", "", "requires a cookie that the answer to a leg does not set",
       [](Value, Misbehavior& target) { target.leg.omitCookie = true; }},
      {"leg-forgotten", "", "forgets the negotiation",
       [](Value, Misbehavior& target) { target.leg.forget = true; }},
  };
}

Vocabulary<Misbehavior> FormNames() {
  return {
      {"header", "NAME: VALUE", "adds a header field to the answer; may be repeated",
       [](Value value, Misbehavior& target) { target.extraHeaders.push_back(HeaderFrom(value)); }},
      {"cookie", "TEXT", "adds a Set-Cookie field; may be repeated",
       [](Value value, Misbehavior& target) { target.setCookies.push_back(OctetsFrom(value)); }},
      {"clock", "OFFSET", "the clock of the service is wrong by this, such as +10m or -90s",
       [](Value value, Misbehavior& target) { target.clockOffset = OffsetFrom(value); }},
      {"without-date", "", "sends no Date",
       [](Value, Misbehavior& target) { target.omitDate = true; }},
      {"pad-headers", "OCTETS", "adds header fields of about this size",
       [](Value value, Misbehavior& target) { target.padHeaderBytes = SizeFrom(value); }},
      {"pad-body", "OCTETS", "appends this many spaces to the body",
       [](Value value, Misbehavior& target) { target.padBodyBytes = SizeFrom(value); }},
      {"chunks", "OCTETS,...", "sends the body in chunks of these sizes",
       [](Value value, Misbehavior& target) { target.chunkSizes = SizesFrom(value); }},
      {"close", "", "closes the connection after the answer, and says so",
       [](Value, Misbehavior& target) { target.closeConnection = true; }},
      {"close-unannounced", "", "closes the connection after the answer without saying so",
       [](Value, Misbehavior& target) { target.closeUnannounced = true; }},
      {"delay", "TIME", "waits before the answer, such as 500ms or 2s",
       [](Value value, Misbehavior& target) { target.delayBeforeAnswer = TimeFrom(value); }},
      {"stall", "WHERE",
       "stops before-handshake, before-request, before-answer, after-headers or in-body",
       [](Value value, Misbehavior& target) { target.stall = StallFrom(value); }},
      {"drip", "OCTETS/TIME", "sends the answer in pieces with pauses",
       [](Value value, Misbehavior& target) { target.drip = DripFrom(value); }},
      {"cut-off", "OCTETS/STYLE",
       "ends the connection after this many octets: orderly, without-notice or reset",
       [](Value value, Misbehavior& target) { target.cutOff = CutOffFrom(value); }},
  };
}

Vocabulary<Misbehavior> AllNames() {
  Vocabulary<Misbehavior> all = AnswerNames();
  for (const Vocabulary<Misbehavior>& more : {LegNames(), FormNames()}) {
    all.insert(all.end(), more.begin(), more.end());
  }
  return all;
}

}  // namespace

const Vocabulary<Misbehavior>& MisbehaviorNames() {
  static const Vocabulary<Misbehavior> names = AllNames();
  return names;
}

Misbehavior MisbehaviorFrom(const std::vector<std::string>& texts) {
  return Applied(MisbehaviorNames(), texts);
}

}  // namespace DevSts::Program
