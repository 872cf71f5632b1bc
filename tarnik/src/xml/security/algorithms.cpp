#include "xml/security/algorithms.h"

#include <algorithm>

#include <tarnik/xml/security/xml_security_exception.h>

#include "support/quote.h"
#include "xml/security/content_reader.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::Hash;
using Crypto::SignatureScheme;

constexpr std::string_view kEnveloped = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";
constexpr std::string_view kExclusiveNamespace = "http://www.w3.org/2001/10/xml-exc-c14n#";

struct SupportedSignatureMethod {
  std::string_view algorithm;
  SignatureMethod method;
};

constexpr SupportedSignatureMethod kSignatureMethods[] = {
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256",
     {SignatureScheme::kRsaPkcs1, Hash::kSha256}},
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha384",
     {SignatureScheme::kRsaPkcs1, Hash::kSha384}},
    {"http://www.w3.org/2001/04/xmldsig-more#rsa-sha512",
     {SignatureScheme::kRsaPkcs1, Hash::kSha512}},
    {"http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1",
     {SignatureScheme::kRsaPss, Hash::kSha256}},
    {"http://www.w3.org/2007/05/xmldsig-more#sha384-rsa-MGF1",
     {SignatureScheme::kRsaPss, Hash::kSha384}},
    {"http://www.w3.org/2007/05/xmldsig-more#sha512-rsa-MGF1",
     {SignatureScheme::kRsaPss, Hash::kSha512}},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256",
     {SignatureScheme::kEcdsa, Hash::kSha256}},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha384",
     {SignatureScheme::kEcdsa, Hash::kSha384}},
    {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512",
     {SignatureScheme::kEcdsa, Hash::kSha512}},
};

struct SupportedDigestMethod {
  std::string_view algorithm;
  Hash hash;
};

constexpr SupportedDigestMethod kDigestMethods[] = {
    {"http://www.w3.org/2001/04/xmlenc#sha256", Hash::kSha256},
    {"http://www.w3.org/2001/04/xmldsig-more#sha384", Hash::kSha384},
    {"http://www.w3.org/2001/04/xmlenc#sha512", Hash::kSha512},
};

[[noreturn]] void Refuse(std::string_view algorithm, const char* kind) {
  throw XmlSecurityException(std::string("The ") + kind + " algorithm " + Quote(algorithm) +
                             " is not supported.");
}

template <class List>
auto LookUp(const List& list, std::string_view algorithm, const char* kind) {
  for (const auto& supported : list) {
    if (supported.algorithm == algorithm) {
      return supported;
    }
  }
  Refuse(algorithm, kind);
}

void ExpectNoParameters(std::string_view algorithm, const ElementNode* element) {
  const ContentReader content(element);
  if (content.Peek() != nullptr) {
    throw XmlSecurityException("The algorithm " + Quote(algorithm) +
                               " takes no parameters, but has " +
                               Quote(content.Peek()->QualifiedNameText()) + ".");
  }
}

std::vector<std::string> SplitPrefixes(std::string_view list) {
  std::vector<std::string> prefixes;
  for (list = Trim(list); !list.empty(); list = Trim(list)) {
    const std::size_t length = std::min(list.find_first_of("\t\n\r "), list.size());
    prefixes.emplace_back(list.substr(0, length));
    list.remove_prefix(length);
  }
  return prefixes;
}

bool IsPrefixList(const ElementNode* parameter, std::string_view namespaceUri) {
  return parameter->LocalName() == "InclusiveNamespaces" &&
         parameter->NamespaceUri() == namespaceUri;
}

// Takes the only parameter of an algorithm, which is an InclusiveNamespaces element.
std::string_view TakePrefixList(ContentReader& content) {
  const ElementNode* parameter = content.TakeAny();
  content.ExpectEnd();
  ExpectAttributes(parameter, {"PrefixList"});
  ContentReader(parameter).ExpectEnd();
  return parameter->FindAttribute("PrefixList").value_or("");
}

// Exclusive XML Canonicalization 1.0, section 4.
std::vector<std::string> InclusivePrefixesOf(std::string_view algorithm,
                                             const ElementNode* element) {
  ContentReader content(element);
  if (content.Peek() == nullptr) {
    return {};
  }
  if (!IsPrefixList(content.Peek(), kExclusiveNamespace)) {
    throw XmlSecurityException("The algorithm " + Quote(algorithm) + " does not take " +
                               Quote(content.Peek()->QualifiedNameText()) + " as a parameter.");
  }
  return SplitPrefixes(TakePrefixList(content));
}

// Some signers give every transform of a reference the prefix list of its canonicalisation, in the
// namespace of that transform. Removing the signature does not depend on prefixes.
void SkipPrefixListOfEnveloped(const ElementNode* element) {
  ContentReader content(element);
  const ElementNode* parameter = content.Peek();
  if (parameter != nullptr &&
      (IsPrefixList(parameter, kExclusiveNamespace) || IsPrefixList(parameter, kEnveloped))) {
    TakePrefixList(content);
    return;
  }
  ExpectNoParameters(kEnveloped, element);
}

C14nOptions LookUpC14n(std::string_view algorithm, const ElementNode* element, const char* kind) {
  C14nOptions options;
  if (!ReadC14nAlgorithm(algorithm, options)) {
    Refuse(algorithm, kind);
  }
  if (options.exclusive) {
    options.inclusivePrefixes = InclusivePrefixesOf(algorithm, element);
  } else {
    ExpectNoParameters(algorithm, element);
  }
  return options;
}

}  // namespace

SignatureMethod LookUpSignatureMethod(std::string_view algorithm, const ElementNode* element) {
  const SignatureMethod method = LookUp(kSignatureMethods, algorithm, "signature").method;
  ExpectNoParameters(algorithm, element);
  return method;
}

Hash LookUpDigestMethod(std::string_view algorithm, const ElementNode* element) {
  const Hash hash = LookUp(kDigestMethods, algorithm, "digest").hash;
  ExpectNoParameters(algorithm, element);
  return hash;
}

std::optional<Hash> FindDigestMethod(std::string_view algorithm) noexcept {
  for (const SupportedDigestMethod& supported : kDigestMethods) {
    if (supported.algorithm == algorithm) {
      return supported.hash;
    }
  }
  return std::nullopt;
}

C14nOptions LookUpCanonicalizationMethod(std::string_view algorithm, const ElementNode* element) {
  return LookUpC14n(algorithm, element, "canonicalisation");
}

TransformPlan PlanTransforms(const std::vector<std::string>& algorithms,
                             const std::vector<const ElementNode*>& elements) {
  TransformPlan plan;
  std::size_t next = 0;
  if (next < algorithms.size() && algorithms[next] == kEnveloped) {
    SkipPrefixListOfEnveloped(elements[next]);
    plan.enveloped = true;
    ++next;
  }
  if (next < algorithms.size()) {
    plan.canonicalization = LookUpC14n(algorithms[next], elements[next], "transform");
    ++next;
  }
  if (next < algorithms.size()) {
    throw XmlSecurityException("The transform algorithm " + Quote(algorithms[next]) +
                               " is not supported after a canonicalisation.");
  }
  return plan;
}

}  // namespace Tarnik::Xml::Security
