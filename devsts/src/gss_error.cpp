#include "gss_error.h"

#include "gss_handles.h"

namespace DevSts {
namespace {

std::string TextOf(OM_uint32 status, int kind) {
  std::string text;
  OM_uint32 position = 0;
  do {
    OM_uint32 ignored = 0;
    GssBuffer part;
    if (GSS_ERROR(gss_display_status(&ignored, status, kind, GSS_C_NO_OID, &position,
                                     part.Address())) != 0) {
      break;
    }
    const Octets octets = part.Copy();
    text += (text.empty() ? "" : ", ") + std::string(octets.begin(), octets.end());
  } while (position != 0);
  return text;
}

}  // namespace

void RequireGss(OM_uint32 major, OM_uint32 minor) {
  if (GSS_ERROR(major) == 0) {
    return;
  }
  std::string text = TextOf(major, GSS_C_GSS_CODE);
  if (minor != 0) {
    text += ": " + TextOf(minor, GSS_C_MECH_CODE);
  }
  throw GssError(text, major);
}

}  // namespace DevSts
