#include "options/kerberos_options.h"

#include <utility>
#include <vector>

#include <CLI/CLI.hpp>
#ifdef SSOCLIENT_TOOL_HAS_GSSAPI
#include <ssoclient/gssapi_negotiation_handler.h>
#endif
#include <tarnik/core/exception.h>

#include "failure.h"

namespace SsoClient::Tool {
namespace {

#ifdef SSOCLIENT_TOOL_HAS_GSSAPI
/// Turns failures of Kerberos, which has not asked the service yet, into failures of this machine.
class LocalHandler final : public NegotiationHandler {
 public:
  explicit LocalHandler(std::shared_ptr<NegotiationHandler> inner) : inner_(std::move(inner)) {}

  std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>& serverLeg) override {
    try {
      return inner_->Negotiate(serverLeg);
    } catch (const Tarnik::Exception& failure) {
      throw ToolException({ExitStatus::kLocal, "kerberos", failure.what(),
                           "get tickets with 'kinit', or name --ccache, --keytab or --service"});
    }
  }

 private:
  std::shared_ptr<NegotiationHandler> inner_;
};

std::shared_ptr<NegotiationHandler> Create(const GssapiNegotiationConfig& config) {
  try {
    return std::make_shared<LocalHandler>(CreateGssapiNegotiationHandler(config));
  } catch (const Tarnik::InvalidArgumentException& fault) {
    throw ToolException({ExitStatus::kUsage, "bad-service", fault.what(),
                         "give --service in the form HTTP@sts.example.com"});
  }
}
#endif

}  // namespace

CLI::Option* KerberosOptions::AddTo(CLI::App& command, const std::string& group) {
  CLI::Option* const kerberos =
      command.add_flag("--kerberos", isGiven_, "Log in with Kerberos tickets or a keytab")
          ->group(group);
  command
      .add_option("--service", service_,
                  "The service's Kerberos name; without it, HTTP@ and the host of --url")
      ->type_name("SERVICE@HOST")
      ->needs(kerberos)
      ->group(group);
  command
      .add_option("--principal", principal_,
                  "Who logs in; without it, the owner of the tickets, or the first in the keytab")
      ->type_name("NAME")
      ->needs(kerberos)
      ->group(group);
  command
      .add_option("--ccache", credentialCache_, "The credential cache; without it, the default one")
      ->type_name("CACHE")
      ->needs(kerberos)
      ->group(group);
  command.add_option("--keytab", keytab_, "Get tickets with the keys of this keytab")
      ->type_name("FILE")
      ->needs(kerberos)
      ->group(group);
  return kerberos;
}

std::shared_ptr<NegotiationHandler> KerberosOptions::MakeHandler(const std::string& host) const {
#ifdef SSOCLIENT_TOOL_HAS_GSSAPI
  GssapiNegotiationConfig config;
  config.targetService = service_.empty() ? "HTTP@" + host : service_;
  config.principal = principal_;
  config.keytab = keytab_;
  config.credentialCache = credentialCache_;
  return Create(config);
#else
  (void)host;
  throw ToolException({ExitStatus::kUsage, "no-kerberos", "this program was built without Kerberos",
                       "log in in another way"});
#endif
}

}  // namespace SsoClient::Tool
