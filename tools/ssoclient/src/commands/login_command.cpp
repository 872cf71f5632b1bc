#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include <ssoclient/saml_token_factory.h>
#include <ssoclient/security_token_service.h>
#include <tarnik/system/date_time.h>

#include "commands/commands.h"
#include "commands/token_output.h"
#include "failure.h"
#include "input/private_file.h"
#include "input/secret.h"
#include "input/standard_input.h"
#include "options/kerberos_options.h"
#include "options/key_options.h"
#include "options/request_options.h"
#include "options/service_options.h"
#include "service/service_call.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::System::GetUtcDateTime;
using Token = std::shared_ptr<const SamlToken>;

class LoginCommand final : public Command {
 public:
  CLI::App* AddTo(CLI::App& program) override;
  Outcome Run(const Console& console) override;

 private:
  void CheckLogin() const;
  ServiceSetup MakeSetup() const;
  Token Login(const Console& console, const ServiceSetup& setup, const TokenSpec& spec) const;
  Token LoginByAny(const Console& console, const ServiceSetup& setup, const TokenSpec& spec) const;
  Token LoginByPassword(const Console& console, ServiceSetup setup, const TokenSpec& spec) const;

  ServiceOptions service_;
  RequestOptions request_;
  KeyOptions key_;
  KerberosOptions kerberos_;
  SecretOption password_;
  TokenOutput output_;
  std::string user_;
  bool mayBeOpen_ = false;
};

CLI::App* LoginCommand::AddTo(CLI::App& program) {
  CLI::App* const command = program.add_subcommand(
      "login",
      "Log in and write the token to a file\n"
      "Asks the service for a token: with a user name and a password (--user), with a key "
      "(--certificate), or with Kerberos (--kerberos). With --certificate beside one of the "
      "others, the token is bound to the key. The password is asked for at the terminal, or read "
      "from a file or a descriptor. The token is verified before it is written.");
  SetExample(*command,
             "ssoclient login --url https://sts.example.com/sts --sts-certificate sts.pem \\\n"
             "    --user alice@EXAMPLE.COM --output token.xml");
  service_.AddConnectionTo(*command);
  service_.AddSignersTo(*command);
  const std::string group = "Login";
  CLI::Option* const user =
      command->add_option("--user", user_, "Log in with this user name and a password");
  user->type_name("NAME")->group(group);
  password_.AddTo(*command, "password", group);
  kerberos_.AddTo(*command, group)->excludes(user);
  key_.AddTo(*command, false);
  request_.AddTo(*command);
  request_.AddConfirmationTo(*command);
  output_.AddTo(*command,
                "Write the token to this file, which only its owner can read; without it or with "
                "-, to standard output, unless that is a terminal");
  AddOpenFilesOption(*command, mayBeOpen_);
  AddJsonOption(*command);
  return command;
}

[[noreturn]] void FailUsage(KindName kind, const std::string& message, const std::string& remedy) {
  throw ToolException({ExitStatus::kUsage, kind, message, remedy});
}

void LoginCommand::CheckLogin() const {
  const bool isByKey = user_.empty() && !kerberos_.IsGiven();
  if (isByKey && !key_.IsGiven()) {
    FailUsage("no-login", "it is not clear who logs in", "use --user, --certificate or --kerberos");
  }
  if (user_.empty() && password_.IsGiven()) {
    FailUsage("no-user", "a password needs a user", "use --user");
  }
  if (isByKey && request_.WantsBearer()) {
    FailUsage("bearer-by-key", "a login with only a key gives a token that is bound to the key",
              "omit --bearer");
  }
  if (request_.WantsHolderOfKey() && !key_.IsGiven()) {
    FailUsage("no-key", "there is no key that the token could be bound to", "use --certificate");
  }
}

ServiceSetup LoginCommand::MakeSetup() const {
  ServiceSetup setup = service_.MakeSetup();
  setup.tokenFactory = CreateSamlTokenFactory(service_.Signers().get());
  if (key_.IsGiven()) {
    setup.holderOfKey = key_.Load(mayBeOpen_);
  }
  return setup;
}

Token LoginCommand::LoginByPassword(const Console& console, ServiceSetup setup,
                                    const TokenSpec& spec) const {
  const auto password =
      std::make_shared<SecretText>(password_.Read("Password for " + user_ + ": ", mayBeOpen_));
  setup.secret = password->Text();
  return RunCall<Token>(console, setup,
                        [user = user_, password, spec](const SecurityTokenService& service) {
                          return service.AcquireToken(user, password->Text(), spec);
                        });
}

Token LoginCommand::Login(const Console& console, const ServiceSetup& setup,
                          const TokenSpec& spec) const {
  try {
    return LoginByAny(console, setup, spec);
  } catch (const ToolException& exception) {
    RethrowWithRemedy(exception, spec, nullptr);
  }
}

Token LoginCommand::LoginByAny(const Console& console, const ServiceSetup& setup,
                               const TokenSpec& spec) const {
  if (kerberos_.IsGiven()) {
    return RunCall<Token>(console, setup,
                          [handler = kerberos_.MakeHandler(setup.address.host, mayBeOpen_),
                           spec](const SecurityTokenService& service) {
                            return service.AcquireTokenByGSS(spec, *handler);
                          });
  }
  if (!user_.empty()) {
    return LoginByPassword(console, setup, spec);
  }
  return RunCall<Token>(console, setup, [spec](const SecurityTokenService& service) {
    return service.AcquireTokenByCertificate(spec);
  });
}

Outcome LoginCommand::Run(const Console& console) {
  CheckLogin();
  CheckStandardInput({request_.ActAsInput()},
                     {{"--password-fd", password_.IsStandardInput()}, key_.PassphraseInput()});
  output_.SetDefault("-");
  output_.Check(WantsJson());
  const ServiceSetup setup = MakeSetup();
  const TokenSpec spec = request_.MakeSpec(mayBeOpen_);
  const Token token = Login(console, setup, spec);
  // Only a login with nothing but the key binds a token on behalf of somebody to it.
  const bool isByKey = user_.empty() && !kerberos_.IsGiven();
  const bool isBearer = !key_.IsGiven() || request_.WantsBearer() || (spec.actAsToken && !isByKey);
  return output_.Deliver(console, *token, FindDeviations(*token, spec, isBearer, GetUtcDateTime()),
                         WantsJson());
}

}  // namespace

std::unique_ptr<Command> MakeLoginCommand() {
  return std::make_unique<LoginCommand>();
}

}  // namespace SsoClient::Tool
