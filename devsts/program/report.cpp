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

// A peer must not be able to write lines or fields of its own.
std::string Printable(std::string text) {
  for (char& character : text) {
    if (character < ' ' || character == '\x7f') {
      character = '?';
    }
  }
  return text;
}

}  // namespace

std::string DescribeRequest(const ReceivedRequest& request) {
  constexpr std::array<const char*, 4> kSignatures{"none", "certificate", "token", "other"};
  std::string text = "connection=" + std::to_string(request.connectionId) +
                     " tls=" + (request.overTls ? "1" : "0") +
                     " resumed=" + (request.tlsSessionReused ? "1" : "0") +
                     " action=" + request.Header("SOAPAction") +
                     " signature=" + kSignatures.at(static_cast<std::size_t>(request.signature)) +
                     " status=" + std::to_string(request.answeredStatus);
  if (request.leg) {
    text += " leg=" + std::to_string(request.leg->ordinal);
  }
  if (!request.answeredFault.empty()) {
    text += " fault=" + request.answeredFault;
  }
  return Printable(std::move(text));
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
