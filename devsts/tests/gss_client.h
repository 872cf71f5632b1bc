#ifndef DEVSTS_GSS_CLIENT_H
#define DEVSTS_GSS_CLIENT_H

#include <gssapi/gssapi.h>

#include <memory>
#include <string>

namespace DevSts::Testing {

// A client's side of a login by Kerberos inside SPNEGO.
class GssClient {
 public:
  static constexpr OM_uint32 kUsualFlags = GSS_C_MUTUAL_FLAG | GSS_C_INTEG_FLAG;

  // By the tickets of `cache`, at the service of this Kerberos principal. Throws
  // std::runtime_error, as every call does.
  GssClient(const std::string& cache, const std::string& service, OM_uint32 flags = kUsualFlags);
  ~GssClient();
  GssClient(const GssClient&) = delete;
  GssClient& operator=(const GssClient&) = delete;

  // Takes the service's leg, none at first, and gives the next.
  std::string Step(const std::string& serverLeg = {});
  // The service has proved itself, too.
  bool IsDone() const;

 private:
  class State;
  std::unique_ptr<State> state_;
};

}  // namespace DevSts::Testing

#endif
