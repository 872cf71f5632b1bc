#include <utility>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>

#include "support/clock_tolerance.h"
#include "support/xml_documents.h"
#include "token/assertion_reader.h"
#include "token/saml_token_impl.h"
#include "token/token_signature.h"
#include "token/validity_rules.h"

namespace SsoClient {
namespace {

using Tarnik::Ref;
using Tarnik::Xml::ElementNode;
using Tarnik::Xml::Security::KeyInfoResolver;
using Token = std::shared_ptr<const SamlToken>;

ParsedAssertion ReadAndValidate(ElementNode* assertion, const KeyInfoResolver* resolver,
                                long clockToleranceSec) {
  ParsedAssertion parsed = ReadAssertion(assertion);
  CheckValidity(parsed, clockToleranceSec, Tarnik::System::GetUtcDateTime());
  if (resolver != nullptr) {
    VerifySignature(*parsed.signature, resolver);
  }
  return parsed;
}

Token MakeToken(ParsedAssertion&& parsed, std::string xml, long clockToleranceSec) {
  return std::make_shared<const SamlTokenImpl>(std::move(parsed), std::move(xml),
                                               clockToleranceSec);
}

}  // namespace

Token CreateSamlToken(const std::string& xml) {
  return CreateSamlToken(xml, kDefaultClockToleranceSec);
}

Token CreateSamlToken(const std::string& xml, long clockToleranceSec) {
  return CreateSamlToken(xml, nullptr, clockToleranceSec);
}

Token CreateSamlToken(const std::string& xml, const KeyInfoResolver* resolver) {
  return CreateSamlToken(xml, resolver, kDefaultClockToleranceSec);
}

Token CreateSamlToken(const std::string& xml, const KeyInfoResolver* resolver,
                      long clockToleranceSec) {
  const Ref<Tarnik::Xml::Document> document = ParseDocument(xml);
  ParsedAssertion parsed = ReadAndValidate(document->RootElement(), resolver, clockToleranceSec);
  return MakeToken(std::move(parsed), xml, clockToleranceSec);
}

Token CreateSamlToken(const std::string& xml, const KeyInfoResolverSource& resolverFor) {
  if (!resolverFor) {
    throw Tarnik::InvalidArgumentException("The source of key info resolvers must not be empty.");
  }
  Token token = CreateSamlToken(xml);
  const Ref<const KeyInfoResolver> resolver = resolverFor(token.get());
  if (resolver == nullptr) {
    throw InvalidSignatureException(
        "Signature verification error. There is no key info resolver for the token.");
  }
  VerifySignature(*token->GetSignature(), resolver.get());
  return token;
}

Token CreateSamlTokenFromDom(ElementNode* assertion) {
  return CreateSamlTokenFromDom(assertion, kDefaultClockToleranceSec);
}

Token CreateSamlTokenFromDom(ElementNode* assertion, long clockToleranceSec) {
  return CreateSamlTokenFromDom(assertion, nullptr, clockToleranceSec);
}

Token CreateSamlTokenFromDom(ElementNode* assertion, const KeyInfoResolver* resolver) {
  return CreateSamlTokenFromDom(assertion, resolver, kDefaultClockToleranceSec);
}

Token CreateSamlTokenFromDom(ElementNode* assertion, const KeyInfoResolver* resolver,
                             long clockToleranceSec) {
  ParsedAssertion parsed = ReadAndValidate(assertion, resolver, clockToleranceSec);
  return MakeToken(std::move(parsed), CanonicalizeElement(assertion), clockToleranceSec);
}

}  // namespace SsoClient
