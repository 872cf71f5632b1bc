#ifndef SSOCLIENT_TESTS_STS_TOKEN_SPECS_H
#define SSOCLIENT_TESTS_STS_TOKEN_SPECS_H

#include <ssoclient/token_spec.h>

namespace SsoClient::Testing {

inline TokenSpec OneHour() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  return spec;
}

}  // namespace SsoClient::Testing

#endif
