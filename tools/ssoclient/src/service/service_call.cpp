#include "service/service_call.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <exception>
#include <system_error>

#include <poll.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <ssoclient/security_token_service_config.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/system/thread_pool.h>

#include "failure.h"
#include "output/progress.h"
#include "service/call_failure.h"
#include "service/exchange_notes.h"
#include "service/interruption.h"
#include "service/library_log.h"

namespace SsoClient::Tool {
namespace {

using Clock = Tarnik::Http::CallLimit::Clock;
using Tarnik::Ref;
using Tarnik::Http::ExchangeStage;

// Shorter waits are not worth a line.
constexpr std::chrono::seconds kProgressAfter{2};
constexpr std::chrono::milliseconds kProgressInterval{500};
// An operation that the limit has ended has this long to return.
constexpr std::chrono::milliseconds kGrace{500};

std::atomic<bool> isCallAbandoned = false;

/// A call under way, which the thread that runs it and the one that waits for it share.
struct Call {
  Ref<Tarnik::Http::CallLimit> limit;
  std::shared_ptr<SecurityTokenService> service;
  std::shared_ptr<ExchangeNotes> notes;
  std::function<void(const SecurityTokenService&)> operation;
  std::exception_ptr failure;
  Descriptor ended;
  std::atomic<bool> hasEnded = false;

  Call() : notes(std::make_shared<ExchangeNotes>()), ended(eventfd(0, EFD_CLOEXEC)) {
    if (ended.Get() < 0) {
      throw std::system_error(errno, std::generic_category(), "cannot wait for the service");
    }
  }

  void Run() {
    try {
      operation(*service);
    } catch (...) {
      failure = std::current_exception();
    }
    hasEnded = true;
    const std::uint64_t one = 1;
    RetryInterrupted([&] { return write(ended.Get(), &one, sizeof one); });
  }
};

Ref<Tarnik::Http::UserAgent> MakeUserAgent(const ServiceSetup& setup, Call& call) {
  const auto spec = MakeConnectionSpec(setup.address, setup.sslContext.get(), setup.peerName);
  // The legs of a negotiation belong together by cookies.
  const auto cookies = Tarnik::Http::CreateCookieStore("");
  const auto agent = Tarnik::Http::CreateHttpUserAgent(spec.get(), cookies.get(), nullptr);
  const auto bounded = Tarnik::Http::CreateBoundedUserAgent(agent.get(), call.limit.get());
  return CreateNotingUserAgent(bounded.get(), call.notes);
}

std::shared_ptr<SecurityTokenService> MakeService(const ServiceSetup& setup, Call& call) {
  SecurityTokenServiceConfigEx config;
  config.url = setup.address.target;
  config.tokenFactory = setup.tokenFactory;
  config.holderOfKeyConfig = setup.holderOfKey;
  config.userAgent = MakeUserAgent(setup, call);
  return CreateSecurityTokenService(config);
}

const char* TextOf(ExchangeStage stage) {
  switch (stage) {
    case ExchangeStage::kLookUp:
      return "looking up the host";
    case ExchangeStage::kConnection:
      return "connecting";
    case ExchangeStage::kHandshake:
      return "waiting for the TLS handshake";
    case ExchangeStage::kSending:
      return "sending the request";
    case ExchangeStage::kAnswer:
      return "waiting for the answer";
    case ExchangeStage::kRestOfAnswer:
      return "receiving the answer";
    case ExchangeStage::kNone:
      break;
  }
  return "working";  // in the Kerberos library, for example
}

std::string ProgressText(const Call& call, Clock::duration passed, double timeoutSec) {
  const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(passed).count();
  return std::string("ssoclient: ") + TextOf(call.limit->Stage()) + " (" + std::to_string(seconds) +
         " s of " + std::to_string(std::lround(timeoutSec)) + " s)";
}

// Waits until the call has ended, `signals` is readable (if it is not negative), or for `duration`.
void WaitOnce(const Call& call, int signals, Clock::duration duration) {
  std::array waiting{pollfd{.fd = call.ended.Get(), .events = POLLIN, .revents = 0},
                     pollfd{.fd = signals, .events = POLLIN, .revents = 0}};
  const auto wait = std::chrono::ceil<std::chrono::milliseconds>(duration).count();
  poll(waiting.data(), waiting.size(), static_cast<int>(std::max<std::int64_t>(wait, 0)));
}

void WaitUntil(const Call& call, Clock::time_point end) {
  while (!call.hasEnded && Clock::now() < end) {
    WaitOnce(call, -1, end - Clock::now());
  }
}

// Returns the signal that has ended the wait, or 0 when the call has ended or its time is over.
int WaitForEnd(const Console& console, const Call& call, Interruption& interruption,
               double timeoutSec) {
  ProgressLine progress(console);
  const Clock::time_point begun = Clock::now();
  const Clock::time_point end = call.limit->Deadline() + kGrace;
  Clock::time_point shown = begun + kProgressAfter;
  while (!call.hasEnded && Clock::now() < end) {
    if (const int signal = interruption.Arrived()) {
      return signal;
    }
    const Clock::time_point now = Clock::now();
    if (now >= shown) {
      progress.Show(ProgressText(call, now - begun, timeoutSec));
      shown = now + kProgressInterval;
    }
    WaitOnce(call, interruption.Waitable(), std::min(shown, end) - now);
  }
  return 0;
}

[[noreturn]] void Rethrow(const Call& call, const ServiceSetup& setup) {
  try {
    std::rethrow_exception(call.failure);
  } catch (const Tarnik::Exception& exception) {
    throw ToolException(FailureOfCall(exception, *call.notes, setup.secret, setup.remedyOfRefusal));
  }
}

}  // namespace

void RunCall(const Console& console, const ServiceSetup& setup,
             std::function<void(const SecurityTokenService&)> operation) {
  const auto call = std::make_shared<Call>();
  const auto timeout =
      std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(setup.timeoutSec));
  call->limit = Tarnik::Http::CreateCallLimit(Clock::now() + timeout);
  call->operation = std::move(operation);
  call->service = MakeService(setup, *call);

  const LibraryLog log;
  Interruption interruption;
  Tarnik::System::GetThreadPool()->Run([call] { call->Run(); });
  const int signal = WaitForEnd(console, *call, interruption, setup.timeoutSec);
  if (signal != 0) {
    call->limit->Cancel();
    WaitUntil(*call, Clock::now() + kGrace);
    interruption.EndBy(signal);
  }
  log.Print(console, setup.secret);
  if (!call->hasEnded) {
    isCallAbandoned = true;
    throw ToolException(MakeFailure(Access::FailureKind::kTimedOut,
                                    "The time is over, but not in an exchange with the service."));
  }
  if (call->failure != nullptr) {
    Rethrow(*call, setup);
  }
}

bool IsCallAbandoned() noexcept {
  return isCallAbandoned;
}

}  // namespace SsoClient::Tool
