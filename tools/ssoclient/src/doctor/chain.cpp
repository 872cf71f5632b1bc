#include "doctor/chain.h"

#include <algorithm>
#include <array>
#include <memory>
#include <stdexcept>

#include <arpa/inet.h>
#include <openssl/ssl.h>
#include <openssl/x509_vfy.h>
#include <openssl/x509v3.h>

#include <tarnik/crypto/certificate.h>
#include <tarnik/text/display_text.h>

namespace SsoClient::Tool::Doctor {
namespace {

constexpr std::size_t kShownName = 256;
// The security level of the library's connections.
constexpr int kSecurityLevel = 2;

struct FreeStore {
  void operator()(X509_STORE* store) const noexcept { X509_STORE_free(store); }
};
struct FreeStoreContext {
  void operator()(X509_STORE_CTX* context) const noexcept { X509_STORE_CTX_free(context); }
};
struct FreeStack {
  void operator()(STACK_OF(X509) * stack) const noexcept { sk_X509_free(stack); }
};
struct FreeNames {
  void operator()(GENERAL_NAMES* names) const noexcept { GENERAL_NAMES_free(names); }
};
struct FreeObjects {
  void operator()(STACK_OF(X509_OBJECT) * objects) const noexcept {
    sk_X509_OBJECT_pop_free(objects, X509_OBJECT_free);
  }
};
using OwnedStore = std::unique_ptr<X509_STORE, FreeStore>;

void Require(bool isDone, const std::string& what) {
  if (!isDone) {
    throw std::runtime_error(what);
  }
}

std::vector<unsigned char> DerOf(const X509& certificate) {
  const int size = i2d_X509(&certificate, nullptr);
  Require(size > 0, "a certificate of the service cannot be encoded");
  std::vector<unsigned char> der(static_cast<std::size_t>(size));
  unsigned char* at = der.data();
  i2d_X509(&certificate, &at);
  return der;
}

std::string AddressText(const ASN1_OCTET_STRING* octets) {
  const int size = ASN1_STRING_length(octets);
  std::array<char, INET6_ADDRSTRLEN> text{};
  const int family = size == 4 ? AF_INET : AF_INET6;
  const bool isAddress =
      (size == 4 || size == 16) &&
      inet_ntop(family, ASN1_STRING_get0_data(octets), text.data(), text.size()) != nullptr;
  return isAddress ? text.data() : "?";
}

std::vector<std::string> NamesOf(const X509& certificate) {
  std::vector<std::string> all;
  const std::unique_ptr<GENERAL_NAMES, FreeNames> names(static_cast<GENERAL_NAMES*>(
      X509_get_ext_d2i(&certificate, NID_subject_alt_name, nullptr, nullptr)));
  for (int i = 0; i < sk_GENERAL_NAME_num(names.get()); ++i) {
    const GENERAL_NAME* name = sk_GENERAL_NAME_value(names.get(), i);
    if (name->type == GEN_DNS) {
      const auto* text = reinterpret_cast<const char*>(ASN1_STRING_get0_data(name->d.dNSName));
      const auto size = static_cast<std::size_t>(ASN1_STRING_length(name->d.dNSName));
      all.push_back(Tarnik::ToDisplayText({text, size}, kShownName));
    } else if (name->type == GEN_IPADD) {
      all.push_back(AddressText(name->d.iPAddress));
    }
  }
  return all;
}

OwnedStore MakeStore(const ChainTrust& trust) {
  OwnedStore store(X509_STORE_new());
  Require(store != nullptr, "no memory for the trusted CAs");
  if (trust.caFiles.empty()) {
    Require(X509_STORE_set_default_paths(store.get()) == 1, "the CAs of the system do not load");
  }
  for (const std::string& path : trust.caFiles) {
    Require(X509_STORE_load_file(store.get(), path.c_str()) == 1, "'" + path + "' does not load");
  }
  for (const std::string& path : trust.crlFiles) {
    X509_LOOKUP* lookup = X509_STORE_add_lookup(store.get(), X509_LOOKUP_file());
    Require(lookup != nullptr && X509_load_crl_file(lookup, path.c_str(), X509_FILETYPE_PEM) > 0,
            "'" + path + "' does not load");
  }
  return store;
}

int RecordError(int isValid, X509_STORE_CTX* context) {
  if (isValid == 0) {
    auto* errors = static_cast<std::set<int>*>(X509_STORE_CTX_get_app_data(context));
    errors->insert(X509_STORE_CTX_get_error(context));
  }
  return 1;  // collects all errors
}

void SetExpectations(X509_VERIFY_PARAM* parameters, const std::string& expected,
                     bool checksRevocation) {
  X509_VERIFY_PARAM_set_auth_level(parameters, kSecurityLevel);
  if (checksRevocation) {
    X509_VERIFY_PARAM_set_flags(parameters, X509_V_FLAG_CRL_CHECK | X509_V_FLAG_CRL_CHECK_ALL);
  }
  if (X509_VERIFY_PARAM_set1_ip_asc(parameters, expected.substr(0, expected.find('%')).c_str()) ==
      1) {
    return;
  }
  // RFC 9525, section 6: neither partial wildcards nor the common name.
  X509_VERIFY_PARAM_set_hostflags(
      parameters, X509_CHECK_FLAG_NO_PARTIAL_WILDCARDS | X509_CHECK_FLAG_NEVER_CHECK_SUBJECT);
  const std::size_t size = expected.size() - (expected.ends_with('.') ? 1 : 0);
  Require(X509_VERIFY_PARAM_set1_host(parameters, expected.c_str(), size) == 1,
          "the name of the service cannot be checked");
}

bool HasCaNamed(X509_STORE* store, const X509_NAME* name) {
  // A copy of the list, since that of the store needs its lock.
  const std::unique_ptr<STACK_OF(X509_OBJECT), FreeObjects> objects(sk_X509_OBJECT_deep_copy(
      X509_STORE_get0_objects(store),
      [](const X509_OBJECT* object) {
        X509_OBJECT* copy = X509_OBJECT_new();
        if (copy != nullptr && X509_OBJECT_get_type(object) == X509_LU_X509) {
          X509_OBJECT_set1_X509(copy, X509_OBJECT_get0_X509(object));
        }
        return copy;
      },
      X509_OBJECT_free));
  for (int i = 0; i < sk_X509_OBJECT_num(objects.get()); ++i) {
    const X509_OBJECT* object = sk_X509_OBJECT_value(objects.get(), i);
    const X509* certificate =
        X509_OBJECT_get_type(object) == X509_LU_X509 ? X509_OBJECT_get0_X509(object) : nullptr;
    if (certificate != nullptr && X509_NAME_cmp(X509_get_subject_name(certificate), name) == 0) {
      return true;
    }
  }
  return false;
}

}  // namespace

ChainLink Describe(const X509& certificate) {
  const std::vector<unsigned char> der = DerOf(certificate);
  const auto known = Tarnik::Crypto::CreateCertificateFromDer(der.data(), der.size());
  ChainLink link;
  link.subject = Tarnik::ToDisplayText(known->SubjectName(), kShownName);
  link.issuer = Tarnik::ToDisplayText(known->IssuerName(), kShownName);
  link.fingerprint = Tarnik::Crypto::FingerprintText(*known);
  link.names = NamesOf(certificate);
  link.notBefore = known->NotBefore();
  link.notAfter = known->NotAfter();
  link.isSelfIssued = known->SubjectName() == known->IssuerName();
  return link;
}

ChainFacts Verify(const std::vector<OwnedX509>& chain, const ChainTrust& trust,
                  const std::string& expectedName) {
  ChainFacts facts;
  facts.expectedName = expectedName;
  const std::unique_ptr<STACK_OF(X509), FreeStack> sent(sk_X509_new_null());
  for (const OwnedX509& certificate : chain) {
    facts.links.push_back(Describe(*certificate));
    Require(sent != nullptr && sk_X509_push(sent.get(), certificate.get()) > 0, "no memory");
  }
  const OwnedStore store = MakeStore(trust);
  facts.isIssuerNameTrusted = !facts.links.back().isSelfIssued &&
                              HasCaNamed(store.get(), X509_get_issuer_name(chain.back().get()));
  const std::unique_ptr<X509_STORE_CTX, FreeStoreContext> context(X509_STORE_CTX_new());
  Require(context != nullptr &&
              X509_STORE_CTX_init(context.get(), store.get(), chain.front().get(), sent.get()) == 1,
          "no memory");
  X509_STORE_CTX_set_default(context.get(), "ssl_server");
  SetExpectations(X509_STORE_CTX_get0_param(context.get()), expectedName, !trust.crlFiles.empty());
  X509_STORE_CTX_set_app_data(context.get(), &facts.errors);
  X509_STORE_CTX_set_verify_cb(context.get(), RecordError);
  if (X509_verify_cert(context.get()) <= 0 && facts.errors.empty()) {
    facts.errors.insert(X509_STORE_CTX_get_error(context.get()));
  }
  return facts;
}

}  // namespace SsoClient::Tool::Doctor
