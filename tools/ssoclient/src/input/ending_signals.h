#ifndef SSOCLIENT_TOOL_INPUT_ENDING_SIGNALS_H
#define SSOCLIENT_TOOL_INPUT_ENDING_SIGNALS_H

#include <array>
#include <csignal>

namespace SsoClient::Tool {

/// The signals with which users, systems and limits of time end a process that does not expect
/// them, and that it can catch. A limit may be inherited, such as an alarm set before exec.
inline constexpr std::array kEndingSignals{SIGINT,  SIGTERM,   SIGHUP,  SIGQUIT, SIGALRM,
                                           SIGXCPU, SIGVTALRM, SIGPROF, SIGUSR1, SIGUSR2};

}  // namespace SsoClient::Tool

#endif
