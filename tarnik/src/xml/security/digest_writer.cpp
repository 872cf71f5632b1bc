#include "xml/security/digest_writer.h"

#include <tarnik/crypto/crypto_exception.h>

#include "support/openssl_error.h"

namespace Tarnik::Xml::Security {
namespace {

void Check(bool succeeded, const OpenSsl::ErrorScope& errors) {
  if (!succeeded) {
    throw Crypto::CryptoException(errors.Describe("The digest cannot be computed"));
  }
}

OpenSsl::OwnedDigestContext NewContext() {
  const OpenSsl::ErrorScope errors;
  OpenSsl::OwnedDigestContext context(EVP_MD_CTX_new());
  if (context == nullptr) {
    throw Crypto::CryptoException("The digest cannot be computed: not enough memory.");
  }
  return context;
}

}  // namespace

DigestWriter::DigestWriter() : context_(NewContext()) {}

DigestWriter::~DigestWriter() = default;

void DigestWriter::Start(Crypto::Hash hash) {
  const OpenSsl::ErrorScope errors;
  Check(EVP_DigestInit_ex2(context_.get(), Crypto::FetchedHash(hash), nullptr) == 1, errors);
}

void DigestWriter::Write(std::string_view text) {
  const OpenSsl::ErrorScope errors;
  Check(EVP_DigestUpdate(context_.get(), text.data(), text.size()) == 1, errors);
}

Digest DigestWriter::Finish() {
  const OpenSsl::ErrorScope errors;
  Digest digest;
  unsigned length = 0;
  Check(EVP_DigestFinal_ex(context_.get(), digest.bytes.data(), &length) == 1, errors);
  digest.length = length;
  return digest;
}

}  // namespace Tarnik::Xml::Security
