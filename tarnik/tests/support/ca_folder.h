#ifndef TARNIK_TESTS_SUPPORT_CA_FOLDER_H
#define TARNIK_TESTS_SUPPORT_CA_FOLDER_H

#include <cstdio>
#include <fstream>
#include <string>

#include "support/openssl.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace Tarnik::Testing {

/// A folder for CA certificates, removed with its owner.
class CaFolder {
 public:
  const std::string& Path() const { return folder_.Path(); }

  /// The path of the file for the certificate of `ca` with this number.
  std::string PathOf(const Identity& ca, int number) const {
    char name[32];
    const X509_NAME* subject = X509_get_subject_name(ca.certificate.get());
    std::snprintf(name, sizeof(name), "/%08lx.%d",
                  X509_NAME_hash_ex(subject, nullptr, nullptr, nullptr), number);
    return Path() + name;
  }
  void Add(const Identity& ca, int number) const { std::ofstream(PathOf(ca, number)) << ca.Pem(); }

 private:
  TemporaryFolder folder_;
};

}  // namespace Tarnik::Testing

#endif
