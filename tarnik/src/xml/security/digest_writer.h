#ifndef TARNIK_XML_SECURITY_DIGEST_WRITER_H
#define TARNIK_XML_SECURITY_DIGEST_WRITER_H

#include <array>
#include <cstddef>
#include <string_view>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/writer.h>

#include "crypto/hash.h"
#include "support/openssl.h"

namespace Tarnik::Xml::Security {

struct Digest {
  std::array<unsigned char, Crypto::kMaxHashLength> bytes;
  std::size_t length;
};

/// Computes the digests of what is written, one after the other. Throws `CryptoException` when
/// OpenSSL fails.
class DigestWriter final : public Writer, public ObjectImpl {
 public:
  DigestWriter();
  ~DigestWriter() override;

  /// Starts a digest; what was written before is discarded.
  void Start(Crypto::Hash hash);
  void Write(std::string_view text) override;
  Digest Finish();

 private:
  OpenSsl::OwnedDigestContext context_;
};

}  // namespace Tarnik::Xml::Security

#endif
