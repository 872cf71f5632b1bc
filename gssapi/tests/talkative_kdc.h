#ifndef SSOCLIENT_GSSAPI_TESTS_TALKATIVE_KDC_H
#define SSOCLIENT_GSSAPI_TESTS_TALKATIVE_KDC_H

#include <string>
#include <thread>
#include <vector>

#include "transport/loopback_server.h"

namespace SsoClient::Testing {

/// A KDC on loopback that answers every request with an error (RFC 4120, section 5.9.1) that
/// contains the given text.
class TalkativeKdc {
 public:
  explicit TalkativeKdc(std::string text);
  TalkativeKdc(const TalkativeKdc&) = delete;
  TalkativeKdc& operator=(const TalkativeKdc&) = delete;
  ~TalkativeKdc();

  int Port() const;

 private:
  void Serve() const;

  std::string text_;
  LoopbackSocket socket_;
  std::thread thread_;
};

/// A KRB-ERROR with the code KRB_ERR_GENERIC and the given text.
std::string KerberosError(std::string text);
/// The leg of a service that refuses a login with such an error, in the frames of RFC 4121,
/// section 4.1, and of RFC 4178.
std::vector<unsigned char> RefusalWith(const std::string& text);

}  // namespace SsoClient::Testing

#endif
