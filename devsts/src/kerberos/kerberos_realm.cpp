#include <chrono>
#include <filesystem>
#include <fstream>
#include <optional>
#include <stdexcept>
#include <thread>
#include <utility>
#include <vector>

#include <boost/asio/io_context.hpp>
#include <boost/asio/ip/tcp.hpp>

#include <devsts/kerberos_realm.h>

#include "kerberos/child_process.h"

namespace DevSts {

namespace {

using Tcp = boost::asio::ip::tcp;
using namespace std::chrono_literals;

constexpr char kMasterPassword[] = "not-a-secret";
constexpr int kAttempts = 5;
constexpr auto kStartPatience = 30s;

std::string CreateFolder() {
  std::string pattern = std::filesystem::temp_directory_path() / "devsts-realm-XXXXXX";
  if (::mkdtemp(pattern.data()) == nullptr) {
    throw std::runtime_error("A temporary folder for the realm cannot be created");
  }
  return pattern;
}

// Another process may take the port before the KDC does.
unsigned short FreePort() {
  boost::asio::io_context context;
  const Tcp::acceptor acceptor(context, {boost::asio::ip::make_address("127.0.0.1"), 0});
  return acceptor.local_endpoint().port();
}

std::string SignedText(std::chrono::seconds seconds) {
  return (seconds.count() < 0 ? "" : "+") + std::to_string(seconds.count()) + "s";
}

bool IsListening(unsigned short port) {
  boost::asio::io_context context;
  Tcp::socket socket(context);
  boost::system::error_code error;
  socket.connect({boost::asio::ip::make_address("127.0.0.1"), port}, error);
  return !error;
}

void WriteFile(const std::string& path, const std::string& text) {
  std::ofstream file(path);
  file << text;
  if (!file.flush()) {
    throw std::runtime_error("The file '" + path + "' cannot be written");
  }
}

// The text as one word of a query of kadmin.local, in which two quotation marks mean one.
std::string QueryWord(const std::string& text) {
  std::string word = "\"";
  for (const char c : text) {
    word += c == '"' ? "\"\"" : std::string(1, c);
  }
  return word + "\"";
}

// Returns the name. Throws if a configuration file or a command of the tools would misread it.
std::string Checked(const std::string& name) {
  if (name.empty() || name.front() == '-' ||
      name.find_first_of(" \t\r\n\"\\") != std::string::npos) {
    throw std::runtime_error("'" + name + "' cannot be the name of a principal");
  }
  return name;
}

}  // namespace

class KerberosRealm::State {
 public:
  State() : folder(CreateFolder()), configPath(folder + "/krb5.conf") {
    try {
      SetUp();
    } catch (...) {
      CleanUp();
      throw;
    }
  }
  ~State() {
    kdc.reset();
    CleanUp();
  }
  State(const State&) = delete;
  State& operator=(const State&) = delete;

  void Run(std::vector<std::string> arguments, const std::string& input = {}) const {
    RunToEnd({std::move(arguments), Variables(), folder + "/tool.log", input});
  }
  void Administer(const std::string& query) const {
    Run({"/usr/sbin/kadmin.local", "-r", kName, "-q", query});
  }

  void StartKdc() {
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
      if (TryToStartKdc()) {
        return;
      }
    }
    throw std::runtime_error("The KDC did not start");
  }

  const std::string folder;
  const std::string configPath;
  std::chrono::seconds clockOffset{0};
  std::optional<BackgroundProcess> kdc;
  int keytabs = 0;
  int caches = 0;

 private:
  std::vector<std::string> Variables() const {
    std::vector<std::string> variables = {"KRB5_CONFIG=" + configPath,
                                          "KRB5_KDC_PROFILE=" + folder + "/kdc.conf"};
    if (clockOffset.count() != 0) {
      // The loader replaces $LIB with the platform's library folder.
      variables.emplace_back("LD_PRELOAD=/usr/$LIB/faketime/libfaketimeMT.so.1");
      variables.push_back("FAKETIME=" + SignedText(clockOffset));
      variables.emplace_back("FAKETIME_DONT_FAKE_MONOTONIC=1");
    }
    return variables;
  }

  void SetUp() {
    WriteConfiguration(FreePort());
    Run({"/usr/sbin/kdb5_util", "-r", kName, "create", "-s", "-P", kMasterPassword});
    StartKdc();
  }

  bool TryToStartKdc() {
    const unsigned short port = FreePort();
    WriteConfiguration(port);
    kdc.emplace(Command{
        {"/usr/sbin/krb5kdc", "-n", "-r", kName}, Variables(), folder + "/krb5kdc.log", {}});
    const auto limit = std::chrono::steady_clock::now() + kStartPatience;
    while (kdc->IsRunning() && std::chrono::steady_clock::now() < limit) {
      if (IsListening(port)) {
        return true;
      }
      std::this_thread::sleep_for(10ms);
    }
    kdc.reset();
    return false;
  }

  void WriteConfiguration(unsigned short port) const {
    const std::string address = "127.0.0.1:" + std::to_string(port);
    const std::string realm = kName;
    WriteFile(configPath, "[libdefaults]\n default_realm = " + realm +
                              "\n dns_lookup_kdc = false\n dns_lookup_realm = false\n"
                              " dns_canonicalize_hostname = false\n rdns = false\n"
                              " udp_preference_limit = 1\n kdc_timesync = 0\n"
                              " default_rcache_name = file2:" +
                              folder + "/replays\n[realms]\n " + realm +
                              " = {\n  kdc = " + address + "\n }\n");
    WriteFile(folder + "/kdc.conf",
              "[kdcdefaults]\n kdc_listen = \"\"\n kdc_tcp_listen = " + address + "\n[realms]\n " +
                  realm + " = {\n  database_name = " + folder + "/principal\n  key_stash_file = " +
                  folder + "/stash\n  kdc_listen = \"\"\n  kdc_tcp_listen = " + address +
                  "\n }\n[logging]\n kdc = FILE:" + folder + "/kdc.log\n");
  }

  void CleanUp() const noexcept {
    std::error_code ignored;
    std::filesystem::remove_all(folder, ignored);
  }
};

KerberosRealm::KerberosRealm() : state_(std::make_unique<State>()) {}
KerberosRealm::~KerberosRealm() = default;

const std::string& KerberosRealm::Folder() const {
  return state_->folder;
}

const std::string& KerberosRealm::ConfigPath() const {
  return state_->configPath;
}

pid_t KerberosRealm::KdcProcess() const {
  return state_->kdc ? state_->kdc->Id() : -1;
}

void KerberosRealm::AddUser(const std::string& name, const std::string& password) {
  state_->Administer("addprinc -pw " + Checked(password) + " " + Checked(name));
}

std::string KerberosRealm::AddKeytab(const std::string& principal) {
  std::string path = state_->folder + "/keytab-" + std::to_string(++state_->keytabs) + ".keytab";
  state_->Administer("addprinc -randkey " + Checked(principal));
  state_->Administer("ktadd -k " + QueryWord(path) + " " + Checked(principal));
  return path;
}

void KerberosRealm::WriteKeytab(const std::string& principal, const std::string& path) {
  state_->Administer("ktadd -norandkey -k " + QueryWord(path) + " " + Checked(principal));
}

std::string KerberosRealm::Login(const std::string& name, const std::string& password,
                                 std::chrono::seconds lifetime) {
  std::string path = "FILE:" + state_->folder + "/cache-" + std::to_string(++state_->caches);
  state_->Run({"kinit", "-c", path, "-l", std::to_string(lifetime.count()) + "s", Checked(name)},
              password + "\n");
  return path;
}

void KerberosRealm::SetClock(std::chrono::seconds offset) {
  state_->kdc.reset();
  state_->clockOffset = offset;
  state_->StartKdc();
}

void KerberosRealm::StopKdc() {
  state_->kdc.reset();
}

}  // namespace DevSts
