#ifndef DEVSTS_PROGRAM_OPTIONS_H
#define DEVSTS_PROGRAM_OPTIONS_H

#include <optional>
#include <string>
#include <vector>

#include "devsts/server.h"

namespace DevSts::Program {

struct Options {
  ServerOptions server;
  std::vector<std::string> principals;  // NAME=USER
  Misbehavior misbehavior;
  NegotiationScript negotiation;
  std::string outFolder;
  std::string stateFolder;
  std::string accountsFile;
  std::string userKeytabs;
  std::string controlPath;
  std::string readyFile;
  std::string pidFile;
  std::string logFile;
  bool signingByAuthority = false;
  bool startsRealm = false;
  bool endsWithStdin = false;
  bool isQuiet = false;
  bool inBackground = false;
  bool misbehaves = false;
  bool isExposed = false;
};

// What the arguments request. Without options, the request was for a text, such as the help, which
// has been printed. Throws UsageError.
std::optional<Options> ParseOptions(int argc, char** argv);

}  // namespace DevSts::Program

#endif
