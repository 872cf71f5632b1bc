#ifndef TARNIK_TESTS_SUPPORT_LIBXML2_ORACLE_H
#define TARNIK_TESTS_SUPPORT_LIBXML2_ORACLE_H

#include <optional>
#include <string>
#include <vector>

namespace Tarnik::Testing {

struct OracleRequest {
  bool exclusive = false;
  bool withComments = false;
  std::vector<std::string> inclusivePrefixes;
  /// The element whose subtree is canonicalised, counted from 0 in document order; none for the
  /// whole document.
  std::optional<int> element;
};

/// The canonical form of `xml` by libxml2, or none if libxml2 rejects it.
std::optional<std::string> CanonicalizeWithLibXml2(const std::string& xml,
                                                   const OracleRequest& request);

/// True if libxml2 finds `xml` well-formed and namespace-well-formed.
bool IsWellFormedForLibXml2(const std::string& xml);

}  // namespace Tarnik::Testing

#endif
