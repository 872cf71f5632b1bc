#include "ssl/ca_folder.h"

#include <cstdio>
#include <memory>
#include <vector>

#include <openssl/pem.h>

#include "support/openssl_error.h"
#include "system/file.h"

namespace Tarnik::Ssl {
namespace {

using Folders = std::vector<std::string>;

// The first file of a name is often the only one. This bounds the search in a broken folder.
constexpr int kMaxFilesOfName = 1000;

std::string FileName(const std::string& folder, unsigned long hash, const char* kind, int number) {
  char name[32];
  std::snprintf(name, sizeof(name), "/%08lx.%s%d", hash, kind, number);
  return folder + name;
}

void AddCertificates(X509_STORE* store, BIO* source) {
  for (;;) {
    const OpenSsl::OwnedCertificate certificate(
        PEM_read_bio_X509_AUX(source, nullptr, nullptr, nullptr));
    if (certificate == nullptr || X509_STORE_add_cert(store, certificate.get()) != 1) {
      return;
    }
  }
}

void AddLists(X509_STORE* store, BIO* source) {
  for (;;) {
    const OpenSsl::OwnedCrl list(PEM_read_bio_X509_CRL(source, nullptr, nullptr, nullptr));
    if (list == nullptr || X509_STORE_add_crl(store, list.get()) != 1) {
      return;
    }
  }
}

bool AddFile(X509_STORE* store, X509_LOOKUP_TYPE type, const std::string& path) {
  System::OwnedFile file = System::OpenForReading(path);
  if (file == nullptr) {
    return false;
  }
  const OpenSsl::OwnedBio source(BIO_new_fp(file.get(), BIO_CLOSE));
  if (source == nullptr) {
    return false;
  }
  static_cast<void>(file.release());
  type == X509_LU_CRL ? AddLists(store, source.get()) : AddCertificates(store, source.get());
  return true;
}

// OpenSSL adds a reference of its own to what it finds, so the one of `found` is given back.
bool SetFound(const X509_OBJECT* object, X509_LOOKUP_TYPE type, X509_OBJECT* found) {
  if (type == X509_LU_CRL) {
    X509_CRL* list = X509_OBJECT_get0_X509_CRL(object);
    if (list == nullptr || X509_OBJECT_set1_X509_CRL(found, list) != 1) {
      return false;
    }
    X509_CRL_free(list);
    return true;
  }
  X509* certificate = X509_OBJECT_get0_X509(object);
  if (certificate == nullptr || X509_OBJECT_set1_X509(found, certificate) != 1) {
    return false;
  }
  X509_free(certificate);
  return true;
}

bool Retrieve(X509_STORE* store, X509_LOOKUP_TYPE type, const X509_NAME* name, X509_OBJECT* found) {
  if (X509_STORE_lock(store) != 1) {
    return false;
  }
  const X509_OBJECT* object =
      X509_OBJECT_retrieve_by_subject(X509_STORE_get0_objects(store), type, name);
  const bool isFound = object != nullptr && SetFound(object, type, found);
  X509_STORE_unlock(store);
  return isFound;
}

bool Find(X509_LOOKUP* lookup, X509_LOOKUP_TYPE type, const X509_NAME* name, X509_OBJECT* found) {
  const auto* folders = static_cast<const Folders*>(X509_LOOKUP_get_method_data(lookup));
  int isHashed = 0;
  const unsigned long hash = X509_NAME_hash_ex(name, nullptr, nullptr, &isHashed);
  if (folders == nullptr || isHashed != 1) {
    return false;
  }
  X509_STORE* store = X509_LOOKUP_get_store(lookup);
  const char* kind = type == X509_LU_CRL ? "r" : "";
  for (const std::string& folder : *folders) {
    int number = 0;
    while (number < kMaxFilesOfName && AddFile(store, type, FileName(folder, hash, kind, number))) {
      ++number;
    }
  }
  return Retrieve(store, type, name, found);
}

int FindBySubject(X509_LOOKUP* lookup, X509_LOOKUP_TYPE type, const X509_NAME* name,
                  X509_OBJECT* found) {
  if (type != X509_LU_X509 && type != X509_LU_CRL) {
    return 0;
  }
  const OpenSsl::ErrorScope errors;
  try {
    return Find(lookup, type, name, found) ? 1 : 0;
  } catch (...) {
    return 0;  // no exception may pass through OpenSSL
  }
}

void FreeFolders(X509_LOOKUP* lookup) {
  delete static_cast<Folders*>(X509_LOOKUP_get_method_data(lookup));
}

X509_LOOKUP_METHOD* NewMethod() {
  X509_LOOKUP_METHOD* method = X509_LOOKUP_meth_new("Folders of CA certificates");
  if (method != nullptr) {
    X509_LOOKUP_meth_set_get_by_subject(method, FindBySubject);
    X509_LOOKUP_meth_set_free(method, FreeFolders);
  }
  return method;
}

}  // namespace

bool AddCaFolder(X509_STORE* store, const std::string& path) {
  // Never freed, since stores use it until the process ends.
  static X509_LOOKUP_METHOD* const method = NewMethod();
  // A store has one look-up of a method.
  X509_LOOKUP* lookup = method == nullptr ? nullptr : X509_STORE_add_lookup(store, method);
  if (lookup == nullptr) {
    return false;
  }
  auto* folders = static_cast<Folders*>(X509_LOOKUP_get_method_data(lookup));
  if (folders == nullptr) {
    auto owned = std::make_unique<Folders>();
    if (X509_LOOKUP_set_method_data(lookup, owned.get()) != 1) {
      return false;
    }
    folders = owned.release();
  }
  folders->push_back(path);
  return true;
}

}  // namespace Tarnik::Ssl
