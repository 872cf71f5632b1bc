#include "chaos/process_state.h"

#include <chrono>
#include <filesystem>
#include <fstream>
#include <system_error>
#include <thread>
#include <utility>

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;
namespace Files = std::filesystem;

constexpr auto kLimit = 20s;

bool IsWorker(const Files::path& task) {
  std::string name;
  std::getline(std::ifstream(task / "comm") >> std::ws, name);
  return name == "tarnik-worker" || name == "tarnik-lookup";
}

/// The count does not include descriptors that close while it is made, as that of the folder does.
std::map<int, std::string> OpenDescriptors() {
  std::map<int, std::string> descriptors;
  for (const auto& entry : Files::directory_iterator("/proc/self/fd")) {
    std::error_code error;
    const auto target = Files::read_symlink(entry.path(), error);
    if (!error && target.string().find("/fd") == std::string::npos) {
      descriptors.emplace(std::stoi(entry.path().filename()), target.string());
    }
  }
  return descriptors;
}

std::string Describe(const ProcessState& state) {
  std::string text = std::to_string(state.threads) + " threads, " + std::to_string(state.workers) +
                     " workers, descriptors";
  for (const auto& [descriptor, target] : state.descriptors) {
    text += " " + std::to_string(descriptor) + "=" + target;
  }
  return text;
}

}  // namespace

ProcessState ProcessState::Now() {
  ProcessState state;
  state.descriptors = OpenDescriptors();
  for (const auto& task : Files::directory_iterator("/proc/self/task")) {
    ++(IsWorker(task.path()) ? state.workers : state.threads);
  }
  return state;
}

ProcessState ProcessState::Settled() {
  ProcessState state = Now();
  for (int unchanged = 0; unchanged < 20; ++unchanged) {
    std::this_thread::sleep_for(5ms);
    ProcessState next = Now();
    if (next.threads != state.threads || next.descriptors != state.descriptors) {
      unchanged = 0;
    }
    state = std::move(next);
  }
  return state;
}

void RequireState(const Run& run, const ProcessState& before, bool areWorkersIncluded) {
  const auto deadline = std::chrono::steady_clock::now() + kLimit;
  for (;;) {
    const ProcessState now = ProcessState::Now();
    if (now.descriptors.size() == before.descriptors.size() && now.threads == before.threads &&
        (!areWorkersIncluded || now.workers == 0)) {
      return;
    }
    run.Require(std::chrono::steady_clock::now() < deadline,
                "the process is not as before: " + Describe(before) + "; now: " + Describe(now));
    std::this_thread::sleep_for(5ms);
  }
}

}  // namespace SsoClient::Testing
