#include "options/service_options.h"

#include <CLI/CLI.hpp>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>

#include "failure.h"

namespace SsoClient::Tool {

void AddSignersOption(CLI::App& command, std::vector<std::string>& files) {
  command
      .add_option(
          "--sts-certificate", files,
          "A file of certificates, in PEM or DER, that the service signs tokens with; may be "
          "repeated")
      ->envname("SSOCLIENT_STS_CERTIFICATE")
      ->type_name("FILE")
      ->allow_extra_args(false)
      ->group("Connection");
}

void ServiceOptions::AddConnectionTo(CLI::App& command) {
  connection_.AddTo(command);
  AddHttpOption(command, isHttpAllowed_);
}

void ServiceOptions::AddSignersTo(CLI::App& command) {
  AddSignersOption(command, signerFiles_);
}

Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> ServiceOptions::Signers() const {
  if (signerFiles_.empty()) {
    throw ToolException(
        {ExitStatus::kUsage, "no-sts-certificate",
         "without the service's signing certificate, nobody can verify the token",
         "get the certificate from those who operate the service, by a way that you trust, and "
         "pass it with --sts-certificate or SSOCLIENT_STS_CERTIFICATE"});
  }
  std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>> all;
  for (const std::string& path : signerFiles_) {
    try {
      const auto certificates = Tarnik::Crypto::LoadPemOrDerCertificates(path);
      all.insert(all.end(), certificates.begin(), certificates.end());
    } catch (const Tarnik::Exception& failure) {
      throw ToolException({ExitStatus::kLocal, "sts-certificate",
                           "cannot use " + path + ": " + failure.what(),
                           "check the file of --sts-certificate"});
    }
  }
  return Tarnik::Xml::Security::CreateTrustedCertificatesResolver(all);
}

ServiceSetup ServiceOptions::MakeSetup() const {
  ServiceSetup setup;
  setup.address = connection_.Address();
  setup.peerName = connection_.peerName;
  setup.timeoutSec = connection_.timeoutSec;
  if (setup.address.isHttps) {
    setup.sslContext = connection_.MakeSslContext();
  } else if (!isHttpAllowed_) {
    throw ToolException({ExitStatus::kUsage, "plain-http",
                         "over http, anyone on the network path can read passwords and tokens",
                         "use an https URL, or accept this with --allow-http"});
  }
  return setup;
}

void AddHttpOption(CLI::App& command, bool& isAllowed) {
  command
      .add_flag(
          "--allow-http", isAllowed,
          "Accept an http URL, over which anyone on the network path can read passwords and tokens")
      ->group("Connection");
}

}  // namespace SsoClient::Tool
