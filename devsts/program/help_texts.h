#ifndef DEVSTS_PROGRAM_HELP_TEXTS_H
#define DEVSTS_PROGRAM_HELP_TEXTS_H

#include <string>

namespace DevSts::Program {

// What the help prints before and after the options.
std::string HelpBeforeOptions();
std::string HelpAfterOptions();

std::string MisbehaviorHelp();
std::string ControlHelp();
std::string AccountsHelp();

std::string VersionText();

}  // namespace DevSts::Program

#endif
