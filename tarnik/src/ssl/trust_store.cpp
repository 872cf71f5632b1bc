#include "ssl/trust_store.h"

#include <cerrno>
#include <string>
#include <system_error>

#include <sys/stat.h>
#include <unistd.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_exception.h>

#include "ssl/decode_certificate.h"
#include "support/openssl_error.h"

namespace Tarnik::Ssl {
namespace {

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

void LoadCaFile(X509_STORE* store, const std::string& path) {
  const std::string what = "Cannot load CA certificates from";
  RequireReadable(path, R_OK, what);
  const OpenSsl::ErrorScope errors;
  if (X509_STORE_load_file(store, path.c_str()) != 1) {
    throw SSLException(errors.Describe(what + " '" + path + "'"));
  }
}

void LoadCaFolder(X509_STORE* store, const std::string& path) {
  const std::string what = "Cannot load CA certificates from the folder";
  RequireReadable(path, R_OK | X_OK, what);
  if (!IsFolder(path)) {
    throw SSLException(what + " '" + path + "': it is not a folder.");
  }
  const OpenSsl::ErrorScope errors;
  if (X509_STORE_load_path(store, path.c_str()) != 1) {
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
  const std::string what = "Cannot load revocation lists from";
  RequireReadable(path, R_OK, what);
  const OpenSsl::ErrorScope errors;
  X509_LOOKUP* lookup = X509_STORE_add_lookup(store, X509_LOOKUP_file());
  if (lookup == nullptr || X509_load_crl_file(lookup, path.c_str(), X509_FILETYPE_PEM) < 1) {
    throw SSLException(errors.Describe(what + " '" + path + "'"));
  }
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
    X509_STORE_set_flags(store, X509_V_FLAG_CRL_CHECK | X509_V_FLAG_CRL_CHECK_ALL);
  }
}

}  // namespace Tarnik::Ssl
