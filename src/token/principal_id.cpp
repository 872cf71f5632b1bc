#include <ssoclient/principal_id.h>

namespace SsoClient {
namespace {

char ToLowerAscii(char c) {
  return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

// strcasecmp would use the letter case rules of the process's locale.
bool EqualIgnoringCase(const char* a, const char* b) {
  while (*a != '\0' && ToLowerAscii(*a) == ToLowerAscii(*b)) {
    ++a;
    ++b;
  }
  return ToLowerAscii(*a) == ToLowerAscii(*b);
}

}  // namespace

bool PrincipalId::operator==(const PrincipalId& other) const {
  if (this == &other) {
    return true;
  }
  return EqualIgnoringCase(name.c_str(), other.name.c_str()) &&
         EqualIgnoringCase(domain.c_str(), other.domain.c_str());
}

}  // namespace SsoClient
