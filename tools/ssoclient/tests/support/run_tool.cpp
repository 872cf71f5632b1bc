#include "support/run_tool.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string_view>

#include <fcntl.h>
#include <nlohmann/json.hpp>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/wait.h>
#include <termios.h>
#include <unistd.h>

namespace SsoClient::Tool::Testing {
namespace {

constexpr int kFirstFree = 100;  // above the descriptors of tests

void Check(bool isDone, const char* what) {
  if (!isDone) {
    throw std::runtime_error(std::string(what) + ": " + std::strerror(errno));
  }
}

/// Descriptors that are closed with it, each above those that a child uses.
class Descriptors {
 public:
  Descriptors() = default;
  ~Descriptors() {
    for (const int each : all_) {
      close(each);
    }
  }
  Descriptors(const Descriptors&) = delete;
  Descriptors& operator=(const Descriptors&) = delete;

  int Add(int descriptor) {
    Check(descriptor >= 0, "cannot open");
    const int high = fcntl(descriptor, F_DUPFD_CLOEXEC, kFirstFree);
    close(descriptor);
    Check(high >= 0, "fcntl");
    all_.push_back(high);
    return high;
  }
  void Release(int descriptor) { std::erase(all_, descriptor); }

 private:
  std::vector<int> all_{};
};

bool StartsWithAny(std::string_view text, const std::vector<std::string_view>& beginnings) {
  return std::any_of(beginnings.begin(), beginnings.end(),
                     [&](std::string_view each) { return text.starts_with(each); });
}

std::vector<std::string> MakeEnvironment(const ToolOptions& options) {
  std::vector<std::string> result{"TERM=xterm"};
  for (char** each = environ; *each != nullptr; ++each) {
    const std::string variable = *each;
    const std::string name = variable.substr(0, variable.find('='));
    const bool isOwn = StartsWithAny(name, {"SSOCLIENT_", "NO_COLOR", "KRB5", "TERM"});
    if (!isOwn && !options.environment.contains(name)) {
      result.push_back(variable);
    }
  }
  for (const auto& [name, value] : options.environment) {
    std::erase_if(result, [&](const std::string& each) { return each.starts_with(name + "="); });
    if (value) {
      result.push_back(name + "=" + *value);
    }
  }
  return result;
}

std::vector<char*> ToPointers(std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  for (std::string& each : texts) {
    pointers.push_back(each.data());
  }
  pointers.push_back(nullptr);
  return pointers;
}

struct Plan {
  std::vector<char*> arguments;
  std::vector<char*> environment;
  std::vector<std::pair<int, int>> descriptors;  // in the child, and here; negative is closed
  int terminal = -1;
  int statuses = -1;
  const ToolOptions* options = nullptr;
};

[[noreturn]] void RunJob(const Plan& plan) {
  setpgid(0, 0);
  if (plan.terminal >= 0) {
    // With SIGTTOU blocked, a job in the background may do that.
    tcsetpgrp(plan.terminal, getpid());
  }
  for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGPIPE, SIGTSTP, SIGXFSZ}) {
    ::signal(signal, SIG_DFL);
  }
  sigset_t none;
  sigemptyset(&none);
  sigprocmask(SIG_SETMASK, &none, nullptr);
  for (const auto& [number, descriptor] : plan.descriptors) {
    if (descriptor < 0) {
      close(number);
    } else {
      dup2(descriptor, number);
    }
  }
  if (plan.options->prepare) {
    plan.options->prepare();
  }
  execve(SSOCLIENT_TOOL, plan.arguments.data(), plan.environment.data());
  _exit(127);
}

void Report(const Plan& plan, int value) {
  if (write(plan.statuses, &value, sizeof value) != static_cast<ssize_t>(sizeof value)) {
    _exit(126);
  }
}

// The session's leader, as a shell: a job without a parent in its session cannot be stopped.
[[noreturn]] void RunLeader(const Plan& plan) {
  sigset_t all;
  sigfillset(&all);
  sigprocmask(SIG_SETMASK, &all, nullptr);
  setsid();
  if (plan.terminal >= 0) {
    ioctl(plan.terminal, TIOCSCTTY, 0);
  }
  const pid_t job = _Fork();
  if (job == 0) {
    RunJob(plan);
  }
  if (job < 0) {
    _exit(1);
  }
  close_range(0, static_cast<unsigned>(plan.statuses) - 1, 0);
  close_range(static_cast<unsigned>(plan.statuses) + 1, ~0U, 0);
  Report(plan, job);
  for (;;) {
    int status = 0;
    if (waitpid(job, &status, WUNTRACED) != job) {
      _exit(1);
    }
    Report(plan, status);
    if (!WIFSTOPPED(status)) {
      _exit(0);
    }
  }
}

std::array<int, 2> MakePipe(Descriptors& descriptors) {
  std::array<int, 2> ends{};
  Check(pipe2(ends.data(), O_CLOEXEC) == 0, "pipe2");
  return {descriptors.Add(ends[0]), descriptors.Add(ends[1])};
}

}  // namespace

nlohmann::json ToolResult::Json() const {
  return nlohmann::json::parse(out);
}

ToolProcess::ToolProcess(const ToolOptions& options) {
  std::signal(SIGPIPE, SIG_IGN);  // the tool may end before it has read its input
  Descriptors open;
  std::vector<std::string> arguments{SSOCLIENT_TOOL};
  arguments.insert(arguments.end(), options.arguments.begin(), options.arguments.end());
  std::vector<std::string> environment = MakeEnvironment(options);
  Plan plan{.arguments = ToPointers(arguments),
            .environment = ToPointers(environment),
            .descriptors = {},
            .options = &options};

  const auto statuses = MakePipe(open);
  plan.statuses = statuses[1];
  sources_.push_back({statuses[0], &statuses_});
  if (options.hasTerminal) {
    terminal_ = open.Add(posix_openpt(O_RDWR | O_NOCTTY | O_CLOEXEC));
    std::array<char, 64> name{};
    Check(grantpt(terminal_) == 0 && unlockpt(terminal_) == 0, "unlockpt");
    Check(ptsname_r(terminal_, name.data(), name.size()) == 0, "ptsname");
    plan.terminal = open.Add(::open(name.data(), O_RDWR | O_NOCTTY | O_CLOEXEC));
    sources_.push_back({terminal_, &result_.terminal});
  }
  const auto addInput = [&](int number, const std::string& text) {
    const auto ends = MakePipe(open);
    plan.descriptors.emplace_back(number, ends[0]);
    sinks_.push_back({ends[1], text});
  };
  const auto addOutput = [&](int number, std::string& text) {
    const auto ends = MakePipe(open);
    plan.descriptors.emplace_back(number, ends[1]);
    sources_.push_back({ends[0], &text});
  };
  const std::array streams{options.in, options.out, options.err};
  for (int number = 0; number < 3; ++number) {
    switch (streams[static_cast<std::size_t>(number)]) {
      case Stream::kPipe:
        number == 0 ? addInput(0, options.input)
                    : addOutput(number, number == 1 ? result_.out : result_.err);
        break;
      case Stream::kTerminal:
        plan.descriptors.emplace_back(number, plan.terminal);
        break;
      case Stream::kClosed:
        plan.descriptors.emplace_back(number, -1);
        break;
      case Stream::kFull:
        plan.descriptors.emplace_back(number, open.Add(::open("/dev/full", O_RDWR | O_CLOEXEC)));
        break;
    }
  }
  for (const auto& [number, text] : options.descriptors) {
    addInput(number, text);
  }

  leader_ = _Fork();
  if (leader_ == 0) {
    RunLeader(plan);
  }
  Check(leader_ > 0, "fork");
  for (const Source& source : sources_) {
    open.Release(source.descriptor);
  }
  for (const Sink& sink : sinks_) {
    open.Release(sink.descriptor);
    fcntl(sink.descriptor, F_SETFL, O_NONBLOCK);
  }
  while (!(process_ > 0) && sources_.front().descriptor >= 0) {
    Pump(100);
    process_ = NextStatus().value_or(-1);
  }
  if (!(process_ > 0)) {
    Finish();
    throw std::runtime_error("the tool was not started");
  }
}

ToolProcess::~ToolProcess() {
  if (leader_ > 0) {
    Signal(SIGKILL);
    Finish();
  }
}

void ToolProcess::Read(Source& source) const {
  std::array<char, 4096> buffer{};
  const ssize_t size = read(source.descriptor, buffer.data(), buffer.size());
  if (size > 0) {
    source.text->append(buffer.data(), static_cast<std::size_t>(size));
  } else if (size == 0 || errno != EINTR) {
    // Reading from a terminal fails when nobody has its other end (EIO).
    if (source.descriptor != terminal_) {
      close(source.descriptor);
    }
    source.descriptor = -1;
  }
}

void ToolProcess::Write(Sink& sink) {
  const ssize_t size = write(sink.descriptor, sink.rest.data(), sink.rest.size());
  if (size >= 0) {
    sink.rest.erase(0, static_cast<std::size_t>(size));
  }
  if (sink.rest.empty() || (size < 0 && errno != EAGAIN && errno != EINTR)) {
    close(sink.descriptor);
    sink.descriptor = -1;
  }
}

void ToolProcess::Pump(int milliseconds) {
  std::vector<pollfd> waiting;
  for (const Source& each : sources_) {
    waiting.push_back({each.descriptor, POLLIN, 0});
  }
  for (const Sink& each : sinks_) {
    waiting.push_back({each.descriptor, POLLOUT, 0});
  }
  poll(waiting.data(), waiting.size(), milliseconds);
  for (std::size_t i = 0; i < waiting.size(); ++i) {
    if (waiting[i].revents == 0) {
      continue;
    }
    i < sources_.size() ? Read(sources_[i]) : Write(sinks_[i - sources_.size()]);
  }
}

bool ToolProcess::WaitFor(const std::string& text, std::chrono::milliseconds limit) {
  const auto end = std::chrono::steady_clock::now() + limit;
  const std::string& shown = terminal_ >= 0 ? result_.terminal : result_.err;
  const Source& source = *std::find_if(sources_.begin(), sources_.end(),
                                       [&](const Source& each) { return each.text == &shown; });
  for (;;) {
    const std::size_t place = shown.find(text, shown_);
    if (place != std::string::npos) {
      shown_ = place + text.size();
      return true;
    }
    if (source.descriptor < 0 || std::chrono::steady_clock::now() >= end) {
      return false;
    }
    Pump(100);
  }
}

void ToolProcess::Type(const std::string& text) {
  Check(write(terminal_, text.data(), text.size()) == static_cast<ssize_t>(text.size()), "type");
}

void ToolProcess::Signal(int signal) const {
  // Other numbers would be groups of processes, or all of them.
  if (process_ > 0) {
    kill(process_, signal);
  }
}

std::optional<int> ToolProcess::NextStatus() {
  int status = 0;
  if (statuses_.size() < sizeof status) {
    return std::nullopt;
  }
  std::memcpy(&status, statuses_.data(), sizeof status);
  statuses_.erase(0, sizeof status);
  return status;
}

bool ToolProcess::WaitUntilStopped() {
  while (statuses_.empty() && sources_.front().descriptor >= 0) {
    Pump(100);
  }
  const std::optional<int> status = NextStatus();
  return status && WIFSTOPPED(*status);
}

void ToolProcess::CloseOutput() {
  for (Source& source : sources_) {
    if (source.text == &result_.out && source.descriptor >= 0) {
      close(source.descriptor);
      source.descriptor = -1;
    }
  }
}

bool ToolProcess::IsEchoing() const {
  termios settings{};
  Check(tcgetattr(terminal_, &settings) == 0, "tcgetattr");
  return (settings.c_lflag & ECHO) != 0;
}

ToolResult ToolProcess::Finish(std::chrono::milliseconds limit) {
  const auto end = std::chrono::steady_clock::now() + limit;
  const auto isOpen = [](const Source& each) { return each.descriptor >= 0; };
  // Each source ends when the tool and the leader have ended.
  while (std::any_of(sources_.begin(), sources_.end(), isOpen)) {
    if (std::chrono::steady_clock::now() >= end) {
      Signal(SIGKILL);
    }
    Pump(100);
  }
  waitpid(std::exchange(leader_, -1), nullptr, 0);
  int status = -1;
  while (const std::optional<int> next = NextStatus()) {
    status = *next;
  }
  for (const Sink& sink : sinks_) {
    if (sink.descriptor >= 0) {
      close(sink.descriptor);
    }
  }
  sinks_.clear();
  if (terminal_ >= 0) {
    close(std::exchange(terminal_, -1));
  }
  result_.signal = WIFSIGNALED(status) ? WTERMSIG(status) : 0;
  result_.status = WIFSIGNALED(status) ? 128 + result_.signal : WEXITSTATUS(status);
  return result_;
}

ToolResult RunTool(const ToolOptions& options) {
  return ToolProcess(options).Finish();
}

ToolResult RunTool(std::vector<std::string> arguments) {
  ToolOptions options;
  options.arguments = std::move(arguments);
  return RunTool(options);
}

}  // namespace SsoClient::Tool::Testing
