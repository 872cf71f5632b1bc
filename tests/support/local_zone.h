#ifndef SSOCLIENT_TESTS_SUPPORT_LOCAL_ZONE_H
#define SSOCLIENT_TESTS_SUPPORT_LOCAL_ZONE_H

#include <cstdlib>
#include <ctime>
#include <optional>
#include <string>

namespace SsoClient::Testing {

/// During its lifetime, the local time zone of the process is 5:30 ahead of UTC.
class LocalZone {
 public:
  LocalZone() {
    if (const char* before = std::getenv("TZ")) {
      before_ = before;
    }
    ::setenv("TZ", "XYZ-5:30", 1);
    ::tzset();
  }
  LocalZone(const LocalZone&) = delete;
  LocalZone& operator=(const LocalZone&) = delete;
  ~LocalZone() {
    before_ ? ::setenv("TZ", before_->c_str(), 1) : ::unsetenv("TZ");
    ::tzset();
  }

 private:
  std::optional<std::string> before_;
};

}  // namespace SsoClient::Testing

#endif
