#include <filesystem>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>
#include <openssl/err.h>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>

#include "support/key_texts.h"
#include "support/openssl.h"
#include "support/temporary_file.h"
#include "support/test_certificates.h"
#include "support/test_pki.h"
#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;

constexpr const char* kSecret = "correct horse";

std::string FileUri(const TemporaryFile& file) {
  return "file:" + file.Path();
}

std::string LoadError(const std::string& uri, const PassphraseCallback& passphrase = {}) {
  return ThrownMessage<CryptoException>([&] { LoadPrivateKeyFromUri(uri, passphrase); }, "loaded");
}

bool IsShared(const Ref<const PrivateKey>& key) {
  return key->Matches(*MakeCertificate());
}

/// The working folder of this process as long as this object exists.
class WorkingFolder {
 public:
  explicit WorkingFolder(const std::string& path) : before_(std::filesystem::current_path()) {
    std::filesystem::current_path(path);
  }
  ~WorkingFolder() { std::filesystem::current_path(before_); }
  WorkingFolder(const WorkingFolder&) = delete;
  WorkingFolder& operator=(const WorkingFolder&) = delete;

 private:
  std::filesystem::path before_;
};

TEST(KeyStoreTest, LoadsAKeyFromAFileUri) {
  const TemporaryFile file(ToPkcs8Pem(SharedRsaKey()));
  EXPECT_TRUE(IsShared(LoadPrivateKeyFromUri(FileUri(file))));
}

TEST(KeyStoreTest, AsksOnceForThePassphraseOfAFile) {
  const std::string secret = kSecret;
  const TemporaryFile file(ToPkcs8Pem(SharedRsaKey(), &secret));
  int asked = 0;
  EXPECT_TRUE(IsShared(LoadPrivateKeyFromUri(FileUri(file), [&] {
    ++asked;
    return secret;
  })));
  EXPECT_EQ(asked, 1);
}

TEST(KeyStoreTest, RefusesAnEncryptedFileWithoutThePassphrase) {
  const std::string secret = kSecret;
  const TemporaryFile file(ToPkcs8Pem(SharedRsaKey(), &secret));
  EXPECT_EQ(LoadError(FileUri(file)), "The private key needs a passphrase, and none was given.");
  int asked = 0;
  const std::string wrong = LoadError(FileUri(file), [&] {
    ++asked;
    return std::string("battery staple");
  });
  EXPECT_EQ(asked, 1);
  EXPECT_EQ(wrong.find("The URI 'file:' gives no private key, or the passphrase is wrong"), 0U)
      << wrong;
  EXPECT_THROW(LoadPrivateKeyFromUri(FileUri(file),
                                     []() -> std::string { throw std::out_of_range("no vault"); }),
               std::out_of_range);
}

TEST(KeyStoreTest, RefusesAFileWithoutAKeyOrWithTwo) {
  const TemporaryFile text("nothing here");
  EXPECT_EQ(LoadError(FileUri(text)), "The URI 'file:' gives no private key.");
  const TemporaryFile certificate(MakeCa("Root").Pem());
  EXPECT_EQ(LoadError(FileUri(certificate)), "The URI 'file:' gives no private key.");
  const OpenSsl::OwnedKey other = MakeEcKey("P-256");
  const TemporaryFile two(ToPkcs8Pem(SharedRsaKey()) + ToPkcs8Pem(other.get()));
  EXPECT_EQ(LoadError(FileUri(two)), "The URI 'file:' gives more than one private key.");
}

TEST(KeyStoreTest, RefusesAMissingFile) {
  EXPECT_EQ(LoadError("file:/nonexistent/key.pem"),
            "The URI 'file:' gives no private key: No such file or directory.");
}

TEST(KeyStoreTest, RefusesAFolder) {
  const TemporaryFolder folder;
  const std::string file = folder.Write("key.pem", ToPkcs8Pem(SharedRsaKey()));
  EXPECT_TRUE(IsShared(LoadPrivateKeyFromUri("file:" + file)));
  for (const std::string scheme : {"file:", "file://", "FILE://LocalHost"}) {
    const std::string name = scheme.substr(0, scheme.find(':') + 1);
    EXPECT_EQ(LoadError(scheme + folder.Path()),
              "The URI '" + name + "' gives no private key: it names a folder.");
  }
}

TEST(KeyStoreTest, RefusesAFileOfAnotherHost) {
  const TemporaryFile file(ToPkcs8Pem(SharedRsaKey()));
  EXPECT_TRUE(IsShared(LoadPrivateKeyFromUri("file://localhost" + file.Path())));
  for (const std::string& uri : {"file://sts.example" + file.Path(), std::string("file:")}) {
    EXPECT_EQ(LoadError(uri),
              "The URI 'file:' gives no private key: it names no file of this machine.");
  }
}

// OpenSSL would read it, in a descriptor that child processes inherit.
TEST(KeyStoreTest, ReadsNoFileWhoseNameIsTheUri) {
  const TemporaryFolder folder;
  const WorkingFolder working(folder.Path());
  for (const char* const name : {"file:key.pem", "vault:key.pem"}) {
    folder.Write(name, ToPkcs8Pem(SharedRsaKey()));
  }
  EXPECT_EQ(LoadError("file:key.pem"),
            "The URI 'file:' gives no private key: No such file or directory.");
  EXPECT_EQ(LoadError("vault:key.pem"),
            "The URI 'vault:' gives no private key: a file has the URI as its name.");
  folder.Write("key.pem", ToPkcs8Pem(SharedRsaKey()));
  EXPECT_TRUE(IsShared(LoadPrivateKeyFromUri("file:key.pem")));
}

TEST(KeyStoreTest, RefusesAnUnknownSchemeWithoutRevealingSecrets) {
  const std::string message = LoadError("vault:object=key?pin-value=1234");
  EXPECT_EQ(message, "The URI 'vault:' gives no private key: unsupported.");
}

TEST(KeyStoreTest, RefusesAUriWithoutAScheme) {
  const char* const refusal = "The URI of the private key has no scheme or holds a NUL.";
  EXPECT_EQ(LoadError(""), refusal);
  EXPECT_EQ(LoadError("/etc/key.pem"), refusal);
  EXPECT_EQ(LoadError(":key"), refusal);
  EXPECT_EQ(LoadError(std::string("file:/a\0b", 9)), refusal);
}

TEST(KeyStoreTest, LeavesTheCallersOpenSslErrorsUnchanged) {
  ERR_clear_error();
  EXPECT_NE(LoadError("vault:key"), "loaded");
  EXPECT_EQ(ERR_peek_error(), 0U);
}

}  // namespace
}  // namespace Tarnik::Testing
