#include "xml/security/algorithm_list.h"

#include <tarnik/xml/security/xml_security_exception.h>
#include <algorithm>

#include "support/quote.h"
#include "xml/security/content_reader.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::Hash;
using Crypto::SignatureScheme;

constexpr std::string_view kEnveloped = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";
constexpr std::string_view kExclusiveNamespace = "http://www.w3.org/2001/10/xml-exc-c14n#";
struct ListedSignatureMethod {
  std::string_view algorithm;
  SignatureMethod method;
};

constexpr ListedSignatureMethod kSignatureMethods[] = {
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

struct ListedDigestMethod {
  std::string_view algorithm;
  Hash hash;
};

constexpr ListedDigestMethod kDigestMethods[] = {
    {"http://www.w3.org/2001/04/xmlenc#sha256", Hash::kSha256},
    {"http://www.w3.org/2001/04/xmldsig-more#sha384", Hash::kSha384},
    {"http://www.w3.org/2001/04/xmlenc#sha512", Hash::kSha512},
};

[[noreturn]] void Refuse(std::string_view algorithm, const char* kind) {
  throw XmlSecurityException(std::string("The ") + kind + " algorithm " + Quote(algorithm) +
                             " is not supported.");
}

template <class List>
auto Require(const List& list, std::string_view algorithm, const char* kind) {
  for (const auto& listed : list) {
    if (listed.algorithm == algorithm) {
      return listed;
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

// Exclusive XML Canonicalization, section 4.
std::vector<std::string> InclusivePrefixesOf(std::string_view algorithm,
                                             const ElementNode* element) {
  ContentReader content(element);
  if (content.Peek() == nullptr) {
    return {};
  }
  const ElementNode* parameter = content.TakeAny();
  if (parameter->LocalName() != "InclusiveNamespaces" ||
      parameter->NamespaceUri() != kExclusiveNamespace) {
    throw XmlSecurityException("The algorithm " + Quote(algorithm) + " does not take " +
                               Quote(parameter->QualifiedNameText()) + " as a parameter.");
  }
  content.ExpectEnd();
  ExpectAttributes(parameter, {"PrefixList"});
  ContentReader(parameter).ExpectEnd();
  const auto prefixes = parameter->FindAttribute("PrefixList");
  return prefixes ? SplitPrefixes(*prefixes) : std::vector<std::string>();
}

C14nOptions RequireC14n(std::string_view algorithm, const ElementNode* element, const char* kind) {
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

SignatureMethod RequireSignatureMethod(std::string_view algorithm, const ElementNode* element) {
  const SignatureMethod method = Require(kSignatureMethods, algorithm, "signature").method;
  ExpectNoParameters(algorithm, element);
  return method;
}

Hash RequireDigestMethod(std::string_view algorithm, const ElementNode* element) {
  const Hash hash = Require(kDigestMethods, algorithm, "digest").hash;
  ExpectNoParameters(algorithm, element);
  return hash;
}

C14nOptions RequireCanonicalizationMethod(std::string_view algorithm, const ElementNode* element) {
  return RequireC14n(algorithm, element, "canonicalization");
}

TransformPlan RequireTransforms(const std::vector<std::string>& algorithms,
                                const std::vector<const ElementNode*>& elements) {
  TransformPlan plan;
  std::size_t next = 0;
  if (next < algorithms.size() && algorithms[next] == kEnveloped) {
    ExpectNoParameters(kEnveloped, elements[next]);
    plan.enveloped = true;
    ++next;
  }
  if (next < algorithms.size()) {
    plan.canonicalization = RequireC14n(algorithms[next], elements[next], "transform");
    ++next;
  }
  if (next < algorithms.size()) {
    throw XmlSecurityException("The transform algorithm " + Quote(algorithms[next]) +
                               " is not supported behind a canonicalization.");
  }
  return plan;
}

}  // namespace Tarnik::Xml::Security
