#include "line_output.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <climits>

#include <fcntl.h>
#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

namespace DevSts::Program {
namespace {

constexpr std::size_t kMaxKept = std::size_t{1} << 20U;
constexpr std::chrono::milliseconds kLastMoment{250};

bool TakesMore(int descriptor, std::chrono::milliseconds limit) {
  pollfd entry{descriptor, POLLOUT, 0};
  return poll(&entry, 1, static_cast<int>(limit.count())) > 0;
}

// The same pipe or terminal, opened once more so that writing to it does not wait. The flag for
// that must not be set for processes that share the descriptor. Without a number if it is another
// file.
Descriptor Unblocked(int descriptor) {
  struct stat found {};
  if (fstat(descriptor, &found) != 0 || (!S_ISFIFO(found.st_mode) && !S_ISCHR(found.st_mode))) {
    return {};
  }
  const std::string path = "/proc/self/fd/" + std::to_string(descriptor);
  return Descriptor(open(path.c_str(), O_WRONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
}

}  // namespace

LineOutput::LineOutput(int descriptor) : descriptor_(descriptor) {}

LineOutput::~LineOutput() {
  if (!started_) {
    return;
  }
  {
    const std::lock_guard lock(mutex_);
    stopped_ = true;
    Append("");
  }
  changed_.notify_all();
  woken_.Set();
  thread_.join();
  using Clock = std::chrono::steady_clock;
  const auto end = Clock::now() + kLastMoment;
  for (auto left = kLastMoment; !kept_.empty() && left.count() > 0;
       left = std::chrono::duration_cast<std::chrono::milliseconds>(end - Clock::now())) {
    if (TakesMore(descriptor_, left)) {
      WriteWhatIsTaken();
    }
  }
}

void LineOutput::Start() {
  thread_ = std::thread([this] { WriteUntilStopped(); });
  const std::lock_guard lock(mutex_);
  unblocked_ = Unblocked(descriptor_);
  descriptor_ = unblocked_.Get() >= 0 ? unblocked_.Get() : descriptor_;
  started_ = true;
  WriteWhatIsTaken();
  changed_.notify_all();
}

void LineOutput::Write(const std::string& line) {
  const std::lock_guard lock(mutex_);
  if (IsFull()) {
    ++lost_;
    return;
  }
  Append(line + "\n");
}

void LineOutput::WriteEach(const std::string& line) {
  std::unique_lock lock(mutex_);
  changed_.wait(lock, [this] { return waitsEnded_ || !IsFull(); });
  Append(line + "\n");
}

void LineOutput::EndWaits() {
  const std::lock_guard lock(mutex_);
  waitsEnded_ = true;
  changed_.notify_all();
}

bool LineOutput::IsFull() const {
  return kept_.size() > kMaxKept;
}

void LineOutput::Append(const std::string& line) {
  if (lost_ > 0) {
    kept_ += "requests-lost=" + std::to_string(lost_) + "\n";
    lost_ = 0;
  }
  kept_ += line;
  if (started_) {
    WriteWhatIsTaken();
    changed_.notify_all();
  }
}

void LineOutput::WriteWhatIsTaken() {
  constexpr std::size_t kAtOnce = PIPE_BUF;  // a pipe with any room takes so many octets
  std::size_t written = 0;
  while (written < kept_.size() && TakesMore(descriptor_, {})) {
    const ssize_t size =
        write(descriptor_, kept_.data() + written, std::min(kept_.size() - written, kAtOnce));
    if (size < 0 && errno == EAGAIN) {
      break;
    }
    if (size <= 0 && errno != EINTR) {
      written = kept_.size();  // the reader has gone
    }
    written += size > 0 ? static_cast<std::size_t>(size) : 0;
  }
  kept_.erase(0, written);
}

void LineOutput::WriteUntilStopped() {
  std::unique_lock lock(mutex_);
  for (;;) {
    changed_.wait(lock, [this] { return stopped_ || (started_ && !kept_.empty()); });
    if (stopped_) {
      return;
    }
    lock.unlock();
    std::array<pollfd, 2> entries{{{descriptor_, POLLOUT, 0}, {woken_.Get(), POLLIN, 0}}};
    poll(entries.data(), entries.size(), -1);
    lock.lock();
    WriteWhatIsTaken();
    changed_.notify_all();
  }
}

}  // namespace DevSts::Program
