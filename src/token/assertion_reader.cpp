#include "token/assertion_reader.h"

#include <memory>

#include "support/namespaces.h"
#include "token/advice_reader.h"
#include "token/child_cursor.h"
#include "token/conditions_reader.h"
#include "token/name_id_reader.h"
#include "token/statement_readers.h"
#include "token/strict_rules.h"
#include "token/subject_reader.h"
#include "token/token_signature.h"

namespace SsoClient {
namespace {

void ReadOptionalParts(ChildCursor& children, ParsedAssertion& parsed) {
  if (children.IsAtElement("Advice")) {
    parsed.advice = ReadAdvice(children);
  }
  if (children.IsAtElement("AuthnStatement")) {
    parsed.authnStatement = ReadAuthnStatement(children);
  }
  if (children.IsAtElement("AttributeStatement")) {
    parsed.attributes = ReadAttributeStatement(children);
  }
}

}  // namespace

ParsedAssertion ReadAssertion(Tarnik::Xml::ElementNode* assertion) {
  const Tarnik::Xml::ElementNode& element = ExpectElement(assertion, "Assertion", kSamlNamespace);
  CheckAttributes(element, {"Version", "ID", "IssueInstant"});
  ParsedAssertion parsed;
  parsed.version = ReadAttribute(element, "Version");
  parsed.id = ReadAttribute(element, "ID");
  parsed.issueInstant = ReadDateAttribute(element, "IssueInstant");
  ChildCursor children(element, std::make_shared<const SkipWsAndCommentsFilter>());
  parsed.issuer = ReadNameId(children, "Issuer");
  parsed.signature = ReadSignature(children, parsed.id);
  parsed.subject = ReadSubject(children);
  parsed.conditions = ReadConditions(children);
  ReadOptionalParts(children, parsed);
  children.ExpectEnd("Unexpected elements under Assertion");
  return parsed;
}

}  // namespace SsoClient
