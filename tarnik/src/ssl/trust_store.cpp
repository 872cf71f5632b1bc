#include "ssl/trust_store.h"

#include <cerrno>
#include <cstdio>
#include <memory>
#include <string>
#include <system_error>

#include <openssl/pem.h>
#include <sys/stat.h>
#include <unistd.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_exception.h>

#include "ssl/ca_folder.h"
#include "ssl/decode_certificate.h"
#include "ssl/revocation.h"
#include "support/openssl_error.h"
#include "system/file.h"

namespace Tarnik::Ssl {
namespace {

// Without it OpenSSL would ask for the passphrase of an encrypted key on the terminal.
constexpr const char* kNoPassphrase = "";

// OpenSSL words the failure to read a file differently from the system, and does not report a
// missing folder at all.
void RequireReadable(const std::string& path, int mode, const std::string& what) {
  if (path.empty() || path.find('\0') != std::string::npos) {
    throw SSLException(what + " '': the path is empty or holds a NUL.");
  }
  if (access(path.c_str(), mode) != 0) {
    throw SSLException(what + " '" + path + "': " + std::system_category().message(errno) + ".");
  }
}

bool IsFolder(const std::string& path) {
  struct stat status {};
  return stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

/// A PEM file that is read to its end.
class PemFile {
 public:
  /// `what` is the start of the messages.
  PemFile(const std::string& path, const std::string& what) : what_(what + " '" + path + "'") {
    RequireReadable(path, R_OK, what);
    System::OwnedFile file = System::OpenForReading(path);
    const std::string reason = std::system_category().message(errno);
    source_.reset(file == nullptr ? nullptr : BIO_new_fp(file.get(), BIO_CLOSE));
    if (source_ == nullptr) {
      throw SSLException(what_ + ": " + reason + ".");
    }
    first_ = std::ungetc(std::getc(file.get()), file.get());
    static_cast<void>(file.release());
  }

  /// Adds the certificates and revocation lists to `store`. Throws when there is nothing of the
  /// kind that is asked for.
  void AddTo(X509_STORE* store, bool isForLists) const {
    const OpenSsl::ErrorScope errors;
    const OwnedInfos infos(
        PEM_X509_INFO_read_bio(source_.get(), nullptr, nullptr, const_cast<char*>(kNoPassphrase)));
    if (infos == nullptr) {
      throw SSLException(errors.Describe(what_));
    }
    bool isFound = false;
    for (int i = 0; i < sk_X509_INFO_num(infos.get()); ++i) {
      const X509_INFO* info = sk_X509_INFO_value(infos.get(), i);
      if ((info->x509 != nullptr && !isForLists && X509_STORE_add_cert(store, info->x509) != 1) ||
          (info->crl != nullptr && X509_STORE_add_crl(store, info->crl) != 1)) {
        throw SSLException(errors.Describe(what_));
      }
      isFound = isFound || (isForLists ? info->crl != nullptr : info->x509 != nullptr);
    }
    if (!isFound) {
      throw SSLException(what_ + ": " + WhatIsMissing(isForLists));
    }
  }

 private:
  struct FreeInfos {
    void operator()(STACK_OF(X509_INFO) * infos) const noexcept {
      sk_X509_INFO_pop_free(infos, X509_INFO_free);
    }
  };
  using OwnedInfos = std::unique_ptr<STACK_OF(X509_INFO), FreeInfos>;

  const char* WhatIsMissing(bool isForLists) const noexcept {
    constexpr int kSequence = 0x30;  // what DER starts with (X.690, section 8.1)
    if (first_ == kSequence) {
      return "it is DER; PEM is expected.";
    }
    return isForLists ? "it holds no revocation list in PEM." : "it holds no certificate in PEM.";
  }

  std::string what_;
  OpenSsl::OwnedBio source_;
  int first_ = EOF;
};

void LoadCaFile(X509_STORE* store, const std::string& path) {
  PemFile(path, "Cannot load CA certificates from").AddTo(store, false);
}

void LoadCaFolder(X509_STORE* store, const std::string& path) {
  const std::string what = "Cannot load CA certificates from the folder";
  RequireReadable(path, R_OK | X_OK, what);
  if (!IsFolder(path)) {
    throw SSLException(what + " '" + path + "': it is not a folder.");
  }
  const OpenSsl::ErrorScope errors;
  if (!AddCaFolder(store, path)) {
    throw SSLException(errors.Describe(what + " '" + path + "'"));
  }
}

void AddCaCertificate(X509_STORE* store, const Crypto::Certificate* certificate) {
  if (certificate == nullptr) {
    throw InvalidArgumentException("A CA certificate of the SSL context is null.");
  }
  const OpenSsl::ErrorScope errors;
  const OpenSsl::OwnedCertificate decoded = DecodeCertificate(*certificate);
  if (decoded == nullptr || X509_STORE_add_cert(store, decoded.get()) != 1) {
    throw SSLException(
        errors.Describe("Cannot trust the CA certificate " + certificate->SubjectName()));
  }
}

// Uses the compiled-in paths, since OpenSSL's function for its defaults also reads the environment.
void LoadSystemStore(X509_STORE* store) {
  const std::string file = X509_get_default_cert_file();
  const std::string folder = X509_get_default_cert_dir();
  const bool hasFile = access(file.c_str(), R_OK) == 0;
  const bool hasFolder = IsFolder(folder);
  if (!hasFile && !hasFolder) {
    throw SSLException("Cannot load the system's CA certificates: there is neither '" + file +
                       "' nor '" + folder + "'.");
  }
  if (hasFile) {
    LoadCaFile(store, file);
  }
  if (hasFolder) {
    LoadCaFolder(store, folder);
  }
}

void LoadCrlFile(X509_STORE* store, const std::string& path) {
  PemFile(path, "Cannot load revocation lists from").AddTo(store, true);
}

}  // namespace

void LoadTrust(const SSLContextConfig& config, X509_STORE* store) {
  for (const std::string& path : config.caFiles) {
    LoadCaFile(store, path);
  }
  for (const std::string& path : config.caFolders) {
    LoadCaFolder(store, path);
  }
  for (const auto& certificate : config.caCertificates) {
    AddCaCertificate(store, certificate.get());
  }
  if (config.useSystemStore) {
    LoadSystemStore(store);
  }
  for (const std::string& path : config.crlFiles) {
    LoadCrlFile(store, path);
  }
  if (!config.crlFiles.empty()) {
    CheckRevocation(store);
  }
}

}  // namespace Tarnik::Ssl
