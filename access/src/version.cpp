#include <ssoclient/access/version.h>

namespace SsoClient::Access {

const char* Version() noexcept {
  return SSOCLIENT_ACCESS_VERSION;
}

}  // namespace SsoClient::Access
