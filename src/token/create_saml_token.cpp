#include <utility>

#include <ssoclient/saml_token.h>
#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/xml_parser.h>

#include "support/clock_tolerance.h"
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

Ref<Tarnik::Xml::Document> ParseDocument(const std::string& xml) {
  const Ref<Tarnik::Reader> reader = Tarnik::CreateStringReader(xml);
  const Ref<Tarnik::Xml::XMLHandler> handler = Tarnik::Xml::CreateXMLDocumentHandler();
  const Ref<Tarnik::Xml::XMLParser> parser =
      Tarnik::Xml::CreateXMLParser(reader.get(), handler.get());
  const Ref<Tarnik::Object> document = parser->Parse();
  return Ref<Tarnik::Xml::Document>(Tarnik::CheckedCast<Tarnik::Xml::Document>(document.get()));
}

ParsedAssertion ReadAndJudge(ElementNode* assertion, const KeyInfoResolver* resolver,
                             long clockToleranceSec) {
  ParsedAssertion parsed = ReadAssertion(assertion);
  CheckValidity(parsed, clockToleranceSec, Tarnik::System::GetUtcDateTime());
  if (resolver != nullptr) {
    VerifySignature(*parsed.signature, resolver);
  }
  return parsed;
}

std::string CanonicalText(const ElementNode* element) {
  const Ref<Tarnik::Xml::Security::Canonicalizer> canonicalizer =
      Tarnik::Xml::Security::CreateCanonicalizer(
          "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#");
  const Ref<Tarnik::StringWriter> writer = Tarnik::CreateStringWriter();
  canonicalizer->Canonicalize(element, writer.get());
  return writer->TakeText();
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
  ParsedAssertion parsed = ReadAndJudge(document->RootElement(), resolver, clockToleranceSec);
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
  ParsedAssertion parsed = ReadAndJudge(assertion, resolver, clockToleranceSec);
  return MakeToken(std::move(parsed), CanonicalText(assertion), clockToleranceSec);
}

}  // namespace SsoClient
