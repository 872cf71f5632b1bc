#include "chaos/clock_jump.h"

#include <atomic>
#include <ctime>

#include <sys/time.h>

namespace SsoClient::Testing {
namespace {

constinit std::atomic<std::time_t> clockOffset{0};

timespec ShiftedTime() noexcept {
  timespec now = {};
  clock_gettime(CLOCK_REALTIME, &now);
  now.tv_sec += clockOffset.load();
  return now;
}

}  // namespace

void SetClockOffset(std::chrono::seconds offset) noexcept {
  clockOffset = offset.count();
}

}  // namespace SsoClient::Testing

// These take the place of the functions of the shared libraries in the whole program.
extern "C" {

[[gnu::visibility("default")]] std::time_t time(std::time_t* result) noexcept {
  const std::time_t now = SsoClient::Testing::ShiftedTime().tv_sec;
  if (result != nullptr) {
    *result = now;
  }
  return now;
}

[[gnu::visibility("default")]] int gettimeofday(timeval* result, void* /*zone*/) noexcept {
  const timespec now = SsoClient::Testing::ShiftedTime();
  *result = {now.tv_sec, now.tv_nsec / 1000};
  return 0;
}
}

std::chrono::system_clock::time_point std::chrono::system_clock::now() noexcept {
  const timespec now = SsoClient::Testing::ShiftedTime();
  return time_point(std::chrono::seconds(now.tv_sec) + std::chrono::nanoseconds(now.tv_nsec));
}
