#ifndef DEVSTS_PROGRAM_COMMANDS_H
#define DEVSTS_PROGRAM_COMMANDS_H

#include <atomic>
#include <mutex>
#include <string>
#include <vector>

#include "devsts/server.h"
#include "revocations.h"

namespace DevSts::Program {

// Executes the commands of the control socket and of standard input. Thread-safe.
class Commands {
 public:
  struct Answer {
    std::string line;  // "ok ..." or "error ..."
    bool quits = false;
  };

  // `users` and `assertion` are those of the server.
  Commands(Server& server, Users users, const AssertionOptions& assertion, Revocations revocations);

  Answer Execute(const std::string& line);
  // Ends the commands that wait.
  void Stop() { stopped_ = true; }

  // A list of the commands.
  static std::string Help();

 private:
  using Arguments = std::vector<std::string>;
  struct Command;
  static const std::vector<Command>& All();

  std::string Misbehave(const Arguments& arguments);
  std::string ClearMisbehavior(const Arguments& arguments);
  std::string Stall(const Arguments& arguments);
  std::string Resume(const Arguments& arguments);
  std::string SetTls(const Arguments& arguments);
  std::string SetAssertion(const Arguments& arguments);
  std::string SetNegotiation(const Arguments& arguments);
  std::string Revoke(const Arguments& arguments);
  std::string RevokeCertificate(const Arguments& arguments);
  std::string AddUser(const Arguments& arguments);
  std::string SetPassword(const Arguments& arguments);
  std::string RemoveUser(const Arguments& arguments);
  std::string Wait(const Arguments& arguments);
  std::string ShowCounters(const Arguments& arguments);
  std::string ShowRequests(const Arguments& arguments);
  std::string ShowRequest(const Arguments& arguments);
  std::string ClearRequests(const Arguments& arguments);
  std::string Quit(const Arguments& arguments);

  Server& server_;
  const KeyType signingKey_;
  std::atomic<bool> stopped_ = false;
  std::mutex mutex_;  // of the members below
  Users users_;
  Revocations revocations_;
};

}  // namespace DevSts::Program

#endif
