#include "service/log_registry.h"

#include <condition_variable>
#include <cstddef>
#include <utility>

#include <spdlog/sinks/stdout_sinks.h>

#include "support/fork.h"

namespace Tarnik::Service {

/// A sink with the number of its calls that are under way. `sinkMutex_` guards all members but the
/// function.
struct LogRegistry::Sink {
  explicit Sink(LogSink sink) : write(std::move(sink)) {}

  const LogSink write;
  std::size_t calls = 0;
  // Only the thread that replaced this sink waits.
  std::condition_variable hasFewerCalls;
};

/// A call of a sink on this thread. A sink may log, so that a thread has several calls.
class LogRegistry::SinkCall {
 public:
  SinkCall(LogRegistry& registry, Sink& sink)
      : registry_(registry), sink_(sink), outer_(std::exchange(innermost_, this)) {}
  ~SinkCall() {
    innermost_ = outer_;
    registry_.EndCall(sink_);
  }
  SinkCall(const SinkCall&) = delete;
  SinkCall& operator=(const SinkCall&) = delete;

  /// The number of calls of `sink` on this thread.
  static std::size_t CountOnThisThread(const Sink& sink) {
    std::size_t count = 0;
    for (const SinkCall* call = innermost_; call != nullptr; call = call->outer_) {
      count += &call->sink_ == &sink ? 1 : 0;
    }
    return count;
  }

  /// Destroys the sink, which has calls on this thread only, after the last of them.
  static void DestroyAfterCalls(std::unique_ptr<Sink> sink) {
    SinkCall* outermost = nullptr;
    for (SinkCall* call = innermost_; call != nullptr; call = call->outer_) {
      outermost = &call->sink_ == sink.get() ? call : outermost;
    }
    outermost->replaced_ = std::move(sink);
  }

 private:
  static thread_local SinkCall* innermost_;

  // Destroyed after the body of the destructor has ended the call.
  std::unique_ptr<Sink> replaced_;
  LogRegistry& registry_;
  Sink& sink_;
  SinkCall* const outer_;
};

thread_local LogRegistry::SinkCall* LogRegistry::SinkCall::innermost_ = nullptr;

LogRegistry& LogRegistry::Get() {
  static LogRegistry& registry = *new LogRegistry;
  return registry;
}

// The lock of the library's own sink would not be ours to hold over a fork.
LogRegistry::LogRegistry()
    : defaultSink_("tarnik", std::make_shared<spdlog::sinks::stderr_sink_st>()) {
  defaultSink_.set_pattern("%Y-%m-%dT%H:%M:%S.%e%z %v");
}

StaticLogger::Entry& LogRegistry::Find(std::string_view name) {
  const std::lock_guard guard(entriesMutex_);
  const auto found = entries_.find(name);
  if (found != entries_.end()) {
    return *found->second;
  }
  return *entries_.emplace(name, std::make_unique<StaticLogger::Entry>()).first->second;
}

void LogRegistry::SetSink(LogSink sink) {
  auto replaced = sink ? std::make_unique<Sink>(std::move(sink)) : nullptr;
  std::unique_lock guard(sinkMutex_);
  sink_.swap(replaced);
  if (replaced == nullptr) {
    return;
  }
  // A sink may call this function, but threads cannot wait for each other: a thread waits for the
  // calls of the latest sink, and whoever waits for that thread replaced an earlier one.
  const std::size_t own = SinkCall::CountOnThisThread(*replaced);
  replaced->hasFewerCalls.wait(guard, [&] { return replaced->calls == own; });
  guard.unlock();
  if (own > 0) {
    SinkCall::DestroyAfterCalls(std::move(replaced));
  }
}

void LogRegistry::Write(const LogRecord& record) {
  if (Sink* sink = BeginCall()) {
    const SinkCall call(*this, *sink);
    sink->write(record);
    return;
  }
  const std::lock_guard guard(defaultSinkMutex_);
  defaultSink_.log(spdlog::level::info, "{} {}: {}", record.level, record.logger, record.text);
}

LogRegistry::Sink* LogRegistry::BeginCall() {
  const std::lock_guard guard(sinkMutex_);
  if (sink_ != nullptr) {
    ++sink_->calls;
  }
  return sink_.get();
}

void LogRegistry::EndCall(Sink& sink) {
  const std::lock_guard guard(sinkMutex_);
  --sink.calls;
  if (&sink != sink_.get()) {
    sink.hasFewerCalls.notify_one();
  }
}

void LogRegistry::LockForFork() {
  entriesMutex_.lock();
  sinkMutex_.lock();
  defaultSinkMutex_.lock();
}

void LogRegistry::UnlockInParent() {
  defaultSinkMutex_.unlock();
  sinkMutex_.unlock();
  entriesMutex_.unlock();
}

void LogRegistry::UnlockInChild() {
  if (sink_ != nullptr) {
    sink_->calls = SinkCall::CountOnThisThread(*sink_);
  }
  UnlockInParent();
}

namespace {

// At load, so that no thread can be inside the initialisation of the registry while another forks.
[[maybe_unused]] const bool kLogTakesPartInFork = [] {
  LogRegistry::Get();
  SetForkHooks(ForkOrder::kLog, {[]() noexcept { LogRegistry::Get().LockForFork(); },
                                 []() noexcept { LogRegistry::Get().UnlockInParent(); },
                                 []() noexcept { LogRegistry::Get().UnlockInChild(); }});
  return true;
}();

}  // namespace

}  // namespace Tarnik::Service
