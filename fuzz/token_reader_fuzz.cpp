// Reading a token ends in a token or in one of the stated exceptions.
#include <ssoclient/saml_token.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "input.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  try {
    const auto token = SsoClient::CreateSamlToken(Fuzz::TextOf(data, size));
    SsoClient::CreateSamlTokenDescription(*token);
  } catch (const SsoClient::ParseException&) {
  } catch (const Tarnik::Xml::XMLParseException&) {
  }
  return 0;
}
