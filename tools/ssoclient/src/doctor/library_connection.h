#ifndef SSOCLIENT_TOOL_DOCTOR_LIBRARY_CONNECTION_H
#define SSOCLIENT_TOOL_DOCTOR_LIBRARY_CONNECTION_H

#include <string>

#include <tarnik/http/connection_spec.h>

#include "doctor/examination.h"

namespace SsoClient::Tool::Doctor {

/// The connections of the library to the service.
Tarnik::Ref<Tarnik::Http::ConnectionSpec> MakeConnectionSpec(const Examination& examination);

/// Whether the library trusts the service, by a connection on which nothing is sent.
struct LibraryVerdict {
  enum class Kind {
    kAccepted,
    kRefused,    ///< the TLS handshake failed
    kUndecided,  ///< the connection failed before that
  };
  Kind kind = Kind::kUndecided;
  std::string message{};  ///< of the exception, if it is not accepted
};

LibraryVerdict AskLibrary(const Examination& examination, TimeLimit::Clock::time_point end);

}  // namespace SsoClient::Tool::Doctor

#endif
