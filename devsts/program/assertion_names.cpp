#include "assertion_names.h"

#include <functional>
#include <string>
#include <utility>

#include "fault_names.h"
#include "value_forms.h"

namespace DevSts::Program {
namespace {

using Value = const std::string&;

SignatureAlgorithm SignatureFrom(Value value) {
  return ChoiceFrom<SignatureAlgorithm>(value,
                                        {{"rsa-sha256", SignatureAlgorithm::RsaSha256},
                                         {"rsa-sha384", SignatureAlgorithm::RsaSha384},
                                         {"rsa-sha512", SignatureAlgorithm::RsaSha512},
                                         {"rsa-pss-sha256", SignatureAlgorithm::RsaPssSha256},
                                         {"rsa-pss-sha384", SignatureAlgorithm::RsaPssSha384},
                                         {"rsa-pss-sha512", SignatureAlgorithm::RsaPssSha512},
                                         {"ecdsa-sha256", SignatureAlgorithm::EcdsaSha256},
                                         {"ecdsa-sha384", SignatureAlgorithm::EcdsaSha384},
                                         {"ecdsa-sha512", SignatureAlgorithm::EcdsaSha512},
                                         {"rsa-sha1", SignatureAlgorithm::RsaSha1}});
}

DigestAlgorithm DigestFrom(Value value) {
  return ChoiceFrom<DigestAlgorithm>(value, {{"sha256", DigestAlgorithm::Sha256},
                                             {"sha384", DigestAlgorithm::Sha384},
                                             {"sha512", DigestAlgorithm::Sha512},
                                             {"sha1", DigestAlgorithm::Sha1}});
}

CanonicalMode CanonicalFrom(Value value) {
  return ChoiceFrom<CanonicalMode>(
      value, {{"exclusive", CanonicalMode::Exclusive},
              {"exclusive-with-comments", CanonicalMode::ExclusiveWithComments},
              {"inclusive", CanonicalMode::Inclusive},
              {"inclusive-with-comments", CanonicalMode::InclusiveWithComments}});
}

KeyType KeyTypeFrom(Value value) {
  return ChoiceFrom<KeyType>(value, {{"rsa-2048", KeyType::Rsa2048},
                                     {"rsa-3072", KeyType::Rsa3072},
                                     {"rsa-1024", KeyType::Rsa1024},
                                     {"ec-p256", KeyType::EcP256},
                                     {"ec-p384", KeyType::EcP384}});
}

using Hook = std::function<void(std::string&)>;

Hook Edited(Hook before, Value value) {
  return [before = std::move(before), edit = SubstitutionFrom(value)](std::string& assertion) {
    if (before) {
      before(assertion);
    }
    edit(assertion);
  };
}

unsigned CountFrom(Value value) {
  return static_cast<unsigned>(NumberFrom(value));
}

std::chrono::seconds SecondsFrom(Value value) {
  return std::chrono::duration_cast<std::chrono::seconds>(TimeFrom(value));
}

Vocabulary<AssertionOptions> SigningNames() {
  return {
      {"signature", "ALGORITHM",
       "rsa-sha256 (default), -sha384 or -sha512, rsa-pss-sha256, ..., ecdsa-sha256, ..., rsa-sha1",
       [](Value value, AssertionOptions& target) {
         target.signing.signature = SignatureFrom(value);
       }},
      {"digest", "ALGORITHM", "sha256 (default), sha384, sha512 or sha1",
       [](Value value, AssertionOptions& target) { target.signing.digest = DigestFrom(value); }},
      {"canonical-form", "FORM",
       "exclusive (default) or inclusive, each also with -with-comments at its end",
       [](Value value, AssertionOptions& target) {
         target.signing.canonicalization = CanonicalFrom(value);
       }},
      {"prefixes", "PREFIX,...", "the prefixes that the exclusive form includes, or none",
       [](Value value, AssertionOptions& target) {
         target.signing.inclusivePrefixes =
             value == "none" ? std::vector<std::string>() : ListFrom(value);
       }},
      {"key-info", "CONTENT", "certificate (default), key or none",
       [](Value value, AssertionOptions& target) {
         target.signing.keyInfo =
             ChoiceFrom<KeyInfoContent>(value, {{"certificate", KeyInfoContent::X509Data},
                                                {"key", KeyInfoContent::KeyValue},
                                                {"none", KeyInfoContent::None}});
       }},
      {"signed-id", "ID", "signs the element with this ID",
       [](Value value, AssertionOptions& target) { target.signing.id = value; }},
      {"reference-uri", "URI", "the URI of the reference in the signature",
       [](Value value, AssertionOptions& target) { target.signing.referenceUri = value; }},
      {"signing-key", "TYPE",
       "rsa-2048 (default), rsa-3072, rsa-1024, ec-p256 or ec-p384; only at the start",
       [](Value value, AssertionOptions& target) { target.signingKey = KeyTypeFrom(value); }},
      {"before-signing", "/FROM/TO/", "replaces a text before the signature; may be repeated",
       [](Value value, AssertionOptions& target) {
         target.beforeSigning = Edited(std::move(target.beforeSigning), value);
       }},
      {"after-signing", "/FROM/TO/", "replaces a text after the signature; may be repeated",
       [](Value value, AssertionOptions& target) {
         target.afterSigning = Edited(std::move(target.afterSigning), value);
       }},
  };
}

Vocabulary<AssertionOptions> ContentNames() {
  return {
      {"inherit-namespaces", "yes|no", "declares the namespaces on the SOAP envelope (no)",
       [](Value value, AssertionOptions& target) { target.inheritNamespaces = FlagFrom(value); }},
      {"indent", "yes|no", "writes line breaks between elements (no)",
       [](Value value, AssertionOptions& target) { target.indent = FlagFrom(value); }},
      {"issuer-format", "yes|no", "writes the Format of Issuer (yes)",
       [](Value value, AssertionOptions& target) { target.issuerFormat = FlagFrom(value); }},
      {"attribute-types", "yes|no", "writes the type of each AttributeValue (yes)",
       [](Value value, AssertionOptions& target) { target.attributeValueTypes = FlagFrom(value); }},
      {"renew-count", "N", "how often a renewable token can be renewed (10)",
       [](Value value, AssertionOptions& target) { target.renewCount = CountFrom(value); }},
      {"proxy-count", "N", "how often a delegable token can be delegated (10)",
       [](Value value, AssertionOptions& target) { target.proxyCount = CountFrom(value); }},
      {"postdatable", "yes|no", "a renewed token may begin in the future (no)",
       [](Value value, AssertionOptions& target) { target.postdatable = FlagFrom(value); }},
      {"renew-expired", "yes|no", "an expired token may be renewed (no)",
       [](Value value, AssertionOptions& target) { target.renewExpired = FlagFrom(value); }},
      {"max-lifetime", "TIME", "the longest lifetime of a token (30d)",
       [](Value value, AssertionOptions& target) { target.maxLifetime = SecondsFrom(value); }},
      {"not-before-offset", "TIME", "tokens begin this long before now (0s)",
       [](Value value, AssertionOptions& target) { target.notBeforeOffset = SecondsFrom(value); }},
  };
}

Vocabulary<AssertionOptions> AllAssertionNames() {
  Vocabulary<AssertionOptions> all = SigningNames();
  const Vocabulary<AssertionOptions> content = ContentNames();
  all.insert(all.end(), content.begin(), content.end());
  return all;
}

}  // namespace

const Vocabulary<AssertionOptions>& AssertionNames() {
  static const Vocabulary<AssertionOptions> names = AllAssertionNames();
  return names;
}

void RequireMatchingKey(const AssertionOptions& options) {
  const SignatureAlgorithm algorithm = options.signing.signature;
  const bool needsEc = algorithm == SignatureAlgorithm::EcdsaSha256 ||
                       algorithm == SignatureAlgorithm::EcdsaSha384 ||
                       algorithm == SignatureAlgorithm::EcdsaSha512;
  const bool isEc = options.signingKey == KeyType::EcP256 || options.signingKey == KeyType::EcP384;
  if (needsEc != isEc) {
    throw std::invalid_argument(needsEc ? "the signature needs signing-key=ec-p256 or ec-p384"
                                        : "the signature needs an RSA key, or signature=ecdsa-...");
  }
}

const Vocabulary<NegotiationScript>& NegotiationNames() {
  static const Vocabulary<NegotiationScript> names{
      {"request-mic", "", "both sides sign the list of mechanisms, which takes a second leg",
       [](Value, NegotiationScript& target) { target.requestMic = true; }},
      {"more-legs", "N", "asks for this many more legs after the login",
       [](Value value, NegotiationScript& target) { target.moreLegs = CountFrom(value); }},
      {"fail-at-leg", "N", "answers this leg with the fault wst:FailedAuthentication",
       [](Value value, NegotiationScript& target) { target.failAtLeg = CountFrom(value); }},
      {"leg-fault", "CODE", "another code for the fault of fail-at-leg",
       [](Value value, NegotiationScript& target) { SetFaultCode(value, target.failure); }},
      {"leg-fault-text", "TEXT", "the faultstring of the fault of fail-at-leg",
       [](Value value, NegotiationScript& target) {
         target.failure.faultString = OctetsFrom(value);
       }},
      {"leg-fault-status", "N", "the HTTP status of the fault of fail-at-leg (500)",
       [](Value value, NegotiationScript& target) {
         target.failure.httpStatus = HttpStatusFrom(value);
       }},
  };
  return names;
}

}  // namespace DevSts::Program
