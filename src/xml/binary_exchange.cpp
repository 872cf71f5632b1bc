#include "xml/binary_exchange.h"

#include <tarnik/text/string_util.h>

#include "xml/builder_factories.h"
#include "xml/namespaces.h"
#include "xml/secret_text.h"

namespace SsoClient {

namespace {

constexpr char kSpnegoValueType[] = "http://schemas.xmlsoap.org/ws/2005/02/trust/spnego";

}  // namespace

std::shared_ptr<XMLBaseBuilder> BuildBinaryExchange(const std::vector<unsigned char>& leg) {
  SecretText text;
  text.text = Tarnik::StringUtil::Base64Encode(leg);
  return MakeTextElementBuilder(
      "wst", "BinaryExchange", text.text,
      {{"EncodingType", kBase64BinaryEncoding}, {"ValueType", kSpnegoValueType}});
}

}  // namespace SsoClient
