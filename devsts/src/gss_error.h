#ifndef DEVSTS_GSS_ERROR_H
#define DEVSTS_GSS_ERROR_H

#include <gssapi/gssapi.h>

#include <stdexcept>
#include <string>

namespace DevSts {

// A call of the GSSAPI library failed.
class GssError : public std::runtime_error {
 public:
  GssError(const std::string& text, OM_uint32 major)
      : std::runtime_error(text), routineError_(GSS_ROUTINE_ERROR(major)) {}

  // GSS_S_... without supplementary bits.
  OM_uint32 RoutineError() const { return routineError_; }

 private:
  OM_uint32 routineError_;
};

// Throws GssError in the library's words if the status is one. On the thread of the call.
void RequireGss(OM_uint32 major, OM_uint32 minor);

}  // namespace DevSts

#endif
