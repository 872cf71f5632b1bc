#ifndef SSOCLIENT_STS_LOGGER_H
#define SSOCLIENT_STS_LOGGER_H

#include <string_view>

#include <tarnik/service/log.h>

namespace SsoClient {

/// The library's only logger, named "SsoClient".
extern const Tarnik::Service::StaticLogger kLogger;

/// The level of the lines that trace operations and requests.
inline constexpr int kTraceLevel = 7;
/// The level of the lines that warn about a mistake of the caller or explain a refusal.
inline constexpr int kWarningLevel = 4;
/// The level of the lines that report a success.
inline constexpr int kSuccessLevel = 5;

/// Logs the start of an operation and, on every path out of it, its end.
class OperationLog {
 public:
  /// `operation` must outlive this object.
  explicit OperationLog(std::string_view operation);
  ~OperationLog();
  OperationLog(const OperationLog&) = delete;
  OperationLog& operator=(const OperationLog&) = delete;

 private:
  std::string_view operation_;
};

}  // namespace SsoClient

#endif
