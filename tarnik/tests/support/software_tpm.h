#ifndef TARNIK_TESTS_SUPPORT_SOFTWARE_TPM_H
#define TARNIK_TESTS_SUPPORT_SOFTWARE_TPM_H

#include <string>

#include <sys/types.h>

#include "support/temporary_file.h"

namespace Tarnik::Testing {

/// A TPM in a separate process that listens on the loopback interface: a device whose keys never
/// leave it. It ends with its owner.
class SoftwareTpm {
 public:
  /// True if the programs that this needs are installed.
  static bool IsInstalled();

  SoftwareTpm();
  ~SoftwareTpm();
  SoftwareTpm(const SoftwareTpm&) = delete;
  SoftwareTpm& operator=(const SoftwareTpm&) = delete;

  /// Creates a key that requires `pin` and stores it under `handle`.
  void MakeKey(const std::string& algorithm, const std::string& attributes, const std::string& pin,
               const std::string& handle) const;

  /// Runs a shell command that can use the TPM; returns its standard output.
  std::string Run(const std::string& command) const;

 private:
  void StartOn(int port);
  bool AwaitConnections(int port);
  void Stop();

  TemporaryFolder folder_;
  std::string location_;
  pid_t process_ = -1;
};

}  // namespace Tarnik::Testing

#endif
