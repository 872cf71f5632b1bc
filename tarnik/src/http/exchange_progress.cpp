#include "http/exchange_progress.h"

#include "system/connect_stage.h"

namespace Tarnik::Http {

ExchangeStage ConnectStageOf(const System::CancellableItem* connect) noexcept {
  const auto* progress = dynamic_cast<const System::ConnectProgress*>(connect);
  switch (progress == nullptr ? System::ConnectStage::kConnection : progress->Stage()) {
    case System::ConnectStage::kLookUp:
      return ExchangeStage::kLookUp;
    case System::ConnectStage::kConnection:
      return ExchangeStage::kConnection;
    default:
      return ExchangeStage::kHandshake;
  }
}

const char* Describe(ExchangeStage stage) noexcept {
  switch (stage) {
    case ExchangeStage::kLookUp:
      return "the host look-up";
    case ExchangeStage::kConnection:
      return "the connection";
    case ExchangeStage::kHandshake:
      return "the TLS handshake";
    case ExchangeStage::kSending:
      return "the request to be sent";
    default:
      return "the answer";  // or the rest of it
  }
}

}  // namespace Tarnik::Http
