#include "gate/gate_case.h"

#include <algorithm>
#include <array>
#include <map>
#include <optional>
#include <stdexcept>
#include <utility>

#include <boost/smart_ptr/intrusive_ptr.hpp>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/data_signature.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/text/string_util.h>

#include "token_originals.h"

namespace Fuzz {
namespace {

namespace Access = SsoClient::Access;
using Tarnik::Ref;
using Tarnik::Crypto::Certificate;
using Tarnik::Crypto::SignatureAlgorithm;
using Tarnik::Xml::Security::CertificateCandidatesResolver;

constexpr long kHour = 3600;
constexpr long kMicrosecondsPerSecond = 1'000'000;
const std::string kIssuer = "https://sts.example.com/STS";
const std::string kChallenge = "a challenge";
constexpr std::size_t kFirstLayoutOfHolder = 6;

const Ref<const Certificate>& CertificateOfSigner(std::size_t signer) {
  static const std::vector<Ref<const Certificate>> certificates = [] {
    std::vector<Ref<const Certificate>> all;
    for (const Signer& known : Signers()) {
      all.push_back(
          Tarnik::Crypto::CreateCertificatesFromPem(known.credential.certificatePem).front());
    }
    return all;
  }();
  return certificates.at(signer);
}

// The holder of the key of the last layouts, whose key is that of the first signer.
const Ref<const Certificate>& Holder() {
  static const Ref<const Certificate> holder = [] {
    const std::string& layout = Layouts().at(kFirstLayoutOfHolder);
    const std::string begin = "<ds:X509Certificate>";
    const std::size_t start = layout.find(begin) + begin.size();
    std::vector<unsigned char> der;
    Tarnik::StringUtil::Base64Decode(layout.substr(start, layout.find('<', start) - start), der);
    return Tarnik::Crypto::CreateCertificateFromDer(der.data(), der.size());
  }();
  return holder;
}

// A signature by the key of a signer. Made once, since signing takes longer than all checks.
Access::Presenter SigningAs(std::size_t signer, const std::string& data,
                            SignatureAlgorithm algorithm) {
  const auto key =
      Tarnik::Crypto::CreatePrivateKeyFromPem(Signers().at(signer).credential.privateKeyPem);
  return Access::Presenter::WithSignature(
      kChallenge, Tarnik::Crypto::SignData(*key, algorithm, data), algorithm);
}

std::array<Access::Presenter, kSenders> MakePresenters() {
  return {Access::Presenter::Nobody(),
          Access::Presenter::WithTlsCertificate(Holder()),
          Access::Presenter::WithTlsCertificate(CertificateOfSigner(0)),
          SigningAs(0, kChallenge, SignatureAlgorithm::kEcdsaSha256),
          SigningAs(1, kChallenge, SignatureAlgorithm::kEcdsaSha384),
          SigningAs(0, "other data", SignatureAlgorithm::kEcdsaSha256)};
}

Access::Signer SignerOf(const TrustedCase& trusted) {
  Access::Signer signer;
  signer.certificate = CertificateOfSigner(trusted.signer);
  signer.notBefore = AtSecond(trusted.notBefore);
  signer.notAfter = AtSecond(trusted.notAfter);
  signer.resolver = Signers().at(trusted.signer).resolver;
  signer.name = "signer " + std::to_string(trusted.signer);
  signer.isRevocationChecked = trusted.isChecked;
  if (trusted.isCovered) {
    signer.listFrom = AtSecond(trusted.listFrom);
    signer.listUntil = AtSecond(trusted.listUntil);
  }
  if (trusted.isRevoked) {
    signer.revokedSince = AtSecond(trusted.listFrom);
  }
  return signer;
}

TrustedCase MakeTrusted(std::size_t signer, FuzzedDataProvider& input) {
  TrustedCase trusted;
  trusted.signer = signer;
  trusted.notBefore = -10 * kHour;
  trusted.notAfter = 10 * kHour;
  trusted.listFrom = -10 * kHour;
  trusted.listUntil = 10 * kHour;
  const auto flaws = input.ConsumeIntegral<std::uint8_t>();
  if ((flaws & 3U) == 1) {
    trusted.notAfter = input.ConsumeIntegralInRange<long>(-2 * kHour, 2 * kHour);
  }
  if ((flaws & 3U) == 2) {
    trusted.notBefore = input.ConsumeIntegralInRange<long>(-2 * kHour, 2 * kHour);
  }
  trusted.isChecked = (flaws & 4U) != 0;
  trusted.isCovered = (flaws & 24U) != 8;
  trusted.isRevoked = (flaws & 96U) == 32;
  if ((flaws & 128U) != 0) {
    trusted.listUntil = input.ConsumeIntegralInRange<long>(-2 * kHour, 2 * kHour);
  }
  return trusted;
}

// Signing takes longer than everything else, so the results are kept. Nothing for options with
// which the oracle cannot sign.
const std::optional<std::string>& SignedLayout(std::size_t layout, std::size_t signer,
                                               DevSts::KeyInfoContent keyInfo) {
  static std::map<std::array<std::size_t, 3>, std::optional<std::string>> known;
  const std::array<std::size_t, 3> key{layout, signer, static_cast<std::size_t>(keyInfo)};
  if (const auto found = known.find(key); found != known.end()) {
    return found->second;
  }
  const Signer& made = Signers().at(signer);
  DevSts::SignOptions options;
  options.signature = made.algorithm;
  options.keyInfo = keyInfo;
  std::optional<std::string> xml;
  try {
    xml = DevSts::SignXml(Layouts().at(layout), made.credential.privateKeyPem,
                          made.credential.certificatePem, options);
  } catch (const DevSts::XmlError&) {
    // no form for the key
  }
  return known.emplace(key, std::move(xml)).first->second;
}

}  // namespace

const Tarnik::System::DateTime& Epoch() {
  static const Tarnik::System::DateTime epoch = [] {
    Layouts();  // which are valid from now on
    return Tarnik::System::GetUtcDateTime();
  }();
  return epoch;
}

Tarnik::System::DateTime AtSecond(long seconds) {
  return Tarnik::System::DateTimeFromUtc(Epoch().GetUtcTime() + seconds * kMicrosecondsPerSecond,
                                         false);
}

TrustCase MakeTrustCase(FuzzedDataProvider& input) {
  const auto chosen = input.ConsumeIntegralInRange<unsigned>(0, (1U << kGateSigners) - 1);
  TrustCase trust;
  for (std::size_t signer = 0; signer < kGateSigners; ++signer) {
    if ((chosen >> signer & 1U) != 0) {
      trust.push_back(MakeTrusted(signer, input));
    }
  }
  if (input.ConsumeBool()) {
    std::reverse(trust.begin(), trust.end());
  }
  return trust;
}

Access::TrustSnapshot SnapshotOf(const TrustCase& trust) {
  static std::uint64_t version = 0;
  Access::IssuerTrust issuer;
  std::vector<Ref<const Certificate>> certificates;
  for (const TrustedCase& trusted : trust) {
    issuer.signers.push_back(SignerOf(trusted));
    certificates.push_back(issuer.signers.back().certificate);
  }
  std::map<std::string, Access::IssuerTrust, std::less<>> named;
  if (!certificates.empty()) {
    issuer.resolver = boost::dynamic_pointer_cast<const CertificateCandidatesResolver>(
        Tarnik::Xml::Security::CreateTrustedCertificatesResolver(std::move(certificates)));
    named.emplace(kIssuer, std::move(issuer));
  }
  return {std::move(named), {}, ++version};
}

Access::Presenter PresenterOf(Sender sender) {
  static const std::array<Access::Presenter, kSenders> presenters = MakePresenters();
  return presenters.at(static_cast<std::size_t>(sender));
}

Access::GateConfig MakeGateConfig(FuzzedDataProvider& input, PredicateCase& predicate) {
  static const std::vector<std::vector<std::string>> audiences{
      {"https://a.example"},  {"https://c.example", "https://b.example"},
      {"https://a.example/"}, {"https://A.example"},
      {"https://a.exampl"},   {"a"}};
  Access::GateConfig config;
  const auto choices = input.ConsumeIntegral<std::uint8_t>();
  config.audiences = audiences[choices % 16U < audiences.size() ? choices % 16U : 0];
  config.acceptsUnrestrictedTokens = (choices & 16U) == 0;
  config.bearerTokens =
      (choices & 96U) == 32 ? Access::BearerTokens::kRefuse : Access::BearerTokens::kAccept;
  const auto limits = input.ConsumeIntegral<std::uint8_t>();
  config.clockTolerance = std::chrono::seconds((limits & 3U) * 300);
  config.longestLifetime = std::chrono::seconds((limits & 12U) == 4 ? kHour : 2 * kHour);
  config.deepestDelegation = (limits & 48U) == 16 ? 1 : 10;
  config.cache.tokens = (limits & 192U) == 64 ? 0 : (limits & 192U) == 128 ? 1 : 100;
  predicate = static_cast<PredicateCase>(std::max(input.ConsumeIntegralInRange<int>(-6, 3), 0));
  if (predicate != PredicateCase::kNone) {
    config.predicate = [predicate](const SsoClient::SamlToken&, std::string&) {
      if (predicate == PredicateCase::kThrows) {
        throw std::runtime_error("no predicate today");
      }
      return predicate == PredicateCase::kAccepts;
    };
  }
  return config;
}

GateToken MakeGateToken(FuzzedDataProvider& input) {
  GateToken token;
  token.signer = input.ConsumeIntegralInRange<std::size_t>(0, kGateSigners - 1);
  const auto layout = input.ConsumeIntegralInRange<std::size_t>(0, Layouts().size() - 1);
  token.keyInfo = static_cast<DevSts::KeyInfoContent>(input.ConsumeIntegralInRange<int>(0, 2));
  const std::optional<std::string>* xml = &SignedLayout(layout, token.signer, token.keyInfo);
  if (!*xml) {
    token.keyInfo = DevSts::KeyInfoContent::None;
    xml = &SignedLayout(layout, token.signer, token.keyInfo);
  }
  token.text = xml->value();
  return token;
}

}  // namespace Fuzz
