#ifndef DEVSTS_BASE64_H
#define DEVSTS_BASE64_H

#include <string>
#include <vector>

namespace DevSts {

// RFC 4648, section 4, in one line.
std::string ToBase64(const std::vector<unsigned char>& octets);

// White space anywhere is ignored. Throws XmlError.
std::vector<unsigned char> FromBase64(std::string text);

}  // namespace DevSts

#endif
