#include "token_entries.h"

#include <functional>
#include <memory>
#include <vector>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>
#include <tarnik/core/exception.h>

#include "input.h"
#include "support/token_values.h"
#include "xml_input.h"

namespace Fuzz {
namespace {

using namespace SsoClient;
using Tarnik::Xml::Security::KeyInfoResolver;
using Token = std::shared_ptr<const SamlToken>;
using Entry = std::function<Token(const std::string& xml, Tarnik::Xml::ElementNode* element,
                                  const Tarnik::Ref<const KeyInfoResolver>& resolver)>;
using Text = const std::string&;
using Element = Tarnik::Xml::ElementNode*;
using Resolver = const Tarnik::Ref<const KeyInfoResolver>&;

constexpr long kTolerance = 600;

const std::vector<Entry>& EntriesThatVerify() {
  static const std::vector<Entry> entries{
      [](Text xml, Element, Resolver resolver) { return CreateSamlToken(xml, resolver.get()); },
      [](Text xml, Element, Resolver resolver) {
        return CreateSamlToken(xml, [&resolver](const SamlToken*) { return resolver; });
      },
      [](Text, Element element, Resolver resolver) {
        return CreateSamlTokenFromDom(element, resolver.get());
      },
      [](Text xml, Element, Resolver resolver) {
        return CreateSamlTokenFactory(resolver.get())->CreateToken(xml);
      },
      [](Text xml, Element, Resolver resolver) {
        return CreateSamlTokenFactory(resolver.get())->CreateToken(xml, kTolerance);
      },
      [](Text, Element element, Resolver resolver) {
        return CreateSamlTokenFactory(resolver.get())->CreateToken(element);
      },
      [](Text, Element element, Resolver resolver) {
        return CreateSamlTokenFactory(resolver.get())->CreateToken(element, kTolerance);
      }};
  return entries;
}

const std::vector<Entry>& EntriesThatOnlyRead() {
  static const std::vector<Entry> entries{
      [](Text xml, Element, Resolver) { return CreateSamlToken(xml); },
      [](Text xml, Element, Resolver) { return CreateSamlToken(xml, kTolerance); },
      [](Text, Element element, Resolver) { return CreateSamlTokenFromDom(element); },
      [](Text, Element element, Resolver) { return CreateSamlTokenFromDom(element, kTolerance); }};
  return entries;
}

void RequireAccepted(const Entry& entry, const std::string& xml, const Signer& signer,
                     const std::string& values) {
  const auto document = ParseXml(xml);
  const Token token = entry(xml, document->RootElement(), signer.resolver);
  Require(Testing::AllValues(*token) == values);
  Require(token->GetSignature()->Verify(signer.resolver.get()));
  Require(token->ExpirationTimeWithTolerance().GetUtcTime() ==
          token->ExpirationTime().GetUtcTime() + kTolerance * 1'000'000);
}

void RequireRefused(const Entry& entry, const std::string& xml, const Signer& other) {
  const auto document = ParseXml(xml);
  bool isRefused = false;
  try {
    entry(xml, document->RootElement(), other.resolver);
  } catch (const InvalidSignatureException&) {
    isRefused = true;
  }
  Require(isRefused);
}

// Nothing verifies a token without a resolver, but a caller asked for that.
void RequireResolver(const std::string& xml) {
  int refusals = 0;
  try {
    CreateSamlToken(xml, [](const SamlToken*) { return nullptr; });
  } catch (const InvalidSignatureException&) {
    ++refusals;
  }
  try {
    CreateSamlToken(xml, KeyInfoResolverSource());
  } catch (const Tarnik::InvalidArgumentException&) {
    ++refusals;
  }
  Require(refusals == 2);
}

}  // namespace

void RequireSameFromEveryEntry(const std::string& xml, const Signer& signer,
                               const std::string& values) {
  for (const Entry& entry : EntriesThatOnlyRead()) {
    RequireAccepted(entry, xml, signer, values);
  }
  RequireResolver(xml);
  for (const Entry& entry : EntriesThatVerify()) {
    RequireAccepted(entry, xml, signer, values);
    for (const Signer& other : Signers()) {
      if (other.credential.privateKeyPem != signer.credential.privateKeyPem) {
        RequireRefused(entry, xml, other);
      }
    }
  }
}

}  // namespace Fuzz
