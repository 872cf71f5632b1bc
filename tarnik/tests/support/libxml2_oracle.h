#ifndef TARNIK_TESTS_SUPPORT_LIBXML2_ORACLE_H
#define TARNIK_TESTS_SUPPORT_LIBXML2_ORACLE_H

#include <optional>
#include <string>
#include <vector>

namespace Tarnik::TestSupport {

struct OracleRequest {
  bool exclusive = false;
  bool withComments = false;
  std::vector<std::string> inclusivePrefixes;
  /// The element to canonicalise with all below it, counted from 0 in document order; none for the
  /// whole document.
  std::optional<int> element;
};

/// The canonical form of `xml` as libxml2 gives it; none when it refuses.
std::optional<std::string> CanonicalizeWithLibXml2(const std::string& xml,
                                                   const OracleRequest& request);

/// True when libxml2 finds `xml` well-formed and right in its namespaces.
bool IsWellFormedForLibXml2(const std::string& xml);

}  // namespace Tarnik::TestSupport

#endif
