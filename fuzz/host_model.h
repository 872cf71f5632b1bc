#ifndef FUZZ_HOST_MODEL_H
#define FUZZ_HOST_MODEL_H

#include <string>

namespace Fuzz {

/// The bytes of an IPv4 or IPv6 address; empty for another text.
std::string AddressBytes(const std::string& text);
/// Whether a client may connect to `text`: a literal address, or a name of labels of letters,
/// digits, hyphens and underscores (RFC 1123, section 2.1; RFC 2181, section 11) that cannot be
/// taken for an address.
bool IsHostToCall(const std::string& text);

}  // namespace Fuzz

#endif
