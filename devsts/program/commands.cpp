#include "commands.h"

#include <algorithm>
#include <chrono>
#include <stdexcept>
#include <utility>

#include "accounts_file.h"
#include "assertion_names.h"
#include "command_line.h"
#include "misbehavior_names.h"
#include "report.h"
#include "tls_names.h"
#include "value_forms.h"
#include "vocabulary.h"

namespace DevSts::Program {
namespace {

constexpr std::size_t kAnyNumber = 1000;

std::vector<std::string> From(const std::vector<std::string>& words, std::size_t first) {
  return {words.begin() + static_cast<std::ptrdiff_t>(std::min(first, words.size())), words.end()};
}

}  // namespace

struct Commands::Command {
  const char* name;
  const char* arguments;
  const char* meaning;
  std::size_t least;  // numbers of arguments
  std::size_t most;
  std::string (Commands::*run)(const Arguments&);
};

const std::vector<Commands::Command>& Commands::All() {
  static const std::vector<Command> commands{
      {"misbehave", "[next N] NAME[=VALUE]...",
       "misbehaves from now on, or for the next N requests", 1, kAnyNumber, &Commands::Misbehave},
      {"clear", "", "ends all misbehaviour", 0, 0, &Commands::ClearMisbehavior},
      {"stall", "", "reads requests and never answers, like misbehave stall=before-answer", 0, 0,
       &Commands::Stall},
      {"resume", "", "ends what misbehave and stall have started; misbehave next N stays", 0, 0,
       &Commands::Resume},
      {"tls", "[NAME[=VALUE]...]", "replaces what --tls has set, for new connections", 0,
       kAnyNumber, &Commands::SetTls},
      {"assertion", "[NAME=VALUE...]", "replaces what --assertion has set", 0, kAnyNumber,
       &Commands::SetAssertion},
      {"negotiation", "[NAME[=VALUE]...]", "replaces what --negotiation has set", 0, kAnyNumber,
       &Commands::SetNegotiation},
      {"revoke", "ID", "revokes the token with this ID", 1, 1, &Commands::Revoke},
      {"revoke-certificate", "signing|server|client", "revokes a certificate in ca.crl", 1, 1,
       &Commands::RevokeCertificate},
      {"add-user", "NAME@DOMAIN KEY=VALUE...",
       "adds or replaces a user, with the keys of --accounts but certificate and principal", 2,
       kAnyNumber, &Commands::AddUser},
      {"set-password", "NAME@DOMAIN PASSWORD", "changes the password of a user", 2, 2,
       &Commands::SetPassword},
      {"remove-user", "NAME@DOMAIN", "removes a user", 1, 1, &Commands::RemoveUser},
      {"counters", "", "prints all counters", 0, 0, &Commands::ShowCounters},
      {"wait", "COUNTER N [TIME]", "waits until a counter is at least N, at most 10s or TIME", 2, 3,
       &Commands::Wait},
      {"requests", "", "prints the number of requests in the log", 0, 0, &Commands::ShowRequests},
      {"request", "N|last", "prints a request of the log, of which 1 is the oldest", 1, 1,
       &Commands::ShowRequest},
      {"clear-requests", "", "empties the log of requests", 0, 0, &Commands::ClearRequests},
      {"quit", "", "ends the service", 0, 0, &Commands::Quit},
  };
  return commands;
}

Commands::Commands(Server& server, Users users, const AssertionOptions& assertion,
                   Revocations revocations)
    : server_(server),
      signingKey_(assertion.signingKey),
      users_(std::move(users)),
      revocations_(std::move(revocations)) {}

std::string Commands::Help() {
  std::string text;
  for (const Command& command : All()) {
    const std::string arguments = command.arguments;
    text += DescribeWord(command.name + (arguments.empty() ? "" : " " + arguments), "",
                         command.meaning);
  }
  return text;
}

Commands::Answer Commands::Execute(const std::string& line) {
  try {
    const std::vector<std::string> words = WordsOf(line);
    if (words.empty()) {
      throw std::invalid_argument("there is no command");
    }
    for (const Command& command : All()) {
      if (words[0] != command.name) {
        continue;
      }
      if (words.size() - 1 < command.least || words.size() - 1 > command.most) {
        throw std::invalid_argument(std::string("usage: ") + command.name + " " +
                                    command.arguments);
      }
      return {"ok " + (this->*command.run)(From(words, 1)), words[0] == "quit"};
    }
    throw std::invalid_argument("unknown command: " + words[0]);
  } catch (const std::exception& error) {
    std::string message = error.what();
    std::replace(message.begin(), message.end(), '\n', ' ');
    return {"error " + message, false};
  }
}

std::string Commands::Misbehave(const Arguments& arguments) {
  if (arguments[0] != "next") {
    server_.SetMisbehavior(MisbehaviorFrom(arguments));
    return "misbehaving";
  }
  if (arguments.size() < 3) {
    throw std::invalid_argument("usage: misbehave next N NAME[=VALUE]...");
  }
  const std::uint64_t count = NumberFrom(arguments[1]);
  server_.MisbehaveNext(MisbehaviorFrom(From(arguments, 2)), static_cast<std::size_t>(count));
  return "misbehaving next " + arguments[1];
}

std::string Commands::ClearMisbehavior(const Arguments& /*arguments*/) {
  server_.ClearMisbehavior();
  return "cleared";
}

std::string Commands::Stall(const Arguments& /*arguments*/) {
  server_.SetMisbehavior(MisbehaviorFrom({"stall=before-answer"}));
  return "stalled";
}

std::string Commands::Resume(const Arguments& /*arguments*/) {
  server_.SetMisbehavior({});
  return "resumed";
}

std::string Commands::SetTls(const Arguments& arguments) {
  server_.SetTlsOptions(Applied(TlsNames(), arguments));
  return "tls set";
}

std::string Commands::SetAssertion(const Arguments& arguments) {
  AssertionOptions options;
  options.signingKey = signingKey_;
  options = Applied(AssertionNames(), arguments, std::move(options));
  if (options.signingKey != signingKey_) {
    throw std::invalid_argument("signing-key applies only at the start");
  }
  RequireMatchingKey(options);
  server_.SetAssertionOptions(std::move(options));
  return "assertion set";
}

std::string Commands::SetNegotiation(const Arguments& arguments) {
  server_.SetNegotiationScript(Applied(NegotiationNames(), arguments));
  return "negotiation set";
}

std::string Commands::Revoke(const Arguments& arguments) {
  if (!server_.Revoke(arguments[0])) {
    throw std::invalid_argument("no such token: " + arguments[0]);
  }
  return "revoked " + arguments[0];
}

std::string Commands::RevokeCertificate(const Arguments& arguments) {
  const std::lock_guard lock(mutex_);
  revocations_.Revoke(arguments[0]);
  return "revoked " + arguments[0];
}

std::string Commands::AddUser(const Arguments& arguments) {
  RequireUserName(arguments[0]);
  User user;
  for (const std::string& argument : From(arguments, 1)) {
    const std::size_t sign = argument.find('=');
    if (sign == std::string::npos || sign + 1 == argument.size() ||
        !SetUserProperty(argument.substr(0, sign), argument.substr(sign + 1), user)) {
      throw std::invalid_argument("'" + argument +
                                  "' is not KEY=VALUE with password, group, given-name, surname, "
                                  "solution or password-expired");
    }
  }
  const std::lock_guard lock(mutex_);
  const auto known = users_.find(arguments[0]);
  if (known != users_.end()) {
    user.certificates = known->second.certificates;
  }
  users_[arguments[0]] = std::move(user);
  server_.SetUsers(users_);
  return "added " + arguments[0];
}

std::string Commands::SetPassword(const Arguments& arguments) {
  const std::lock_guard lock(mutex_);
  const auto known = users_.find(arguments[0]);
  if (known == users_.end() || arguments[1].empty()) {
    throw std::invalid_argument(known == users_.end() ? "no such user: " + arguments[0]
                                                      : "the password is empty");
  }
  known->second.password = arguments[1];
  server_.SetUsers(users_);
  return "password set";
}

std::string Commands::RemoveUser(const Arguments& arguments) {
  const std::lock_guard lock(mutex_);
  if (users_.erase(arguments[0]) == 0) {
    throw std::invalid_argument("no such user: " + arguments[0]);
  }
  server_.SetUsers(users_);
  return "removed " + arguments[0];
}

std::string Commands::Wait(const Arguments& arguments) {
  constexpr std::chrono::milliseconds kSlice(100);
  using Clock = std::chrono::steady_clock;
  const std::string& name = arguments[0];
  const std::uint64_t least = NumberFrom(arguments[1]);
  const auto limit =
      Clock::now() + (arguments.size() > 2 ? TimeFrom(arguments[2]) : std::chrono::seconds(10));
  CounterNamed(name, server_.GetCounters());  // throws for an unknown name
  const auto reached = [&](const Counters& counters) {
    return CounterNamed(name, counters) >= least;
  };
  while (!server_.WaitUntil(reached, kSlice)) {
    if (stopped_ || Clock::now() >= limit) {
      throw std::invalid_argument("not reached: " + DescribeCounters(server_.GetCounters()));
    }
  }
  return name + "=" + std::to_string(CounterNamed(name, server_.GetCounters()));
}

std::string Commands::ShowCounters(const Arguments& /*arguments*/) {
  return DescribeCounters(server_.GetCounters());
}

std::string Commands::ShowRequests(const Arguments& /*arguments*/) {
  return "requests=" + std::to_string(server_.Requests().size());
}

std::string Commands::ShowRequest(const Arguments& arguments) {
  const std::vector<ReceivedRequest> requests = server_.Requests();
  const std::uint64_t number = arguments[0] == "last" ? requests.size() : NumberFrom(arguments[0]);
  if (number == 0 || number > requests.size()) {
    throw std::invalid_argument("there are " + std::to_string(requests.size()) + " requests");
  }
  return DescribeRequest(requests[static_cast<std::size_t>(number - 1)]);
}

std::string Commands::ClearRequests(const Arguments& /*arguments*/) {
  server_.ClearRequests();
  return "cleared";
}

std::string Commands::Quit(const Arguments& /*arguments*/) {
  return "quitting";
}

}  // namespace DevSts::Program
