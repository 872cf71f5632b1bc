#ifndef SSOCLIENT_TRANSPORT_EXCHANGE_OUTCOME_H
#define SSOCLIENT_TRANSPORT_EXCHANGE_OUTCOME_H

#include <optional>

#include <ssoclient/exceptions.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_response.h>

namespace SsoClient {

/// The result of an exchange: a reader over the answer's body, or the failure.
struct ExchangeOutcome {
  Tarnik::Ref<Tarnik::Reader> body;
  std::optional<CommunicationException> failure;
};

/// The outcome of an exchange that failed below HTTP.
ExchangeOutcome InterpretFailure(const Tarnik::Exception& error);

/// The outcome of an exchange that was answered. Status 500 counts as success like 2xx, since SOAP
/// faults are sent with it (SOAP 1.1, section 6.2).
ExchangeOutcome InterpretResponse(const Tarnik::Http::ClientResponse& response);

}  // namespace SsoClient

#endif
