#include "client_pki.h"

#include <algorithm>
#include <ctime>

#include <openssl/x509.h>

#include "fixed_random.h"
#include "input.h"
#include "support/key_texts.h"

namespace Fuzz {
namespace {

using Tarnik::Testing::Identity;
using Tarnik::Testing::IdentityOptions;
using Tarnik::Testing::MakeCrl;
using Tarnik::Testing::MakeIdentity;

constexpr long kYears = 10L * 365 * 24 * 3600;

struct ClientPki {
  std::vector<NamedCertificate> certificates;
  std::vector<NamedList> lists;

  ClientPki() {
    FixRandomness(2);
    certificates.reserve(8);  // issuers are referred to
    Add("root", "root", true);
    Add("other", "other", true);
    Add("intermediate", "root", true);
    Add("direct", "root", false);
    Add("indirect", "intermediate", false);
    Add("stranger", "other", false);
    Add("expired", "root", false);
    Add("weak", "root", false);
    const std::time_t now = std::time(nullptr);
    AddList("root-list", "root", "", now, kYears);
    AddList("root-revokes", "root", "direct", now, kYears);
    AddList("root-outdated", "root", "", now, -60);
    AddList("intermediate-list", "intermediate", "", now, kYears);
    AddList("intermediate-revokes", "intermediate", "indirect", now, kYears);
    AddList("other-list", "other", "", now, kYears);
  }

  const NamedCertificate* Find(const std::string& name) const {
    const auto found = std::find_if(certificates.begin(), certificates.end(),
                                    [&](const auto& each) { return each.name == name; });
    return found == certificates.end() ? nullptr : &*found;
  }

 private:
  void Add(const std::string& name, const std::string& issuer, bool isCa) {
    IdentityOptions options;
    options.commonName = name;
    options.isCa = isCa;
    options.dnsNames = {kServerHost};
    options.addresses = {kServerAddress, kServerLongAddress};
    options.notAfter = name == "expired" ? -60 : kYears;
    options.rsaBits = name == "weak" ? 1024 : 0;
    const NamedCertificate* issuing = Find(issuer);
    certificates.push_back(
        {name, issuer, name == "expired",
         MakeIdentity(options, issuing == nullptr ? nullptr : &issuing->identity)});
  }

  void AddList(const std::string& name, const std::string& issuer, const std::string& revoked,
               std::time_t now, long nextUpdate) {
    const NamedCertificate* certificate = Find(revoked);
    lists.push_back(
        {name, issuer, revoked, nextUpdate < 0,
         MakeCrl(Find(issuer)->identity, certificate == nullptr ? nullptr : &certificate->identity,
                 nextUpdate, -3600, now)});
  }
};

const ClientPki& Pki() {
  static const ClientPki pki;
  return pki;
}

}  // namespace

const NamedCertificate* FindCertificate(const std::string& name) {
  return Pki().Find(name);
}

const NamedList* FindList(const std::string& name) {
  const auto& lists = Pki().lists;
  const auto found = std::find_if(lists.begin(), lists.end(),
                                  [&](const NamedList& each) { return each.name == name; });
  return found == lists.end() ? nullptr : &*found;
}

std::vector<const NamedCertificate*> ChainOf(const std::string& name) {
  std::vector<const NamedCertificate*> chain{FindCertificate(name)};
  while (chain.back()->issuer != chain.back()->name) {
    chain.push_back(FindCertificate(chain.back()->issuer));
  }
  return chain;
}

std::string PartOf(const std::string& word) {
  if (const NamedCertificate* certificate = FindCertificate(word)) {
    return certificate->identity.Pem();
  }
  if (const NamedList* list = FindList(word)) {
    return list->pem;
  }
  if (word == "text") {
    return "A text between the parts.\n";
  }
  if (word == "key") {
    return KeyOf(*FindCertificate("direct"));
  }
  return word == "broken" ? "-----BEGIN CERTIFICATE-----\nMIIB\n-----END CERTIFICATE-----\n" : "";
}

std::string DerOfRoot() {
  unsigned char* der = nullptr;
  const int length = i2d_X509(FindCertificate("root")->identity.certificate.get(), &der);
  const Tarnik::OpenSsl::OwnedMemory<unsigned char> owner(der);
  Require(length > 0);
  return {reinterpret_cast<const char*>(der), static_cast<std::size_t>(length)};
}

std::string KeyOf(const NamedCertificate& certificate) {
  return Tarnik::Testing::ToPkcs8Pem(certificate.identity.key.get());
}

}  // namespace Fuzz
