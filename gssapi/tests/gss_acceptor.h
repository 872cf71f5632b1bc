#ifndef SSOCLIENT_GSSAPI_TESTS_GSS_ACCEPTOR_H
#define SSOCLIENT_GSSAPI_TESTS_GSS_ACCEPTOR_H

#include <string>
#include <vector>

#include <gssapi/gssapi.h>

#include <ssoclient/gssapi_negotiation_handler.h>

#include "handles.h"

namespace SsoClient::Testing {

/// The service's side of one negotiation.
class GssAcceptor {
 public:
  /// Throws `SsoException` if the keytab has no keys.
  explicit GssAcceptor(const std::string& keytab);

  /// Returns the service's leg, which is a refusal if `error` is not empty afterwards.
  std::vector<unsigned char> Accept(const std::vector<unsigned char>& leg);

  bool isEstablished = false;
  std::string clientName;
  OM_uint32 flags = 0;
  std::string error;

 private:
  GssCredential credentials_;
  GssContext context_;
};

/// A NegTokenResp (RFC 4178, section 4.2.2) for Kerberos with this state and without a message of
/// Kerberos.
std::vector<unsigned char> EmptyAnswer(unsigned char state);

/// Negotiates with a service that has the keys of `keytab`, and expects it to see `client` log in.
void ExpectLogin(GssapiNegotiationHandler& handler, const std::string& keytab,
                 const std::string& client);

}  // namespace SsoClient::Testing

#endif
