#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_SERVICE_FIXTURE_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_SERVICE_FIXTURE_H

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <devsts/server.h>

#include "support/run_tool.h"
#include "support/temporary_file.h"

namespace SsoClient::Tool::Testing {

/// One dev STS for all tests of the process, well-behaved at the start of each test, with a folder
/// of files for each test.
class ServiceTest : public testing::Test {
 protected:
  ServiceTest();

  static DevSts::Server& Sts();

  /// Writes a file that only its owner can read, and returns its path.
  std::string WritePrivate(const std::string& name, const std::string& content) const;
  std::string PathOf(const std::string& name) const { return folder_.Path() + "/" + name; }
  /// The command with the address and the trust of `Sts()`.
  std::vector<std::string> Command(const std::string& name,
                                   const std::vector<std::string>& arguments = {}) const;
  /// The command without --sts-certificate.
  std::vector<std::string> UntrustedCommand(const std::string& name,
                                            const std::vector<std::string>& arguments = {}) const;
  /// A login of alice with the password in a file, and these further arguments.
  std::vector<std::string> PasswordLogin(const std::vector<std::string>& arguments = {}) const;
  /// A login of machine with its key, and these further arguments.
  std::vector<std::string> KeyLogin(const std::vector<std::string>& arguments = {}) const;
  /// The arguments of the key of machine.
  std::vector<std::string> Key() const;

  /// Logs in to a file of this name and returns its path.
  std::string LogIn(const std::string& name, const std::vector<std::string>& arguments) const;

  static std::string Content(const std::string& path);
  /// The permissions of a file.
  static unsigned ModeOf(const std::string& path);
  std::vector<std::string> FilesInFolder() const;

 private:
  Tarnik::Testing::TemporaryFolder folder_;
};

/// The first list and then the second.
std::vector<std::string> Joined(std::vector<std::string> first,
                                const std::vector<std::string>& second);

}  // namespace SsoClient::Tool::Testing

#endif
