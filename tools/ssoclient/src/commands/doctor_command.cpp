#include <string>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include "commands/commands.h"
#include "doctor/render.h"
#include "doctor/runner.h"
#include "input/secret.h"
#include "options/connection_options.h"
#include "options/service_options.h"

namespace SsoClient::Tool {
namespace {

class DoctorCommand final : public Command {
 public:
  CLI::App* AddTo(CLI::App& program) override;
  Outcome Run(const Console& console) override;

 private:
  void AddLoginOptions(CLI::App& command);
  Doctor::LoginKind Kind() const;
  Doctor::Plan MakePlan() const;

  ConnectionOptions connection_;
  SecretOption password_;
  SecretOption passphrase_;
  std::string stsCertificate_;
  std::string user_;
  std::string certificate_;
  std::string key_;
  std::string service_;
  std::string principal_;
  std::string keytab_;
  bool isKerberos_ = false;
  bool isHttpAllowed_ = false;
  bool isStrict_ = false;
};

CLI::App* DoctorCommand::AddTo(CLI::App& program) {
  CLI::App* const command = program.add_subcommand(
      "doctor",
      "Find out why a service cannot be used\n"
      "Examines files, DNS, TCP, TLS, certificates, HTTP, clocks and the service one after the "
      "other, and says what to do about the first problem. Without a login it sends no name, no "
      "password and no token, and cannot be counted as a failed login. With one it logs in once.");
  SetExample(*command, "ssoclient doctor --url https://sts.example.com/sts --ca ca.pem");
  connection_.AddTo(*command);
  AddHttpOption(*command, isHttpAllowed_);
  command
      ->add_option("--sts-certificate", stsCertificate_,
                   "The certificates, PEM or DER, with which the service may sign tokens")
      ->type_name("FILE");
  AddLoginOptions(*command);
  command->add_flag("--strict", isStrict_, "Treat warnings as failures in the exit status");
  AddJsonOption(*command);
  return command;
}

void DoctorCommand::AddLoginOptions(CLI::App& command) {
  const std::string group = "Login";
  CLI::Option* const user =
      command.add_option("--user", user_, "Log in as this user with a password")
          ->type_name("NAME")
          ->group(group);
  password_.AddTo(command, "password");
  CLI::Option* const certificate =
      command.add_option("--certificate", certificate_, "Log in with this certificate")
          ->type_name("FILE")
          ->group(group)
          ->excludes(user);
  CLI::Option* const key =
      command.add_option("--key", key_, "The private key of the certificate, PEM")
          ->type_name("FILE")
          ->group(group)
          ->needs(certificate);
  certificate->needs(key);
  passphrase_.AddTo(command, "passphrase");
  CLI::Option* const kerberos = command.add_flag("--kerberos", isKerberos_, "Log in with Kerberos")
                                    ->group(group)
                                    ->excludes(user)
                                    ->excludes(certificate);
  command
      .add_option("--service", service_,
                  "The service's name in Kerberos; HTTP@ and the host of the URL without it")
      ->type_name("NAME@HOST")
      ->group(group)
      ->needs(kerberos);
  command.add_option("--principal", principal_, "The Kerberos principal that logs in")
      ->type_name("NAME")
      ->group(group)
      ->needs(kerberos);
  command
      .add_option("--keytab", keytab_,
                  "The keytab of the principal; the credential cache without "
                  "it")
      ->type_name("FILE")
      ->group(group)
      ->needs(kerberos);
}

Doctor::LoginKind DoctorCommand::Kind() const {
  if (isKerberos_) {
    return Doctor::LoginKind::kKerberos;
  }
  if (!certificate_.empty()) {
    return Doctor::LoginKind::kCertificate;
  }
  return user_.empty() ? Doctor::LoginKind::kNone : Doctor::LoginKind::kPassword;
}

Doctor::Plan DoctorCommand::MakePlan() const {
  Doctor::Plan plan;
  plan.url = connection_.url;
  plan.peerName = connection_.peerName;
  plan.caFiles = connection_.caFiles;
  plan.crlFiles = connection_.crlFiles;
  plan.timeout = std::chrono::milliseconds(static_cast<long>(connection_.timeoutSec * 1000));
  plan.stsCertificateFile = stsCertificate_;
  plan.user = user_;
  plan.certificateFile = certificate_;
  plan.keyFile = key_;
  plan.kerberosService = service_;
  plan.principal = principal_;
  plan.keytab = keytab_;
  plan.login = Kind();
  plan.isHttpAllowed = isHttpAllowed_;
  plan.makeSslContext = [this] { return connection_.MakeSslContext(); };
  plan.readPassword = [this] { return password_.Read("Password of " + user_ + ": ", false); };
  plan.readPassphrase = [this] { return passphrase_.Read("Passphrase of " + key_ + ": ", false); };
  return plan;
}

Outcome DoctorCommand::Run(const Console& console) {
  const Doctor::Report report = Doctor::Examine(MakePlan(), console);
  const ExitStatus status = StatusOf(report, isStrict_);
  if (WantsJson()) {
    return {status, std::make_shared<nlohmann::json>(ToJson(report))};
  }
  PrintReport(console, report);
  return {status, nullptr};
}

}  // namespace

std::unique_ptr<Command> MakeDoctorCommand() {
  return std::make_unique<DoctorCommand>();
}

}  // namespace SsoClient::Tool
