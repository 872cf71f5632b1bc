#ifndef SSOCLIENT_TESTS_STS_LOG_CAPTURE_H
#define SSOCLIENT_TESTS_STS_LOG_CAPTURE_H

#include <mutex>
#include <string>
#include <vector>

#include <tarnik/service/log.h>

namespace SsoClient::Testing {

/// Sets the level of the logger "SsoClient" and collects its lines as "LEVEL TEXT".
class LogCapture {
 public:
  explicit LogCapture(int level) {
    Tarnik::Service::SetLogLevel("SsoClient", level);
    Tarnik::Service::SetLogSink([this](const Tarnik::Service::LogRecord& record) {
      if (record.logger != "SsoClient") {
        return;
      }
      const std::lock_guard<std::mutex> guard(mutex_);
      lines_.push_back(std::to_string(record.level) + " " + std::string(record.text));
    });
  }
  LogCapture(const LogCapture&) = delete;
  LogCapture& operator=(const LogCapture&) = delete;
  ~LogCapture() {
    Tarnik::Service::SetLogSink(nullptr);
    Tarnik::Service::SetLogLevel("SsoClient", 4);
  }

  std::vector<std::string> Lines() const {
    const std::lock_guard<std::mutex> guard(mutex_);
    return lines_;
  }

 private:
  mutable std::mutex mutex_;
  std::vector<std::string> lines_;
};

}  // namespace SsoClient::Testing

#endif
