#include <algorithm>
#include <atomic>
#include <string>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/service/log.h>

#include "service/log_registry.h"
#include "support/ascii.h"

namespace Tarnik::Service {
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
