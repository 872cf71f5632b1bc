#include "replaced_calls.h"

#include <atomic>
#include <cerrno>
#include <condition_variable>
#include <mutex>
#include <system_error>
#include <utility>

#include <sys/socket.h>

namespace DevSts::Testing {
namespace {

struct AcceptPlan {
  std::mutex mutex;
  std::condition_variable changed;
  int family = AF_UNSPEC;
  std::vector<int> errors;
  std::vector<std::chrono::steady_clock::time_point> times;
};

AcceptPlan& Plan() {
  static AcceptPlan plan;
  return plan;
}

std::atomic<bool> hasThreads = true;

int FamilyOf(int socket) {
  sockaddr_storage address{};
  socklen_t size = sizeof address;
  return getsockname(socket, reinterpret_cast<sockaddr*>(&address), &size) == 0 ? address.ss_family
                                                                                : AF_UNSPEC;
}

// The error with which this call fails, or 0.
int NextError(int socket) {
  AcceptPlan& plan = Plan();
  const std::lock_guard lock(plan.mutex);
  if (plan.times.size() == plan.errors.size() || FamilyOf(socket) != plan.family) {
    return 0;
  }
  plan.times.push_back(std::chrono::steady_clock::now());
  plan.changed.notify_all();
  return plan.errors[plan.times.size() - 1];
}

}  // namespace

AcceptErrors::AcceptErrors(int family, std::vector<int> errors) {
  AcceptPlan& plan = Plan();
  const std::lock_guard lock(plan.mutex);
  plan.family = family;
  plan.errors = std::move(errors);
  plan.times.clear();
}

AcceptErrors::~AcceptErrors() {
  AcceptPlan& plan = Plan();
  const std::lock_guard lock(plan.mutex);
  plan.errors.clear();
  plan.times.clear();
}

std::vector<std::chrono::steady_clock::time_point> AcceptErrors::AwaitTimes() {
  AcceptPlan& plan = Plan();
  std::unique_lock lock(plan.mutex);
  plan.changed.wait_for(lock, std::chrono::seconds(30),
                        [&] { return plan.times.size() == plan.errors.size(); });
  return plan.times;
}

NoThreads::NoThreads() {
  hasThreads = false;
}

NoThreads::~NoThreads() {
  hasThreads = true;
}

}  // namespace DevSts::Testing

// The linker redirects the calls of this program to these functions (option --wrap).
extern "C" {

int __real_accept4(int socket, sockaddr* address, socklen_t* size, int flags);
int __wrap_accept4(int socket, sockaddr* address, socklen_t* size, int flags) {
  const int error = DevSts::Testing::NextError(socket);
  if (error != 0) {
    errno = error;
    return -1;
  }
  return __real_accept4(socket, address, size, flags);
}

// std::thread::_M_start_thread(std::unique_ptr<std::thread::_State>, void (*)()): this object and
// the address of the first argument.
void __real__ZNSt6thread15_M_start_threadESt10unique_ptrINS_6_StateESt14default_deleteIS1_EEPFvvE(
    void* thread, void* state, void (*depend)());
void __wrap__ZNSt6thread15_M_start_threadESt10unique_ptrINS_6_StateESt14default_deleteIS1_EEPFvvE(
    void* thread, void* state, void (*depend)()) {
  if (!DevSts::Testing::hasThreads) {
    throw std::system_error(std::make_error_code(std::errc::resource_unavailable_try_again));
  }
  __real__ZNSt6thread15_M_start_threadESt10unique_ptrINS_6_StateESt14default_deleteIS1_EEPFvvE(
      thread, state, depend);
}
}
