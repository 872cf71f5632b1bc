#include "transport/exchange_outcome.h"

#include <cstddef>
#include <string>

#include <tarnik/text/display_text.h>

namespace SsoClient {

namespace {

// A peer may send any bytes as its reason, up to the limit of the whole header.
constexpr std::size_t kMaxReason = 256;

bool IsAnswer(int statusCode) {
  return statusCode == 500 || (statusCode >= 200 && statusCode <= 299);
}

}  // namespace

ExchangeOutcome InterpretFailure(const Tarnik::Exception& error) {
  return {nullptr, CommunicationException(error.Message())};
}

ExchangeOutcome InterpretResponse(const Tarnik::Http::ClientResponse& response) {
  try {
    const auto& status = response.Status();
    if (!IsAnswer(status.code)) {
      return {nullptr,
              CommunicationException("Server returned error: " + std::to_string(status.code) + " " +
                                     Tarnik::ToDisplayText(status.reason, kMaxReason))};
    }
    return {response.Body(), std::nullopt};
  } catch (const Tarnik::Exception& error) {
    return InterpretFailure(error);
  }
}

}  // namespace SsoClient
