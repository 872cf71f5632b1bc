#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "xml/security/c14n.h"

namespace Tarnik::Xml::Security {

namespace {

class CanonicalizerImpl final : public Canonicalizer, public ObjectImpl {
 public:
  explicit CanonicalizerImpl(C14nOptions options) : options_(std::move(options)) {}

  void Canonicalize(const Node* node, Writer* writer) const override {
    if (writer == nullptr) {
      throw InvalidArgumentException("Canonicalising needs a writer.");
    }
    WriteCanonical(node, nullptr, options_, *writer);
  }

 private:
  const C14nOptions options_;
};

}  // namespace

Ref<Canonicalizer> CreateCanonicalizer(std::string_view algorithm,
                                       const std::vector<std::string>& inclusivePrefixes) {
  C14nOptions options;
  if (!ReadC14nAlgorithm(algorithm, options)) {
    throw XmlSecurityException("The canonicalisation algorithm '" + std::string(algorithm) +
                               "' is not supported.");
  }
  if (!options.exclusive && !inclusivePrefixes.empty()) {
    throw XmlSecurityException("Inclusive canonicalisation takes no list of prefixes.");
  }
  options.inclusivePrefixes = inclusivePrefixes;
  return MakeRef<CanonicalizerImpl>(std::move(options));
}

}  // namespace Tarnik::Xml::Security
