#include "stage.h"

namespace SsoClient::Access {

namespace {

using Tarnik::Http::ExchangeStage;

const char* DescribeExchange(ExchangeStage stage) noexcept {
  switch (stage) {
    case ExchangeStage::kNone:
      return "the attempt at ";
    case ExchangeStage::kLookUp:
      return "the look-up of the host of ";
    case ExchangeStage::kConnection:
      return "the connection to ";
    case ExchangeStage::kHandshake:
      return "the TLS handshake with ";
    case ExchangeStage::kSending:
      return "the request to be sent to ";
    case ExchangeStage::kAnswer:
      return "the answer of ";
    case ExchangeStage::kRestOfAnswer:
      return "the rest of the answer of ";
  }
  return "the attempt at ";
}

}  // namespace

std::string Describe(Stage stage, const std::string& url, ExchangeStage exchange) {
  switch (stage) {
    case Stage::kWorker:
      return "a worker thread";
    case Stage::kTurnOfFunction:
      return "its turn to call the login's function";
    case Stage::kFunction:
      return "the login's function";
    case Stage::kGate:
      return "the login of another call";
    case Stage::kBase:
      return "the token to exchange";
    case Stage::kTurn:
      return "its turn, since as many attempts as may be are under way";
    case Stage::kAttempt:
      return DescribeExchange(exchange) + url;
    case Stage::kPause:
      return "the next attempt";
  }
  return "a token";
}

bool MayHaveSent(ExchangeStage stage) noexcept {
  switch (stage) {
    case ExchangeStage::kLookUp:
    case ExchangeStage::kConnection:
    case ExchangeStage::kHandshake:
      return false;
    default:
      return true;
  }
}

}  // namespace SsoClient::Access
