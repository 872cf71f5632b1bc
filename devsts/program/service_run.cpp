#include "service_run.h"

#include <csignal>
#include <memory>
#include <optional>
#include <string>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <unistd.h>

#include "accounts_file.h"
#include "commands.h"
#include "control_socket.h"
#include "descriptor.h"
#include "end_wait.h"
#include "errors.h"
#include "files.h"
#include "input_commands.h"
#include "keys.h"
#include "line_output.h"
#include "realm.h"
#include "report.h"
#include "revocations.h"
#include "state_folder.h"

namespace DevSts::Program {
namespace {

void WarnLoudly(const Options& options) {
  std::string text =
      "ssoclient-devsts: this is a Security Token Service FOR TESTS ONLY; it protects nothing\n";
  if (options.isExposed) {
    text += "ssoclient-devsts: WARNING: listening on " + options.server.address +
            ", where others can reach it and log in with known passwords\n";
  }
  WriteToDescriptor(STDERR_FILENO, text);
}

AccountsFile AccountsOf(const Options& options) {
  AccountsFile accounts =
      options.accountsFile.empty() ? DemoAccounts() : ReadAccounts(options.accountsFile);
  accounts.startsRealm = accounts.startsRealm || options.startsRealm;
  if (!options.userKeytabs.empty()) {
    accounts.userKeytabs = options.userKeytabs;
  }
  if (!options.server.negotiation.keytab.empty()) {
    accounts.keytab = options.server.negotiation.keytab;
  }
  if (accounts.startsRealm && !accounts.keytab.empty()) {
    throw UsageError("a realm and a keytab exclude each other");
  }
  if (!accounts.userKeytabs.empty() && !accounts.startsRealm) {
    throw UsageError("keytabs for users need a realm");
  }
  if (accounts.startsRealm) {
    RequireRealmUsers(accounts, options.accountsFile);
  }
  return accounts;
}

KeyPlan PlanOf(const Options& options) {
  KeyPlan plan;
  plan.signingKey = options.server.assertion.signingKey;
  plan.signingByAuthority = options.signingByAuthority;
  return plan;
}

void WriteOut(const std::string& folder, const Keys& keys) {
  WriteWhole(folder + "/ca.pem", keys.authority.certificatePem);
  WriteWhole(folder + "/signing.pem", keys.signing.certificatePem);
  WriteWhole(folder + "/client.pem", keys.client.certificatePem);
  WriteWhole(folder + "/client-key.pem", keys.client.privateKeyPem, Readers::OwnerOnly);
}

Revocations RevocationsOf(const Options& options, const Keys& keys) {
  Revocations revocations(keys, options.stateFolder);
  for (const std::string& folder : {options.stateFolder, options.outFolder}) {
    if (!folder.empty()) {
      revocations.WriteTo(folder);
    }
  }
  return revocations;
}

// The users, one of whom owns the client certificate.
Users UsersOf(const AccountsFile& accounts, const Keys& keys) {
  Users users = accounts.users;
  if (!accounts.clientUser.empty()) {
    users.at(accounts.clientUser).certificates.push_back(keys.client.certificatePem);
  }
  return users;
}

// What cannot be opened: the address, if the system does not have it, or a port.
std::string DescribePort(const PortError& error, const ServerOptions& options) {
  const std::string reason = " cannot be opened: " + error.code().message();
  if (error.code() == std::errc::address_not_available) {
    return "--address " + options.address + reason;
  }
  return error.IsOverTls() ? "--https-port " + std::to_string(options.httpsPort) + reason
                           : "--http-port " + std::to_string(options.httpPort) + reason;
}

std::unique_ptr<Server> StartServer(const ServerOptions& options) {
  if (!options.negotiation.keytab.empty() &&
      access(options.negotiation.keytab.c_str(), R_OK) != 0) {
    throw FileError(options.negotiation.keytab + ": the keytab cannot be read");
  }
  try {
    return std::make_unique<Server>(options);
  } catch (const PortError& error) {
    const std::error_code code = error.code();
    if (code != std::errc::address_in_use && code != std::errc::address_not_available &&
        code != std::errc::permission_denied) {
      throw;
    }
    throw ProgramError(ExitStatus::Port, DescribePort(error, options));
  }
}

std::string ReadyLines(const Server& server, const StartedRealm* realm) {
  return "http_url=" + server.HttpUrl() + "\nhttps_url=" + server.HttpsUrl() + "\n" +
         (realm != nullptr ? realm->Lines() : "");
}

// Everything that the service consists of.
class Service {
 public:
  explicit Service(Options options) : options_(std::move(options)) {
    const AccountsFile accounts = AccountsOf(options_);
    MakeFolders();
    OpenFiles();
    const Keys keys = state_ ? state_->LoadOrMake(PlanOf(options_)) : MakeKeys(PlanOf(options_));
    if (!options_.outFolder.empty()) {
      WriteOut(options_.outFolder, keys);
    }
    Revocations revocations = RevocationsOf(options_, keys);
    if (accounts.startsRealm) {
      realm_.emplace(accounts);
    }
    Serve(accounts, keys, std::move(revocations));
  }
  ~Service() {
    // Before the commands are destroyed.
    if (commands_) {
      commands_->Stop();
    }
    output_.EndWaits();
    input_.reset();
    if (control_) {
      control_->Stop();
    }
  }
  Service(const Service&) = delete;
  Service& operator=(const Service&) = delete;

  // Accepts commands, and says that the service is ready.
  void Announce(const std::function<void()>& ready) {
    if (control_) {
      control_->Start(
          *commands_, [this] { end_.Request(); },
          [this](const std::string& message) { end_.Fail(message); });
    }
    const std::string lines = ReadyLines(*server_, realm_ ? &*realm_ : nullptr);
    if (!options_.pidFile.empty()) {
      pidFile_.emplace(options_.pidFile, std::to_string(getpid()) + "\n");
    }
    if (!options_.readyFile.empty()) {
      readyFile_.emplace(options_.readyFile, lines);
    }
    WriteToDescriptor(STDOUT_FILENO, lines + "ready\n");
    ready();
    output_.Start();
    if (log_) {
      log_->Start();
    }
    if (options_.endsWithStdin) {
      input_.emplace([this](const std::string& line) { return Execute(line); },
                     [this] { end_.Request(); });
    }
  }

  void WaitForEnd() { end_.Wait(); }

 private:
  void MakeFolders() {
    if (!options_.stateFolder.empty()) {
      state_.emplace(options_.stateFolder);
    }
    if (!options_.outFolder.empty()) {
      MakeFolder(options_.outFolder);
    }
  }

  // They may be in the folders.
  void OpenFiles() {
    if (!options_.controlPath.empty()) {
      control_.emplace(options_.controlPath);
    }
    if (!options_.logFile.empty()) {
      logFile_ = OpenOwn(options_.logFile, O_WRONLY | O_APPEND);
      log_.emplace(logFile_.Get());
    }
    // A script that waits for it must not read what a service that was killed has left.
    if (!options_.readyFile.empty()) {
      RemoveFile(options_.readyFile);
    }
  }

  // Returns false after "quit".
  bool Execute(const std::string& line) {
    const Commands::Answer answer = commands_->Execute(line);
    output_.WriteEach(answer.line);
    return !answer.quits;
  }

  void Serve(const AccountsFile& accounts, const Keys& keys, Revocations revocations) {
    ServerOptions serverOptions = options_.server;
    serverOptions.users = UsersOf(accounts, keys);
    serverOptions.keys = {keys.authority, keys.server, keys.signing};
    serverOptions.negotiation.keytab = realm_ ? realm_->Keytab() : accounts.keytab;
    // The principals of the options take precedence.
    serverOptions.negotiation.principals.insert(accounts.principals.begin(),
                                                accounts.principals.end());
    if (!options_.isQuiet) {
      serverOptions.onRequest = [&lines = log_ ? *log_ : output_](const ReceivedRequest& request) {
        lines.Write("request " + DescribeRequest(request));
      };
    }
    serverOptions.onFailure = [this](const std::string& message) { end_.Fail(message); };
    server_ = StartServer(serverOptions);
    server_->SetNegotiationScript(options_.negotiation);
    if (options_.misbehaves) {
      server_->SetMisbehavior(options_.misbehavior);
    }
    commands_.emplace(*server_, serverOptions.users, options_.server.assertion,
                      std::move(revocations));
  }

  // In the order in which they are made.
  const Options options_;
  EndWait end_;
  LineOutput output_{STDOUT_FILENO};
  Descriptor logFile_;
  std::optional<LineOutput> log_;
  std::optional<StateFolder> state_;
  std::optional<ControlSocket> control_;
  std::optional<StartedRealm> realm_;
  std::unique_ptr<Server> server_;
  std::optional<Commands> commands_;
  std::optional<TemporaryFile> pidFile_;
  std::optional<TemporaryFile> readyFile_;
  std::optional<InputCommands> input_;
};

}  // namespace

void RunService(Options options, const std::function<void()>& ready) {
  std::signal(SIGPIPE, SIG_IGN);
  WarnLoudly(options);
  Service service(std::move(options));
  service.Announce(ready);
  service.WaitForEnd();
}

}  // namespace DevSts::Program
