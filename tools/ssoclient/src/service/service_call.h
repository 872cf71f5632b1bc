#ifndef SSOCLIENT_TOOL_SERVICE_SERVICE_CALL_H
#define SSOCLIENT_TOOL_SERVICE_SERVICE_CALL_H

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include <boost/optional.hpp>

#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/saml_token_factory.h>
#include <ssoclient/security_token_service.h>
#include <tarnik/core/ref.h>
#include <tarnik/ssl/ssl_context.h>

#include "output/console.h"
#include "service/service_address.h"

namespace SsoClient::Tool {

/// The service that is called, and how.
struct ServiceSetup {
  ServiceAddress address{};
  std::string peerName{};
  Tarnik::Ref<Tarnik::Ssl::SSLContext> sslContext{};  ///< may be null for http
  std::shared_ptr<SamlTokenFactory> tokenFactory{};
  boost::optional<HolderOfKeyConfig> holderOfKey{};
  /// What is sent and must not be in a message; empty for nothing. It must remain valid.
  std::string_view secret{};
  /// What to do when the service refuses the request; empty for the remedies of a login.
  std::string remedyOfRefusal{};
  double timeoutSec = 0;
};

/// Runs `operation` with the service, on another thread, while this one shows the progress on the
/// terminal after two seconds. Throws what `operation` throws, but exceptions of the client as
/// `ToolException`s with the exact kind, and one of the kind "timed-out" after the time of the
/// setup. An operation that does not end then, since it is not waiting for the service, is
/// abandoned (`IsCallAbandoned`), so it must own what it uses. Warnings of the libraries go to
/// `console.err` when the call has ended (`LibraryLog`).
///
/// When a signal asks the process to end, the call is cancelled and the process ends by the signal.
void RunCall(const Console& console, const ServiceSetup& setup,
             std::function<void(const SecurityTokenService&)> operation);

/// The same for an operation with a result.
template <class Result>
Result RunCall(const Console& console, const ServiceSetup& setup,
               std::function<Result(const SecurityTokenService&)> operation) {
  auto result = std::make_shared<std::optional<Result>>();
  RunCall(
      console, setup,
      std::function<void(const SecurityTokenService&)>(
          [result, run = std::move(operation)](const auto& service) { *result = run(service); }));
  return std::move(result->value());
}

/// Whether an operation may still be running, so that the process must end without destroying what
/// it uses.
bool IsCallAbandoned() noexcept;

}  // namespace SsoClient::Tool

#endif
