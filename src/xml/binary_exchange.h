#ifndef SSOCLIENT_XML_BINARY_EXCHANGE_H
#define SSOCLIENT_XML_BINARY_EXCHANGE_H

#include <memory>
#include <vector>

#include "xml/xml_base_builder.h"

namespace SsoClient {

/// wst:BinaryExchange with one leg of an SPNego negotiation (WS-Trust 1.3, section 8.3). The prefix
/// wst is declared by an element around it.
std::shared_ptr<XMLBaseBuilder> BuildBinaryExchange(const std::vector<unsigned char>& leg);

}  // namespace SsoClient

#endif
