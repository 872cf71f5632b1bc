#include "kerberos/gss_library.h"

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
  // The text of GSS_S_FAILURE only refers to the mechanism's text.
  const std::string cause = minor != 0 ? TextOf(minor, GSS_C_MECH_CODE) : std::string();
  if (GSS_ROUTINE_ERROR(major) == GSS_S_FAILURE && !cause.empty()) {
    throw GssError(cause, major);
  }
  const std::string text = TextOf(major, GSS_C_GSS_CODE);
  const bool isSpecific = !cause.empty() && cause != TextOf(0, GSS_C_MECH_CODE);
  throw GssError(isSpecific ? text + ": " + cause : text, major);
}

}  // namespace DevSts
