#include "token/advice_reader.h"

#include <string>
#include <utility>

#include "deployment.h"
#include "support/namespaces.h"
#include "token/statement_readers.h"
#include "token/strict_rules.h"

namespace SsoClient {
namespace {

using Tarnik::Xml::ElementNode;

AdviceAttribute ReadAdviceAttribute(ChildCursor& cursor) {
  const AttributeView view = ReadSamlAttribute(cursor);
  return {std::string(view.name), {view.values.begin(), view.values.end()}};
}

Advice ReadAdviceBlock(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("RSAAdvice", kVendorSamlNamespace);
  CheckAttributes(element, {"AdviceSource"});
  Advice advice;
  advice.source = ReadAttribute(element, "AdviceSource");
  ChildCursor children = cursor.Into(element);
  while (!children.IsAtEnd()) {
    advice.attributes.push_back(ReadAdviceAttribute(children));
  }
  return advice;
}

}  // namespace

std::vector<Advice> ReadAdvice(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("Advice", kSamlNamespace);
  CheckAttributes(element, {});
  std::vector<Advice> advice;
  ChildCursor children = cursor.Into(element);
  while (!children.IsAtEnd()) {
    advice.push_back(ReadAdviceBlock(children));
  }
  return advice;
}

}  // namespace SsoClient
