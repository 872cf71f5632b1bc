#ifndef TARNIK_TESTS_SUPPORT_CA_FOLDER_H
#define TARNIK_TESTS_SUPPORT_CA_FOLDER_H

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "support/openssl.h"
#include "support/test_pki.h"

namespace Tarnik::Testing {

/// An empty folder for CA certificates, removed with its owner.
class CaFolder {
 public:
  CaFolder() : path_(testing::TempDir() + "tarnik_XXXXXX") {
    if (mkdtemp(path_.data()) == nullptr) {
      throw std::runtime_error("cannot make a temporary folder");
    }
  }
  ~CaFolder() { std::filesystem::remove_all(path_); }
  CaFolder(const CaFolder&) = delete;
  CaFolder& operator=(const CaFolder&) = delete;

  const std::string& Path() const { return path_; }

  /// The path of the file for the certificate of `ca` with this number.
  std::string PathOf(const Identity& ca, int number) const {
    char name[32];
    const X509_NAME* subject = X509_get_subject_name(ca.certificate.get());
    std::snprintf(name, sizeof(name), "/%08lx.%d",
                  X509_NAME_hash_ex(subject, nullptr, nullptr, nullptr), number);
    return path_ + name;
  }
  void Add(const Identity& ca, int number) const { std::ofstream(PathOf(ca, number)) << ca.Pem(); }

 private:
  std::string path_;
};

}  // namespace Tarnik::Testing

#endif
