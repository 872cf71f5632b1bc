#include "options.h"

#include <array>
#include <functional>
#include <iostream>
#include <memory>
#include <stdexcept>

#include <CLI/CLI.hpp>
#include <arpa/inet.h>

#include "assertion_names.h"
#include "errors.h"
#include "help_texts.h"
#include "misbehavior_names.h"
#include "tls_names.h"

namespace DevSts::Program {
namespace {

using Texts = std::vector<std::string>;

// Options whose names are those of closed lists.
struct NamedOptions {
  Texts misbehavior;
  Texts tls;
  Texts assertion;
  Texts negotiation;
  bool requestsMic = false;
  bool resumesNothing = false;
};

// The help, with both forms of the command.
class BothUsages : public CLI::Formatter {
 public:
  std::string make_usage(const CLI::App* /*app*/, std::string /*name*/) const override {
    return "Usage: ssoclient-devsts [OPTIONS]\n  or:  ssoclient-devsts control PATH COMMAND...\n";
  }
};

// What a script writes for a variable that is not set.
std::string IsGiven(const std::string& text) {
  return text.empty() ? "The value is empty" : "";
}

CLI::Option* AddText(CLI::App& app, const char* name, std::string& target, const char* form,
                     const std::string& meaning, const char* group) {
  return app.add_option(name, target, meaning)->check(IsGiven)->option_text(form)->group(group);
}

// An option that may be repeated and has one value each time.
void AddTexts(CLI::App& app, const char* name, Texts& target, const char* form,
              const std::string& meaning, const char* group) {
  app.add_option(name, target, meaning)
      ->option_text(form)
      ->expected(1)
      ->allow_extra_args(false)
      ->take_all()
      ->group(group);
}

void AddPort(CLI::App& app, const char* name, std::uint16_t& target, const char* meaning) {
  app.add_option(name, target, meaning)
      ->check(CLI::Range(0, 65535))
      ->option_text("N")
      ->group("Listening");
}

void AddListening(CLI::App& app, Options& options) {
  AddPort(app, "--http-port", options.server.httpPort, "Port without TLS; 0 takes a free port");
  AddPort(app, "--https-port", options.server.httpsPort, "Port with TLS; 0 takes a free port");
  AddText(app, "--address", options.server.address, "ADDRESS",
          "Loopback address to listen on (127.0.0.1)", "Listening");
  app.add_flag("--expose-to-network", options.isExposed,
               "DANGEROUS: allows an --address that others can reach, although everybody knows "
               "the passwords")
      ->group("Listening");
}

void AddFiles(CLI::App& app, Options& options) {
  constexpr const char* kGroup = "Keys and certificates";
  AddText(app, "--state", options.stateFolder, "DIR",
          "Folder that keeps the keys: created at the first start and reused later", kGroup);
  AddText(app, "--out", options.outFolder, "DIR",
          "Folder to write ca.pem, signing.pem, client.pem and client-key.pem to", kGroup);
  app.add_flag("--signing-by-ca", options.signingByAuthority,
               "The CA issues the signing certificate, and ca.crl is written beside ca.pem")
      ->group(kGroup);
  AddText(app, "--issuer", options.server.issuer, "URI", "Issuer of the tokens", kGroup);
  AddText(app, "--vendor-host", options.server.vendorHost, "HOST",
          "Host in the names of the vendor's attributes", kGroup);
  AddText(app, "--solution-host", options.server.solutionHost, "HOST",
          "Host in the name of the solution-user attribute", kGroup);
}

void AddUserOptions(CLI::App& app, Options& options) {
  constexpr const char* kGroup = "Users and Kerberos";
  AddText(app, "--accounts", options.accountsFile, "FILE",
          "Users, groups and Kerberos; see --help-accounts", kGroup);
  auto* realm = app.add_flag("--realm", options.startsRealm,
                             "Starts a Kerberos realm with the users of EXAMPLE.COM, of whom the "
                             "first has a ticket")
                    ->option_text(" ")
                    ->group(kGroup);
  AddText(app, "--keytab", options.server.negotiation.keytab, "FILE",
          "Accepts logins in the realm that KRB5_CONFIG describes, with these keys", kGroup)
      ->excludes(realm);
  AddText(app, "--user-keytabs", options.userKeytabs, "DIR",
          "Folder that receives NAME.keytab for each user of the realm", kGroup);
  AddTexts(app, "--principal", options.principals, "NAME=USER",
           "The user of a Kerberos principal; may be repeated", kGroup);
}

void AddMisbehavior(CLI::App& app, NamedOptions& named) {
  constexpr const char* kGroup = "Misbehaviour (names: see --help-misbehaviour)";
  AddTexts(app, "--misbehave", named.misbehavior, "NAME[=VALUE]",
           "Misbehaves from the start; may be repeated", kGroup);
  AddTexts(app, "--tls", named.tls, "NAME[=VALUE]",
           "Server certificate and protocol; may be repeated", kGroup);
  AddTexts(app, "--assertion", named.assertion, "NAME=VALUE", "Form of the tokens; may be repeated",
           kGroup);
  AddTexts(app, "--negotiation", named.negotiation, "NAME[=VALUE]",
           "Course of Kerberos logins; may be repeated", kGroup);
  app.add_flag("--request-mic", named.requestsMic, "The same as --negotiation request-mic")
      ->group(kGroup);
  app.add_flag("--no-resumption", named.resumesNothing, "The same as --tls no-resumption")
      ->group(kGroup);
}

void AddRunning(CLI::App& app, Options& options) {
  constexpr const char* kGroup = "Running";
  AddText(app, "--control", options.controlPath, "PATH",
          "Unix socket for commands while it runs; see --help-control", kGroup);
  auto* withStdin = app.add_flag("--end-with-stdin", options.endsWithStdin,
                                 "Reads commands from standard input, and ends with it")
                        ->option_text(" ")
                        ->group(kGroup);
  app.add_flag("--background", options.inBackground,
               "Returns when the service is ready, which then runs in the background")
      ->option_text(" ")
      ->excludes(withStdin)
      ->group(kGroup);
  AddText(app, "--ready-file", options.readyFile, "FILE",
          "Receives the lines NAME=VALUE of the output when connections are accepted", kGroup);
  AddText(app, "--pid-file", options.pidFile, "FILE", "Receives the process ID", kGroup);
  auto* quiet = app.add_flag("--quiet", options.isQuiet, "Prints no line for each request")
                    ->option_text(" ")
                    ->group(kGroup);
  AddText(app, "--log", options.logFile, "FILE",
          "Appends the lines of requests to this file, which must not be a symbolic link", kGroup)
      ->excludes(quiet);
}

bool IsLoopback(const std::string& address) {
  in_addr four{};
  if (inet_pton(AF_INET, address.c_str(), &four) == 1) {
    return (ntohl(four.s_addr) >> 24U) == 127;
  }
  return address == "::1";
}

void RequireSafeAddress(const Options& options) {
  const std::string& address = options.server.address;
  std::array<char, sizeof(in6_addr)> octets{};
  if (inet_pton(AF_INET, address.c_str(), octets.data()) != 1 &&
      inet_pton(AF_INET6, address.c_str(), octets.data()) != 1) {
    throw UsageError("--address: '" + address + "' is not a numeric address");
  }
  if (!options.isExposed && !IsLoopback(address)) {
    throw UsageError("--address: others can reach " + address +
                     ", and this service is for tests only; --expose-to-network allows it");
  }
}

void TakeNamed(NamedOptions named, Options& options) {
  if (named.requestsMic) {
    named.negotiation.emplace_back("request-mic");
  }
  if (named.resumesNothing) {
    named.tls.emplace_back("no-resumption");
  }
  const std::array<std::pair<const char*, std::function<void()>>, 4> steps{{
      {"--misbehave", [&] { options.misbehavior = MisbehaviorFrom(named.misbehavior); }},
      {"--tls", [&] { options.server.tls = Applied(TlsNames(), named.tls); }},
      {"--assertion",
       [&] {
         options.server.assertion = Applied(AssertionNames(), named.assertion);
         RequireMatchingKey(options.server.assertion);
       }},
      {"--negotiation",
       [&] { options.negotiation = Applied(NegotiationNames(), named.negotiation); }},
  }};
  for (const auto& [option, take] : steps) {
    try {
      take();
    } catch (const std::invalid_argument& error) {
      throw UsageError(std::string(option) + ": " + error.what());
    }
  }
  options.misbehaves = !named.misbehavior.empty();
}

void MapPrincipals(Options& options) {
  for (const std::string& text : options.principals) {
    const std::size_t sign = text.find('=');
    if (sign == 0 || sign == std::string::npos || sign + 1 == text.size()) {
      throw UsageError("--principal: '" + text + "' is not NAME=USER");
    }
    options.server.negotiation.principals[text.substr(0, sign)] = text.substr(sign + 1);
  }
}

}  // namespace

std::optional<Options> ParseOptions(int argc, char** argv) {
  Options options;
  NamedOptions named;
  bool wantsMisbehavior = false;
  bool wantsControl = false;
  bool wantsAccounts = false;
  bool wantsVersion = false;

  CLI::App app(HelpBeforeOptions(), "ssoclient-devsts");
  app.formatter(std::make_shared<BothUsages>());
  app.get_formatter()->column_width(32);
  app.footer(HelpAfterOptions());
  app.set_help_flag("-h,--help", "Prints this help and ends");
  AddListening(app, options);
  AddFiles(app, options);
  AddUserOptions(app, options);
  AddMisbehavior(app, named);
  AddRunning(app, options);
  app.add_flag("--help-misbehaviour", wantsMisbehavior, "Prints the names of misbehaviour");
  app.add_flag("--help-control", wantsControl, "Prints the commands of the control socket");
  app.add_flag("--help-accounts", wantsAccounts, "Prints the form of the accounts file");
  app.add_flag("--version", wantsVersion, "Prints the version");
  try {
    app.parse(argc, argv);
  } catch (const CLI::CallForHelp&) {
    std::cout << app.help();
    return std::nullopt;
  } catch (const CLI::ParseError& error) {
    throw UsageError(error.what());
  }
  if (wantsMisbehavior || wantsControl || wantsAccounts || wantsVersion) {
    std::cout << (wantsMisbehavior ? MisbehaviorHelp() : "") << (wantsControl ? ControlHelp() : "")
              << (wantsAccounts ? AccountsHelp() : "") << (wantsVersion ? VersionText() : "");
    return std::nullopt;
  }
  TakeNamed(std::move(named), options);
  MapPrincipals(options);
  RequireSafeAddress(options);
  return options;
}

}  // namespace DevSts::Program
