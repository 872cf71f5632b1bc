#ifndef TARNIK_SERVICE_LOG_H
#define TARNIK_SERVICE_LOG_H

#include <functional>
#include <initializer_list>
#include <string>
#include <string_view>

#include <tarnik/export.h>
#include <tarnik/text/print.h>

namespace Tarnik::Service {

/// A named logger, created once and not destroyed before the process ends. A line of level L is
/// written when the logger's level is at least L. Levels range from 0 (silence) to 9 (everything);
/// a new logger has level 4. The levels are 1 fatal, 2 error, 3 failure of one request, 4 warning,
/// 5 notice, 6 information, 7 trace of operations, 8 and 9 detail.
///
/// Loggers of the same name share one level. Thread-safe.
class TARNIK_EXPORT StaticLogger {
 public:
  /// `name` must live as long as the process (a literal).
  explicit StaticLogger(const char* name);

  /// The name that it was created with.
  const char* Name() const noexcept { return name_; }
  /// The level now, 0 to 9.
  int Level() const noexcept;
  /// Whether a line of this level is written now.
  bool IsEnabled(int level) const noexcept { return Level() >= level; }

 private:
  struct Entry;
  friend TARNIK_EXPORT void SetLogLevel(std::string_view name, int level);
  friend class LogRegistry;

  const char* name_;
  Entry* entry_;
};

/// Writes one line at `level` (1 to 9): `format` with "%1" to "%N" replaced, as
/// `Detail::ASPrintInternal` does. Control characters in the line are escaped, so that one call is
/// one line. Does nothing when the logger's level is lower. Never throws.
TARNIK_EXPORT void LogInternal(const StaticLogger& logger, int level, std::string_view format,
                               std::initializer_list<PrintFormatter> arguments) noexcept;

/// Sets the level of the logger `name`, which may be created later. Throws
/// `InvalidArgumentException` unless `level` is 0 to 9.
TARNIK_EXPORT void SetLogLevel(std::string_view name, int level);

/// One line on its way to the sink. The views are valid only during the call.
struct LogRecord {
  std::string_view logger;  ///< the name of the logger
  int level;                ///< 1 to 9
  std::string_view text;    ///< one line, without a line feed at its end
};

/// Receives every line that its logger's level allows. It is called on the thread that logs, so
/// several threads may call it at once. A sink may log; it then receives its own lines as well.
using LogSink = std::function<void(const LogRecord&)>;

/// Sends all lines to `sink` from now on; an empty sink restores the default, which writes time,
/// level, logger and text to the standard error stream.
///
/// When this function returns, the previous sink runs on no thread and is destroyed: it waits for
/// the calls that are under way. The caller must therefore not hold a lock that the previous sink
/// needs to return. A sink may call this function itself. Its own call then does not count: the
/// function waits only for other threads, and the sink is destroyed after it has returned.
TARNIK_EXPORT void SetLogSink(LogSink sink);

}  // namespace Tarnik::Service

#endif
