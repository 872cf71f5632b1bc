#ifndef SSOCLIENT_TOOL_OPTIONS_GATE_OPTIONS_H
#define SSOCLIENT_TOOL_OPTIONS_GATE_OPTIONS_H

#include <cstddef>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <ssoclient/access/token_gate.h>
#include <tarnik/system/date_time.h>

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// The rules of a token gate, and whom it trusts. What is not said has the gate's own default, and
/// bearer tokens are refused.
class GateOptions {
 public:
  void AddTo(CLI::App& command);

  /// Reads the trust and makes the gate, whose clock is always `time`. Throws `ToolException`: of
  /// the kind "trust-files" when the certificates or lists cannot be read, and for a usage that
  /// only shows in several options.
  std::shared_ptr<Access::TokenGate> MakeGate(const Tarnik::System::DateTime& time) const;
  /// The time of the check: that of --at, or now.
  Tarnik::System::DateTime CheckTime() const;
  bool HasOwnTime() const noexcept { return !time_.empty(); }

 private:
  void AddTrustTo(CLI::App& command);
  void AddPolicyTo(CLI::App& command);
  void AddLimitsTo(CLI::App& command);
  std::vector<std::string> TrustPaths() const;
  std::vector<Access::TrustedIssuer> Issuers() const;
  std::shared_ptr<Access::TrustStore> MakeTrust() const;

  std::vector<std::string> trustPaths_;
  std::string issuer_;
  std::vector<std::pair<std::string, std::string>> pathsOfIssuers_;
  std::vector<std::string> listPaths_;
  std::vector<std::string> listSignerPaths_;
  std::vector<std::string> audiences_;
  std::vector<std::string> groups_;
  std::string bearer_ = "refuse";
  std::string clockTolerance_ = "5m";
  std::string longestLifetime_ = "31d";
  std::string time_;
  std::size_t deepestDelegation_ = Access::GateConfig().deepestDelegation;
  std::size_t largestToken_ = Access::GateConfig().largestToken;
  bool acceptsUnrestricted_ = false;
};

}  // namespace SsoClient::Tool

#endif
