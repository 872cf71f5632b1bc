#include "service/interruption.h"

#include <cerrno>
#include <system_error>

#include <sys/signalfd.h>
#include <unistd.h>

namespace SsoClient::Tool {
namespace {

constexpr int kSignalStatus = 128;

Descriptor ArrivalsOf(const sigset_t& signals) {
  Descriptor arrivals(signalfd(-1, &signals, SFD_CLOEXEC | SFD_NONBLOCK));
  if (arrivals.Get() < 0) {
    throw std::system_error(errno, std::generic_category(), "cannot wait for signals");
  }
  return arrivals;
}

sigset_t SignalsToHold() {
  sigset_t signals;
  sigemptyset(&signals);
  for (const int each : {SIGINT, SIGTERM, SIGHUP}) {
    struct sigaction action {};
    if (sigaction(each, nullptr, &action) == 0 && action.sa_handler != SIG_IGN) {
      sigaddset(&signals, each);
    }
  }
  return signals;
}

}  // namespace

Interruption::Interruption() : held_(SignalsToHold()), arrivals_(ArrivalsOf(held_)) {
  pthread_sigmask(SIG_BLOCK, &held_, &before_);
}

Interruption::~Interruption() {
  pthread_sigmask(SIG_SETMASK, &before_, nullptr);
}

int Interruption::Arrived() {
  signalfd_siginfo info{};
  return read(arrivals_.Get(), &info, sizeof info) == static_cast<ssize_t>(sizeof info)
             ? static_cast<int>(info.ssi_signo)
             : 0;
}

void Interruption::EndBy(int signal) {
  std::signal(signal, SIG_DFL);
  pthread_sigmask(SIG_SETMASK, &before_, nullptr);
  raise(signal);
  _exit(kSignalStatus + signal);  // the signal was held back before this object existed
}

}  // namespace SsoClient::Tool
