#ifndef DEVSTS_GSS_CLIENT_H
#define DEVSTS_GSS_CLIENT_H

#include <memory>
#include <string>

#include <gssapi/gssapi.h>

namespace DevSts::Testing {

// The client's side of a login with Kerberos inside SPNEGO.
class GssClient {
 public:
  static constexpr OM_uint32 kUsualFlags = GSS_C_MUTUAL_FLAG | GSS_C_INTEG_FLAG;

  // Logs in with the tickets in `cache` at the service with this Kerberos principal. All calls
  // throw std::runtime_error.
  GssClient(const std::string& cache, const std::string& service, OM_uint32 flags = kUsualFlags);
  ~GssClient();
  GssClient(const GssClient&) = delete;
  GssClient& operator=(const GssClient&) = delete;

  // Takes the service's leg, which is empty at first, and returns the client's next leg. Signs the
  // list of mechanisms when the service does, with any version of the Kerberos library.
  std::string Step(const std::string& serverLeg = {});
  // Whether the login is complete and the service has proved its identity.
  bool IsDone() const;

 private:
  class State;
  std::unique_ptr<State> state_;
};

}  // namespace DevSts::Testing

#endif
