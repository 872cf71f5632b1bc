#include <algorithm>
#include <atomic>
#include <map>
#include <memory>
#include <mutex>
#include <shared_mutex>
#include <utility>

#include <spdlog/logger.h>
#include <spdlog/sinks/stdout_sinks.h>

#include <tarnik/core/exception.h>
#include <tarnik/service/log.h>

#include "support/ascii.h"

namespace Tarnik::Service {

struct StaticLogger::Entry {
  std::atomic<int> level{4};
};

// Never destroyed, since worker threads may still log while static objects are destroyed.
class LogRegistry {
 public:
  static LogRegistry& Get() {
    static LogRegistry& registry = *new LogRegistry;
    return registry;
  }

  StaticLogger::Entry& Find(std::string_view name) {
    const std::lock_guard guard(entriesMutex_);
    const auto found = entries_.find(name);
    if (found != entries_.end()) {
      return *found->second;
    }
    return *entries_.emplace(name, std::make_unique<StaticLogger::Entry>()).first->second;
  }

  void SetSink(LogSink sink) {
    auto shared = sink ? std::make_shared<const LogSink>(std::move(sink)) : nullptr;
    const std::unique_lock guard(sinkMutex_);
    sink_.swap(shared);
  }

  void Write(const LogRecord& record) {
    if (const auto sink = CurrentSink()) {
      (*sink)(record);
      return;
    }
    defaultSink_.log(spdlog::level::info, "{} {}: {}", record.level, record.logger, record.text);
  }

 private:
  LogRegistry() : defaultSink_("tarnik", std::make_shared<spdlog::sinks::stderr_sink_mt>()) {
    defaultSink_.set_pattern("%Y-%m-%dT%H:%M:%S.%e%z %v");
  }

  std::shared_ptr<const LogSink> CurrentSink() const {
    const std::shared_lock guard(sinkMutex_);
    return sink_;
  }

  std::mutex entriesMutex_;
  std::map<std::string, std::unique_ptr<StaticLogger::Entry>, std::less<>> entries_;
  mutable std::shared_mutex sinkMutex_;
  std::shared_ptr<const LogSink> sink_;
  spdlog::logger defaultSink_;
};

namespace {

// Escapes control characters, so that one call writes one line, whatever a user name or a fault
// text contains.
std::string EscapeControls(const std::string& text) {
  if (std::none_of(text.begin(), text.end(), IsControl)) {
    return text;
  }
  constexpr char kDigits[] = "0123456789abcdef";
  std::string result;
  for (const char c : text) {
    if (!IsControl(c)) {
      result.push_back(c);
      continue;
    }
    const auto value = static_cast<unsigned char>(c);
    result.append({'\\', 'x', kDigits[value >> 4], kDigits[value & 0xF]});
  }
  return result;
}

}  // namespace

StaticLogger::StaticLogger(const char* name)
    : name_(name), entry_(&LogRegistry::Get().Find(name)) {}

int StaticLogger::Level() const noexcept {
  return entry_->level.load(std::memory_order_relaxed);
}

void LogInternal(const StaticLogger& logger, int level, std::string_view format,
                 std::initializer_list<PrintFormatter> arguments) noexcept {
  if (!logger.IsEnabled(level)) {
    return;
  }
  // An operation must not fail because a log line cannot be written.
  try {
    const std::string text = EscapeControls(Detail::ASPrintInternal(format, arguments));
    LogRegistry::Get().Write({logger.Name(), level, text});
  } catch (...) {  // NOLINT(bugprone-empty-catch)
  }
}

void SetLogLevel(std::string_view name, int level) {
  if (level < 0 || level > 9) {
    throw InvalidArgumentException("A log level must be 0 to 9.");
  }
  LogRegistry::Get().Find(name).level.store(level, std::memory_order_relaxed);
}

void SetLogSink(LogSink sink) {
  LogRegistry::Get().SetSink(std::move(sink));
}

}  // namespace Tarnik::Service
