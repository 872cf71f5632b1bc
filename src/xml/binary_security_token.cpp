#include "xml/binary_security_token.h"

#include <tarnik/text/base64.h>

#include "xml/builder_factories.h"
#include "xml/namespaces.h"

namespace SsoClient {

namespace {

std::string Base64Text(const Tarnik::Crypto::Certificate& certificate) {
  const unsigned char* bytes = certificate.DerBytes();
  const std::size_t length = certificate.DerLength();
  std::string text(Tarnik::Base64_EncodedLength(bytes, length), '\0');
  std::size_t written = 0;
  Tarnik::Base64_Encode(bytes, length, text.data(), text.size(), &written);
  text.resize(written);
  return text;
}

}  // namespace

std::shared_ptr<XMLBaseBuilder> BuildBinarySecurityToken(
    const std::string& id, const Tarnik::Crypto::Certificate& certificate) {
  return MakeTextElementBuilder("wsse", "BinarySecurityToken", Base64Text(certificate),
                                {{"EncodingType", kBase64BinaryEncoding},
                                 {"ValueType", kX509TokenType},
                                 {"wsu:Id", id},
                                 {"xmlns:wsu", kWsuNamespace}});
}

}  // namespace SsoClient
