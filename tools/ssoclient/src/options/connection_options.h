#ifndef SSOCLIENT_TOOL_OPTIONS_CONNECTION_OPTIONS_H
#define SSOCLIENT_TOOL_OPTIONS_CONNECTION_OPTIONS_H

#include <string>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/ssl/ssl_context.h>

#include "service/service_address.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// Where the service is, and how it is trusted. The options are the same in all commands.
struct ConnectionOptions {
  std::string url{};                    ///< --url, or SSOCLIENT_URL
  std::vector<std::string> caFiles{};   ///< --ca FILE, repeatable; the system's store if empty
  std::string peerName{};               ///< --peer-name NAME
  std::vector<std::string> crlFiles{};  ///< --tls-crl FILE
  double timeoutSec = 30;               ///< --timeout DURATION of the whole command

  /// Adds the options to the command. --url is required.
  void AddTo(CLI::App& command);
  /// The parts of the URL. Throws `ToolException` with the status `kUsage` for a malformed one.
  ServiceAddress Address() const;
  /// The TLS trust that the options describe. Throws `ToolException` when a file cannot be loaded.
  Tarnik::Ref<Tarnik::Ssl::SSLContext> MakeSslContext() const;
};

}  // namespace SsoClient::Tool

#endif
