#include "tls_setting.h"

#include <tarnik/crypto/private_key.h>
#include <tarnik/ssl/ssl_exception.h>

#include "fixed_random.h"
#include "input.h"
#include "support/ca_folder.h"
#include "support/key_texts.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace Fuzz {
namespace {

using Tarnik::Testing::CaFolder;
using Tarnik::Testing::Identity;
using Tarnik::Testing::IdentityOptions;
using Tarnik::Testing::MakeCrl;
using Tarnik::Testing::MakeIdentity;
using Tarnik::Testing::TemporaryFile;

constexpr long kLong = 10L * 365 * 24 * 3600;

Identity LongLived(const std::string& name, bool isCa, const Identity* issuer) {
  IdentityOptions options;
  options.commonName = name;
  options.isCa = isCa;
  options.addresses = {"192.0.2.7", "2001:db8::7"};
  options.notAfter = kLong;
  return MakeIdentity(options, issuer);
}

struct Pki {
  Identity root = LongLived("Root", true, nullptr);
  Identity other = LongLived("Other", true, nullptr);
  Identity intermediate = LongLived("Intermediate", true, &root);
  Identity direct = LongLived("direct", false, &root);
  Identity indirect = LongLived("indirect", false, &intermediate);
  Identity stranger = LongLived("stranger", false, &other);

  TemporaryFile rootFile{"A text before it.\n" + root.Pem()};
  CaFolder folder;
  TemporaryFile clean{MakeCrl(root, nullptr, kLong) + MakeCrl(intermediate, nullptr, kLong)};
  TemporaryFile revoking{MakeCrl(root, &direct, kLong) + MakeCrl(intermediate, &indirect, kLong)};
  TemporaryFile ofOthers{MakeCrl(other, nullptr, kLong)};
  TemporaryFile outdated{MakeCrl(root, nullptr, -60) + MakeCrl(intermediate, nullptr, -60)};

  Pki() { folder.Add(root, 0); }
};

const Pki& ThePki() {
  static const Pki pki = [] {
    FixRandomness(1);
    return Pki();
  }();
  return pki;
}

// Mostly the first value.
template <class Choice>
Choice Choose(FuzzedDataProvider& input, int last) {
  const int choice = input.ConsumeIntegralInRange(0, 4 * last);
  return static_cast<Choice>(choice <= last ? choice : 0);
}

}  // namespace

TlsSetting::TlsSetting(FuzzedDataProvider& input)
    : isTls13_(input.ConsumeBool()),
      trust_(Choose<Trust>(input, 7)),
      chain_(Choose<Chain>(input, 3)),
      lists_(Choose<Lists>(input, 5)),
      pin_(Choose<Pin>(input, 2)),
      name_(Choose<Name>(input, 4)),
      asksForCertificate_(input.ConsumeIntegralInRange(0, 3) == 3),
      hasCertificate_(input.ConsumeBool()) {
  ThePki();
}

Tarnik::OpenSsl::OwnedSslContext TlsSetting::ServerContext() const {
  Tarnik::OpenSsl::OwnedSslContext context(SSL_CTX_new(TLS_server_method()));
  const int version = isTls13_ ? TLS1_3_VERSION : TLS1_2_VERSION;
  SSL_CTX_set_min_proto_version(context.get(), version);
  SSL_CTX_set_max_proto_version(context.get(), version);
  const Pki& pki = ThePki();
  const Identity& own = chain_ == Chain::kDirect     ? pki.direct
                        : chain_ == Chain::kStranger ? pki.stranger
                                                     : pki.indirect;
  Require(SSL_CTX_use_certificate(context.get(), own.certificate.get()) == 1 &&
          SSL_CTX_use_PrivateKey(context.get(), own.key.get()) == 1);
  if (chain_ == Chain::kWithIntermediate) {
    Require(SSL_CTX_add1_chain_cert(context.get(), pki.intermediate.certificate.get()) == 1);
  }
  // Without it, sessions of clients with a certificate are not resumed.
  const unsigned char id[] = {'f'};
  SSL_CTX_set_session_id_context(context.get(), id, sizeof(id));
  if (asksForCertificate_) {
    SSL_CTX_set_verify(context.get(), SSL_VERIFY_PEER | SSL_VERIFY_FAIL_IF_NO_PEER_CERT,
                       [](int /*isValid*/, X509_STORE_CTX* /*context*/) { return 1; });
  }
  return context;
}

Tarnik::Ref<Tarnik::Ssl::SSLContext> TlsSetting::ClientContext() const {
  Tarnik::Ssl::SSLContextConfig config;
  AddLists(config);
  AddTrust(config);
  const Pki& pki = ThePki();
  if (pin_ != Pin::kNone) {
    const Identity& server = chain_ == Chain::kDirect ? pki.direct : pki.indirect;
    config.pinnedCertificates = {(pin_ == Pin::kServer ? server : pki.stranger).ToCertificate()};
  }
  if (hasCertificate_ || trust_ == Trust::kOtherKey) {
    config.clientCertificate =
        (trust_ == Trust::kOtherKey ? pki.direct : pki.indirect).ToCertificate();
    config.clientPrivateKey = Tarnik::Crypto::CreatePrivateKeyFromPem(
        Tarnik::Testing::ToPkcs8Pem(pki.indirect.key.get()));
    config.clientCertificateChain = {pki.intermediate.ToCertificate()};
  }
  try {
    return Tarnik::Ssl::CreateSSLContext(config);
  } catch (const Tarnik::Ssl::SSLException&) {
    return nullptr;
  }
}

void TlsSetting::AddTrust(Tarnik::Ssl::SSLContextConfig& config) const {
  const Pki& pki = ThePki();
  switch (trust_) {
    case Trust::kMemory:
      config.caCertificates = {pki.root.ToCertificate()};
      break;
    case Trust::kFile:
      config.caFiles = {pki.rootFile.Path()};
      break;
    case Trust::kFolder:
      config.caFolders = {pki.folder.Path()};
      break;
    case Trust::kSystem:
      config.useSystemStore = true;
      break;
    case Trust::kEmptyFile:
      config.caFiles = {pki.clean.Path()};
      break;
    case Trust::kNoFile:
      config.caFiles = {pki.folder.Path() + "/none"};
      break;
    case Trust::kBrokenList:
      config.crlFiles = {pki.rootFile.Path()};
      break;
    case Trust::kOtherKey:
      break;
  }
}

void TlsSetting::AddLists(Tarnik::Ssl::SSLContextConfig& config) const {
  const Pki& pki = ThePki();
  switch (lists_) {
    case Lists::kNone:
      break;
    case Lists::kClean:
      config.crlFiles = {pki.clean.Path()};
      break;
    case Lists::kRevoking:
      config.crlFiles = {pki.revoking.Path()};
      break;
    case Lists::kOfOthers:
      config.crlFiles = {pki.ofOthers.Path()};
      break;
    case Lists::kOutdated:
      config.crlFiles = {pki.outdated.Path()};
      break;
    case Lists::kBoth:
      config.crlFiles = {pki.clean.Path(), pki.revoking.Path()};
      break;
  }
}

std::string TlsSetting::Host() const {
  switch (name_) {
    case Name::kAddress:
      return "192.0.2.7";
    case Name::kLongAddress:
      return "2001:db8::7";
    case Name::kOtherHost:
      return "other.example";
    case Name::kOtherAddress:
      return "192.0.2.8";
    default:
      return "sts.example";
  }
}

bool TlsSetting::IsServerAcceptable() const {
  return trust_ != Trust::kSystem &&
         (chain_ == Chain::kDirect || chain_ == Chain::kWithIntermediate) &&
         (lists_ == Lists::kNone || lists_ == Lists::kClean) && pin_ != Pin::kOther &&
         name_ <= Name::kLongAddress;
}

bool TlsSetting::IsAcceptable() const {
  return IsServerAcceptable() && (hasCertificate_ || !asksForCertificate_);
}

}  // namespace Fuzz
