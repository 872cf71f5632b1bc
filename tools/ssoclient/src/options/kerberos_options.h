#ifndef SSOCLIENT_TOOL_OPTIONS_KERBEROS_OPTIONS_H
#define SSOCLIENT_TOOL_OPTIONS_KERBEROS_OPTIONS_H

#include <memory>
#include <string>

#include <ssoclient/negotiation_handler.h>

namespace CLI {
class App;
class Option;
}  // namespace CLI

namespace SsoClient::Tool {

/// A login with Kerberos tickets or a keytab.
class KerberosOptions {
 public:
  /// Adds --kerberos, and --service, --principal, --ccache and --keytab, which need it, to this
  /// group of the command's help. Returns the first.
  CLI::Option* AddTo(CLI::App& command, const std::string& group);

  bool IsGiven() const { return isGiven_; }
  /// The path of the keytab, which may be empty.
  std::string Keytab() const;

  /// Creates the legs of a login to the service on `host`, which --service replaces. Failures of
  /// Kerberos are `ToolException`s of the kind "kerberos". Throws `ToolException` for a malformed
  /// --service, for a keytab that cannot be read or that others can read or change, unless
  /// `mayBeOpen`, and when the program was built without Kerberos.
  std::shared_ptr<NegotiationHandler> MakeHandler(const std::string& host, bool mayBeOpen) const;

 private:
  std::string service_;
  std::string principal_;
  std::string credentialCache_;
  std::string keytab_;
  bool isGiven_ = false;
};

}  // namespace SsoClient::Tool

#endif
