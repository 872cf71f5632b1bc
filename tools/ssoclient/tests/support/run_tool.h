#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_RUN_TOOL_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_RUN_TOOL_H

#include <chrono>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <nlohmann/json_fwd.hpp>
#include <sys/types.h>

namespace SsoClient::Tool::Testing {

/// What one of the tool's standard streams is.
enum class Stream {
  kPipe,      ///< read and written by the test
  kTerminal,  ///< the pseudo-terminal
  kClosed,
  kFull,  ///< /dev/full, which accepts nothing
};

/// How the tool is run.
struct ToolOptions {
  std::vector<std::string> arguments{};
  /// What standard input contains, if it is a pipe.
  std::string input{};
  /// What else the tool can read: by the number of the descriptor, above 2.
  std::map<int, std::string> descriptors{};
  /// Changes of the environment; none removes a variable. The variables of the tool itself
  /// (SSOCLIENT_*), NO_COLOR and KRB5* are removed unless they are here, and TERM is "xterm".
  std::map<std::string, std::optional<std::string>> environment{};
  /// Runs in the child before the program, which other threads do not exist in: only functions that
  /// are async-signal-safe, such as umask and setrlimit.
  std::function<void()> prepare{};
  /// Whether the tool has a controlling terminal. Without one, it has none to ask at.
  bool hasTerminal = false;
  Stream in = Stream::kPipe;
  Stream out = Stream::kPipe;
  Stream err = Stream::kPipe;
};

/// How the tool has ended.
struct ToolResult {
  int status = -1;  ///< the exit status; 128 plus the signal that ended it
  int signal = 0;   ///< the signal that ended it, or 0
  std::string out{};
  std::string err{};
  /// All that was written to the terminal, as it was written.
  std::string terminal{};

  /// `out` as JSON. Throws an exception when it is not one JSON text.
  nlohmann::json Json() const;
};

/// A run of the tool, `SSOCLIENT_TOOL`, as the job of a session of its own, so that it can be
/// stopped and continued as by a shell. Used by one thread.
class ToolProcess {
 public:
  /// Throws `std::runtime_error` if it cannot be started.
  explicit ToolProcess(const ToolOptions& options);
  /// Kills it if it still runs.
  ~ToolProcess();
  ToolProcess(const ToolProcess&) = delete;
  ToolProcess& operator=(const ToolProcess&) = delete;

  pid_t Id() const { return process_; }
  /// Waits until the terminal, or `err` without one, has shown `text` after what an earlier call
  /// has waited for. False if the tool ends first, or after `limit`.
  bool WaitFor(const std::string& text, std::chrono::milliseconds limit = std::chrono::seconds(30));
  /// Types at the terminal: "\n" ends a line, "\x03" is Ctrl-C, "\x1a" Ctrl-Z.
  void Type(const std::string& text);
  void Signal(int signal) const;
  /// Waits until a signal has stopped it. False if it ends first.
  bool WaitUntilStopped();
  /// Closes the test's end of the tool's standard output, so that writing to it fails.
  void CloseOutput();
  /// Whether the terminal echoes what is typed.
  bool IsEchoing() const;
  /// Waits for the end. A tool that takes longer than `limit` is killed.
  ToolResult Finish(std::chrono::milliseconds limit = std::chrono::seconds(60));

 private:
  struct Source {
    int descriptor = -1;
    std::string* text = nullptr;
  };
  struct Sink {
    int descriptor = -1;
    std::string rest{};
  };

  void Pump(int milliseconds);
  void Read(Source& source) const;
  static void Write(Sink& sink);
  std::optional<int> NextStatus();

  pid_t leader_ = -1;
  pid_t process_ = -1;
  int terminal_ = -1;
  /// What the session's leader has reported about the tool.
  std::string statuses_{};
  std::vector<Source> sources_{};
  std::vector<Sink> sinks_{};
  std::size_t shown_ = 0;
  ToolResult result_{};
};

/// Runs the tool to its end.
ToolResult RunTool(const ToolOptions& options);
ToolResult RunTool(std::vector<std::string> arguments);

}  // namespace SsoClient::Tool::Testing

#endif
