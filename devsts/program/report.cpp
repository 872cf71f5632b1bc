#include "report.h"

#include <array>
#include <stdexcept>
#include <utility>

namespace DevSts::Program {
namespace {

using Named = std::pair<const char*, std::uint64_t Counters::*>;

constexpr std::array<Named, 15> kCounters{{
    {"connections", &Counters::connectionsAccepted},
    {"connections-open", &Counters::connectionsOpen},
    {"handshakes", &Counters::handshakesDone},
    {"handshakes-failed", &Counters::handshakesFailed},
    {"handshakes-resumed", &Counters::handshakesResumed},
    {"requests", &Counters::requests},
    {"malformed", &Counters::malformedRequests},
    {"tokens", &Counters::tokensIssued},
    {"faults", &Counters::faults},
    {"negotiations", &Counters::negotiations},
    {"legs", &Counters::negotiationLegs},
    {"negotiated-tokens", &Counters::negotiatedTokens},
    {"stalls", &Counters::stalls},
    {"stalled", &Counters::stalled},
    {"delayed", &Counters::delayed},
}};

// The text in quotation marks. A peer must not be able to write lines or fields of its own.
std::string QuotedField(std::string text) {
  for (char& character : text) {
    const auto octet = static_cast<unsigned char>(character);  // from 0x80 on, a part of UTF-8
    if (octet < ' ' || octet == 0x7f || octet == '"') {
      character = '?';
    }
  }
  return '"' + text + '"';
}

// The value of the header without the quotation marks that SOAP 1.1, section 6.1.1, puts around it.
std::string ActionOf(const ReceivedRequest& request) {
  const std::string header = request.Header("SOAPAction");
  const bool isQuoted = header.size() >= 2 && header.front() == '"' && header.back() == '"';
  return isQuoted ? header.substr(1, header.size() - 2) : header;
}

}  // namespace

std::string DescribeRequest(const ReceivedRequest& request) {
  constexpr std::array<const char*, 4> kSignatures{"none", "certificate", "token", "other"};
  std::string text = "connection=" + std::to_string(request.connectionId) +
                     " tls=" + (request.overTls ? "1" : "0") +
                     " resumed=" + (request.tlsSessionReused ? "1" : "0") +
                     " action=" + QuotedField(ActionOf(request)) +
                     " signature=" + kSignatures.at(static_cast<std::size_t>(request.signature)) +
                     " status=" + std::to_string(request.answeredStatus);
  if (request.leg) {
    text += " leg=" + std::to_string(request.leg->ordinal);
  }
  if (!request.answeredFault.empty()) {
    text += " fault=" + QuotedField(request.answeredFault);
  }
  return text;
}

std::string DescribeCounters(const Counters& counters) {
  std::string text;
  for (const auto& [name, member] : kCounters) {
    text += std::string(text.empty() ? "" : " ") + name + "=" + std::to_string(counters.*member);
  }
  return text;
}

std::uint64_t CounterNamed(const std::string& name, const Counters& counters) {
  for (const auto& [known, member] : kCounters) {
    if (name == known) {
      return counters.*member;
    }
  }
  throw std::invalid_argument("there is no counter '" + name + "'");
}

}  // namespace DevSts::Program
