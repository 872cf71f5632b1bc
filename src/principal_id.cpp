#include <ssoclient/principal_id.h>

#include <strings.h>

namespace SsoClient {
namespace {

bool EqualWithoutCase(const std::string& a, const std::string& b) {
  return strcasecmp(a.c_str(), b.c_str()) == 0;
}

}  // namespace

bool PrincipalId::operator==(const PrincipalId& other) const {
  if (this == &other) {
    return true;
  }
  return EqualWithoutCase(name, other.name) && EqualWithoutCase(domain, other.domain);
}

}  // namespace SsoClient
