#include "trust/trust_fixture.h"

#include <deque>
#include <filesystem>

namespace SsoClient::Access::Testing {

const Identity& Sts(std::size_t number) {
  static std::deque<Identity> made;
  while (made.size() <= number) {
    Tarnik::Testing::IdentityOptions options;
    options.commonName = "sts-" + std::to_string(made.size());
    made.push_back(Tarnik::Testing::MakeIdentity(options, &TrustCa()));
  }
  return made[number];
}

const Identity& TrustCa() {
  static const Identity ca = Tarnik::Testing::MakeCa("Authority");
  return ca;
}

const Identity& StrangeCa() {
  static const Identity ca = Tarnik::Testing::MakeCa("Authority");
  return ca;
}

Names SignersOf(const TrustSnapshot& trust, const std::string& issuer) {
  Names names;
  if (const IssuerTrust* const found = trust.Find(issuer)) {
    for (const Signer& signer : found->signers) {
      names.push_back(signer.certificate->SubjectName());
    }
  }
  return names;
}

DescriptorShortage::DescriptorShortage() {
  getrlimit(RLIMIT_NOFILE, &before_);
  rlimit none = before_;
  none.rlim_cur = 0;
  setrlimit(RLIMIT_NOFILE, &none);
}

TrustFixture::TrustFixture() {
  std::filesystem::create_directory(PathOf("trust"));
  Put("trust/a.pem", Sts(0).Pem());
  config.name = "orders";
  config.issuers.resize(1);
  config.issuers[0].issuer = kIssuer;
  config.issuers[0].certificatePaths = {PathOf("trust")};
  config.listener = listener;
}

std::string TrustFixture::Put(const std::string& name, const std::string& content) const {
  const std::string written = root.Write(".new", content);
  std::filesystem::rename(written, PathOf(name));
  return PathOf(name);
}

void TrustFixture::Remove(const std::string& name) const {
  std::filesystem::remove_all(PathOf(name));
}

void TrustFixture::Rename(const std::string& from, const std::string& to) const {
  std::filesystem::rename(PathOf(from), PathOf(to));
}

std::string TrustFixture::Failure() const {
  return WithoutRoot(store->Describe().failure);
}

std::string TrustFixture::WithoutRoot(std::string text) const {
  for (auto place = text.find(root.Path()); place != std::string::npos;
       place = text.find(root.Path())) {
    text.erase(place, root.Path().size());
  }
  return text;
}

}  // namespace SsoClient::Access::Testing
