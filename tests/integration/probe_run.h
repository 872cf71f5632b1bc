#ifndef SSOCLIENT_TESTS_INTEGRATION_PROBE_RUN_H
#define SSOCLIENT_TESTS_INTEGRATION_PROBE_RUN_H

#include <string>
#include <vector>

namespace SsoClient::Testing {

/// A file that exists as long as this object.
class TemporaryFile {
 public:
  explicit TemporaryFile(const std::string& content);
  ~TemporaryFile();
  TemporaryFile(const TemporaryFile&) = delete;
  TemporaryFile& operator=(const TemporaryFile&) = delete;

  const std::string& Path() const { return path_; }

 private:
  std::string path_;
};

/// Runs a program. Returns its exit status, or 128 plus the number of the signal that ended it.
/// With `isLeakCheckOff`, LeakSanitizer does not check it: it takes what the threads of a parent
/// refer to for leaks of a forked child.
int RunToEnd(std::vector<std::string> command, bool isLeakCheckOff = false);

}  // namespace SsoClient::Testing

#endif
