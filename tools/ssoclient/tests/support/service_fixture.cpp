#include "support/service_fixture.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>

#include <sys/stat.h>

namespace SsoClient::Tool::Testing {
namespace {

struct Service {
  Service() {
    DevSts::CertificateSpec spec;
    spec.commonName = "machine";
    spec.keyType = DevSts::KeyType::Rsa2048;
    machine = DevSts::MakeCertificate(spec);
    sts.RegisterCertificate("machine@EXAMPLE.COM", machine.certificatePem);
  }

  DevSts::Server sts;
  DevSts::Credential machine;
};

Service& TheService() {
  static Service service;
  return service;
}

}  // namespace

ServiceTest::ServiceTest() {
  Sts().ClearMisbehavior();
  Sts().SetAssertionOptions({});
  Sts().ClearRequests();
  WritePrivate("ca.pem", Sts().CaCertificatePem());
  WritePrivate("sts.pem", Sts().SigningCertificatePem());
  WritePrivate("password", "secret\n");
  WritePrivate("machine.pem", TheService().machine.certificatePem);
  WritePrivate("machine.key", TheService().machine.privateKeyPem);
}

DevSts::Server& ServiceTest::Sts() {
  return TheService().sts;
}

std::string ServiceTest::WritePrivate(const std::string& name, const std::string& content) const {
  const std::string path = folder_.Write(name, content);
  chmod(path.c_str(), S_IRUSR | S_IWUSR);
  return path;
}

std::vector<std::string> ServiceTest::UntrustedCommand(
    const std::string& name, const std::vector<std::string>& arguments) const {
  return Joined({name, "--url", Sts().HttpsUrl(), "--ca", PathOf("ca.pem")}, arguments);
}

std::vector<std::string> ServiceTest::Command(const std::string& name,
                                              const std::vector<std::string>& arguments) const {
  return UntrustedCommand(name, Joined({"--sts-certificate", PathOf("sts.pem")}, arguments));
}

std::vector<std::string> ServiceTest::PasswordLogin(
    const std::vector<std::string>& arguments) const {
  return Command(
      "login",
      Joined({"--user", "alice@EXAMPLE.COM", "--password-file", PathOf("password")}, arguments));
}

std::vector<std::string> ServiceTest::Key() const {
  return {"--certificate", PathOf("machine.pem"), "--key", PathOf("machine.key")};
}

std::vector<std::string> ServiceTest::KeyLogin(const std::vector<std::string>& arguments) const {
  return Command("login", Joined(Key(), arguments));
}

std::string ServiceTest::LogIn(const std::string& name,
                               const std::vector<std::string>& arguments) const {
  const ToolResult result = RunTool(Joined(arguments, {"--output", PathOf(name)}));
  EXPECT_EQ(result.status, 0) << result.err;
  return PathOf(name);
}

std::string ServiceTest::Content(const std::string& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

unsigned ServiceTest::ModeOf(const std::string& path) {
  struct stat status {};
  return stat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
}

std::vector<std::string> ServiceTest::FilesInFolder() const {
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(folder_.Path())) {
    names.push_back(entry.path().filename());
  }
  std::sort(names.begin(), names.end());
  return names;
}

std::vector<std::string> Joined(std::vector<std::string> first,
                                const std::vector<std::string>& second) {
  first.insert(first.end(), second.begin(), second.end());
  return first;
}

}  // namespace SsoClient::Tool::Testing
