#ifndef DEVSTS_KERBEROS_GSS_LIBRARY_H
#define DEVSTS_KERBEROS_GSS_LIBRARY_H

#include <stdexcept>
#include <string>
#include <utility>

#include <gssapi/gssapi.h>

#include "xml/schema_values.h"

namespace DevSts {

// An object of the GSSAPI library (RFC 2744), released by the destructor.
template <typename T, auto release>
class GssHandle {
 public:
  GssHandle() = default;
  ~GssHandle() { Release(); }
  GssHandle(GssHandle&& other) noexcept : object_(std::exchange(other.object_, nullptr)) {}
  GssHandle& operator=(GssHandle&& other) noexcept {
    std::swap(object_, other.object_);
    return *this;
  }

  T Get() const { return object_; }
  // For calls that set or replace the object.
  T* Address() { return &object_; }

 private:
  void Release() {
    OM_uint32 ignored = 0;
    if (object_ != nullptr) {
      release(&ignored, &object_);
    }
  }

  T object_ = nullptr;
};

inline OM_uint32 DeleteGssContext(OM_uint32* minor, gss_ctx_id_t* context) {
  return gss_delete_sec_context(minor, context, GSS_C_NO_BUFFER);
}

using GssCredentialHandle = GssHandle<gss_cred_id_t, gss_release_cred>;
using GssContextHandle = GssHandle<gss_ctx_id_t, DeleteGssContext>;
using GssNameHandle = GssHandle<gss_name_t, gss_release_name>;

// Memory that the library has allocated.
class GssBuffer {
 public:
  GssBuffer() = default;
  ~GssBuffer() {
    OM_uint32 ignored = 0;
    gss_release_buffer(&ignored, &buffer_);
  }
  GssBuffer(const GssBuffer&) = delete;
  GssBuffer& operator=(const GssBuffer&) = delete;

  gss_buffer_t Address() { return &buffer_; }
  Octets Copy() const {
    const auto* start = static_cast<const unsigned char*>(buffer_.value);
    return start != nullptr ? Octets(start, start + buffer_.length) : Octets();
  }

 private:
  gss_buffer_desc buffer_ = GSS_C_EMPTY_BUFFER;
};

// The octets as an argument of a call, which they must outlive. The library does not write to them.
inline gss_buffer_desc AsGss(const Octets& octets) {
  return {octets.size(), const_cast<unsigned char*>(octets.data())};
}

// A call of the GSSAPI library failed.
class GssError : public std::runtime_error {
 public:
  GssError(const std::string& text, OM_uint32 major)
      : std::runtime_error(text), routineError_(GSS_ROUTINE_ERROR(major)) {}

  // The routine error (GSS_S_...) without calling errors and supplementary bits.
  OM_uint32 RoutineError() const { return routineError_; }

 private:
  OM_uint32 routineError_;
};

// Throws GssError with the library's text if the status is an error. Must be called on the thread
// of the failed call, for which the library keeps the text.
void RequireGss(OM_uint32 major, OM_uint32 minor);

}  // namespace DevSts

#endif
