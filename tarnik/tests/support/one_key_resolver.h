#ifndef TARNIK_TESTS_SUPPORT_ONE_KEY_RESOLVER_H
#define TARNIK_TESTS_SUPPORT_ONE_KEY_RESOLVER_H

#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/public_key.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace Tarnik::Testing {

/// Returns the same key, which may be null, for every signature.
class OneKeyResolver final : public Xml::Security::KeyInfoResolver, public ObjectImpl {
 public:
  explicit OneKeyResolver(Ref<const Crypto::PublicKey> key) : key_(std::move(key)) {}
  Ref<const Crypto::PublicKey> Resolve(const Xml::Security::KeyInfo& /*keyInfo*/) const override {
    return key_;
  }

 private:
  const Ref<const Crypto::PublicKey> key_;
};

}  // namespace Tarnik::Testing

#endif
