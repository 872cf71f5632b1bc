#include "operations/token_issuer.h"

#include <stdexcept>

namespace DevSts {
namespace {

constexpr char kStart[] = "<saml2:Assertion";
constexpr char kEnd[] = "</saml2:Assertion>";

// Searches the text for the ID: hooks may have changed it, and the text need not be well-formed on
// its own, because its namespaces may be declared outside.
std::string FirstIdIn(const std::string& assertion) {
  constexpr char kId[] = " ID=\"";
  const std::size_t start = assertion.find(kId);
  if (start == std::string::npos) {
    return {};
  }
  const std::size_t from = start + sizeof kId - 1;
  return assertion.substr(from, assertion.find('"', from) - from);
}

void EditAssertion(std::string& envelope, const std::function<void(std::string&)>& edit) {
  const std::size_t start = envelope.find(kStart);
  const std::size_t end = envelope.rfind(kEnd);
  if (start == std::string::npos || end == std::string::npos) {
    throw std::logic_error("the answer contains no saml2:Assertion to edit");
  }
  const std::size_t size = end + sizeof kEnd - 1 - start;
  std::string assertion = envelope.substr(start, size);
  edit(assertion);
  envelope.replace(start, size, assertion);
}

}  // namespace

IssuedAnswer IssueToken(const TokenContent& content, const AssertionOptions& shape,
                        const IssuerIdentity& identity, TokenAnswer kind, const ServerLeg& leg) {
  std::string assertion =
      WriteAssertion(content, shape, identity.vendorHost, identity.solutionHost);
  if (shape.beforeSigning) {
    shape.beforeSigning(assertion);
  }
  XmlWriter::Attributes declarations;
  if (shape.inheritNamespaces) {
    declarations = AssertionNamespaces(identity.vendorHost);
  }
  IssuedAnswer answer{{}, FirstIdIn(assertion)};
  SignOptions signing = shape.signing;
  if (signing.id.empty()) {
    signing.id = answer.assertionId;
  }
  const std::string unsignedEnvelope = WriteTokenEnvelope(
      kind, assertion, content.notBefore, content.notOnOrAfter, declarations, shape.indent, leg);
  answer.envelope = SignXml(unsignedEnvelope, identity.signing.privateKeyPem,
                            identity.signing.certificatePem, signing);
  if (shape.afterSigning) {
    EditAssertion(answer.envelope, shape.afterSigning);
  }
  return answer;
}

}  // namespace DevSts
