#ifndef SSOCLIENT_TOOL_OPTIONS_SERVICE_OPTIONS_H
#define SSOCLIENT_TOOL_OPTIONS_SERVICE_OPTIONS_H

#include <string>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "options/connection_options.h"
#include "service/service_call.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// Adds --sts-certificate, which may be repeated, to the command.
void AddSignersOption(CLI::App& command, std::vector<std::string>& files);

/// The service that a command calls: its address, its trust and the keys of its tokens.
class ServiceOptions {
 public:
  /// Adds the options of `ConnectionOptions`, and --allow-http, to the command.
  void AddConnectionTo(CLI::App& command);
  /// Adds --sts-certificate, for commands that receive a token.
  void AddSignersTo(CLI::App& command);

  /// The trusted signers. Throws `ToolException` when there are none, so that tokens would not be
  /// verified (with the status `kUsage`), and when a file cannot be loaded.
  Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> Signers() const;
  /// The service without a token factory and a key. Throws `ToolException` for a malformed URL, for
  /// http without --allow-http, and when a file cannot be loaded.
  ServiceSetup MakeSetup() const;

 private:
  ConnectionOptions connection_;
  std::vector<std::string> signerFiles_;
  bool isHttpAllowed_ = false;
};

/// Adds --allow-http to the command.
void AddHttpOption(CLI::App& command, bool& isAllowed);

}  // namespace SsoClient::Tool

#endif
