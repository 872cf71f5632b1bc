#ifndef TARNIK_SERVICE_LOG_REGISTRY_H
#define TARNIK_SERVICE_LOG_REGISTRY_H

#include <atomic>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include <spdlog/logger.h>

#include <tarnik/service/log.h>

namespace Tarnik::Service {

struct StaticLogger::Entry {
  std::atomic<int> level{4};
};

/// The levels of all loggers and the sink. Thread-safe. Holds every process-wide lock of the log.
class LogRegistry {
 public:
  /// The registry of the process. Never destroyed, since worker threads may still log while static
  /// objects are destroyed.
  static LogRegistry& Get();

  /// The entry of the loggers with this name. Valid as long as the process.
  StaticLogger::Entry& Find(std::string_view name);
  /// See `SetLogSink`.
  void SetSink(LogSink sink);
  /// Passes the line to the sink, whose exceptions propagate.
  void Write(const LogRecord& record);

  /// Locks everything, so that the calling thread may fork. It then calls one of the functions
  /// below in each process.
  void LockForFork();
  void UnlockInParent();
  /// Also forgets the calls of the sink that run on threads of the parent.
  void UnlockInChild();

 private:
  struct Sink;
  class SinkCall;

  LogRegistry();

  Sink* BeginCall();
  void EndCall(Sink& sink);

  // In the order in which they are locked. No lock is held while a sink runs or is destroyed.
  std::mutex entriesMutex_;
  std::mutex sinkMutex_;
  std::mutex defaultSinkMutex_;

  std::map<std::string, std::unique_ptr<StaticLogger::Entry>, std::less<>> entries_;
  std::unique_ptr<Sink> sink_;
  spdlog::logger defaultSink_;
};

}  // namespace Tarnik::Service

#endif
