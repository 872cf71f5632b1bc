#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <stdexcept>
#include <string>
#include <thread>

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/stat.h>
#include <unistd.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/ssl/ssl_context.h>

#include "ssl/tls_fixture.h"
#include "support/ca_folder.h"
#include "support/key_texts.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"
#include "support/tls_peer.h"

// Each file that the library opens is closed in child processes from the start. The files are
// FIFOs, so that a reader waits while its descriptor is examined.
namespace Tarnik::Testing {
namespace {

/// The flags of the descriptor that this process reads `path` with, or -1.
int FlagsOfReader(const std::string& path) {
  std::error_code ended;  // a descriptor may be closed meanwhile
  for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
    if (std::filesystem::read_symlink(entry.path(), ended) != path) {
      continue;
    }
    const int descriptor = std::stoi(entry.path().filename());
    if ((fcntl(descriptor, F_GETFL) & O_ACCMODE) == O_RDONLY) {
      return fcntl(descriptor, F_GETFD);
    }
  }
  return -1;
}

class Fifo {
 public:
  explicit Fifo(std::string path) : path_(std::move(path)) {
    if (mkfifo(path_.c_str(), 0600) != 0) {
      throw std::runtime_error("cannot make a FIFO");
    }
  }

  /// Waits until this process has opened the FIFO, then writes `content` and returns the flags of
  /// the reader's descriptor.
  int Serve(const std::string& content) const {
    const int descriptor = open(path_.c_str(), O_WRONLY | O_CLOEXEC);
    int flags = -1;
    // The reader is about to have its descriptor, and keeps it until the content has arrived.
    while ((flags = FlagsOfReader(path_)) < 0) {
      sched_yield();
    }
    EXPECT_EQ(write(descriptor, content.data(), content.size()),
              static_cast<ssize_t>(content.size()));
    close(descriptor);
    return flags;
  }
  const std::string& Path() const { return path_; }

 private:
  std::string path_;
};

/// The flags of the descriptor with which `load` reads a FIFO with this content.
int FlagsWhile(const std::string& content, const std::function<void(const std::string&)>& load) {
  const TemporaryFolder folder;
  const Fifo fifo(folder.Path() + "/file");
  int flags = -1;
  std::thread writer([&] { flags = fifo.Serve(content); });
  EXPECT_NO_THROW(load(fifo.Path()));
  writer.join();
  return flags;
}

TEST(CloseOnExecTest, HoldsForCertificatesAndKeys) {
  const Identity& leaf = TestPki::Get().leaf;
  const std::string key = ToPkcs8Pem(leaf.key.get());
  EXPECT_EQ(FlagsWhile(leaf.Pem(), [](const auto& path) { Crypto::LoadCertificates(path); }),
            FD_CLOEXEC);
  EXPECT_EQ(FlagsWhile(key, [](const auto& path) { Crypto::LoadPrivateKey(path, {}); }),
            FD_CLOEXEC);
  for (const std::string scheme : {"file:", "file://", "file://localhost"}) {
    EXPECT_EQ(
        FlagsWhile(
            key, [&scheme](const auto& path) { Crypto::LoadPrivateKeyFromUri(scheme + path, {}); }),
        FD_CLOEXEC)
        << scheme;
  }
}

TEST(CloseOnExecTest, HoldsForTrustFiles) {
  const Identity& root = TestPki::Get().root;
  EXPECT_EQ(FlagsWhile(root.Pem(),
                       [](const auto& path) {
                         Ssl::SSLContextConfig config;
                         config.caFiles = {path};
                         Ssl::CreateSSLContext(config);
                       }),
            FD_CLOEXEC);
  EXPECT_EQ(FlagsWhile(MakeCrl(root, nullptr),
                       [](const auto& path) {
                         Ssl::SSLContextConfig config;
                         config.crlFiles = {path};
                         Ssl::CreateSSLContext(config);
                       }),
            FD_CLOEXEC);
}

TEST(CloseOnExecTest, HoldsForFilesThatAHandshakeLooksUp) {
  const Identity& root = TestPki::Get().root;
  const CaFolder folder;
  const Fifo fifo(folder.PathOf(root, 0));
  Ssl::SSLContextConfig config;
  config.caFolders = {folder.Path()};
  TlsPeerOptions peer;
  peer.identity = &TestPki::Get().leaf;
  TlsServer server(peer, 1);
  int flags = -1;
  std::thread writer([&] { flags = fifo.Serve(root.Pem()); });
  EXPECT_EQ(TlsClient(*Ssl::CreateSSLContext(config), server.Port()).Message(), "");
  writer.join();
  EXPECT_EQ(flags, FD_CLOEXEC);
}

}  // namespace
}  // namespace Tarnik::Testing
