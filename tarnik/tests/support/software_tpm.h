#ifndef TARNIK_TESTS_SUPPORT_SOFTWARE_TPM_H
#define TARNIK_TESTS_SUPPORT_SOFTWARE_TPM_H

#include <sys/types.h>

#include <string>

namespace Tarnik::Testing {

/// A TPM in a process of its own that listens on the loopback interface: a device whose keys never
/// leave it. It goes with its owner.
class SoftwareTpm {
 public:
  /// True when the programs that this needs are installed.
  static bool IsInstalled();

  SoftwareTpm();
  ~SoftwareTpm();
  SoftwareTpm(const SoftwareTpm&) = delete;
  SoftwareTpm& operator=(const SoftwareTpm&) = delete;

  /// Makes a key that asks for `pin` and keeps it under `handle`.
  void MakeKey(const std::string& algorithm, const std::string& attributes, const std::string& pin,
               const std::string& handle) const;

  /// Runs a shell command that finds the TPM; gives what it writes to its standard output.
  std::string Run(const std::string& command) const;

 private:
  void StartOn(int port);
  bool AwaitConnections(int port);
  void Stop();

  std::string folder_;
  std::string location_;
  pid_t process_ = -1;
};

}  // namespace Tarnik::Testing

#endif
