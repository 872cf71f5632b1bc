#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include "commands/commands.h"
#include "doctor/render.h"
#include "doctor/runner.h"
#include "input/private_file.h"
#include "input/secret.h"
#include "options/connection_options.h"
#include "options/kerberos_options.h"
#include "options/key_options.h"
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
  KeyOptions key_;
  KerberosOptions kerberos_;
  std::vector<std::string> signerFiles_;
  std::string user_;
  bool isHttpAllowed_ = false;
  bool mayBeOpen_ = false;
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
  AddSignersOption(*command, signerFiles_);
  AddLoginOptions(*command);
  AddOpenFilesOption(*command, mayBeOpen_);
  command->add_flag("--strict", isStrict_, "Treat warnings as failures in the exit status");
  AddJsonOption(*command);
  return command;
}

void DoctorCommand::AddLoginOptions(CLI::App& command) {
  const std::string group = "Login";
  CLI::Option* const user =
      command.add_option("--user", user_, "Log in with this user name and a password")
          ->type_name("NAME")
          ->group(group);
  password_.AddTo(command, "password", group);
  CLI::Option* const kerberos = kerberos_.AddTo(command, group)->excludes(user);
  key_.AddTo(command, false)->excludes(user)->excludes(kerberos);
}

Doctor::LoginKind DoctorCommand::Kind() const {
  if (kerberos_.IsGiven()) {
    return Doctor::LoginKind::kKerberos;
  }
  if (key_.IsGiven()) {
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
  plan.stsCertificateFiles = signerFiles_;
  plan.user = user_;
  plan.certificateFile = key_.CertificateFile();
  plan.keyFile = key_.KeyFile();
  plan.keytabFile = kerberos_.Keytab();
  plan.login = Kind();
  plan.isHttpAllowed = isHttpAllowed_;
  plan.makeSslContext = [this] { return connection_.MakeSslContext(); };
  plan.readPassword = [this] { return password_.Read("Password for " + user_ + ": ", mayBeOpen_); };
  plan.loadIdentity = [this] { return key_.Load(mayBeOpen_); };
  plan.checkKeytab = [this, path = plan.keytabFile] {
    CheckPrivateFile({.path = path, .what = "keytab", .mayBeOpen = mayBeOpen_});
  };
  plan.makeKerberosHandler = [this](const std::string& host) {
    return kerberos_.MakeHandler(host, mayBeOpen_);
  };
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
