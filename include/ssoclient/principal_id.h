#ifndef SSOCLIENT_PRINCIPAL_ID_H
#define SSOCLIENT_PRINCIPAL_ID_H

#include <string>

#include <ssoclient/export.h>

namespace SsoClient {

/// Identifies a user, a solution user or a group.
struct PrincipalId {
  std::string name;    ///< account or group name
  std::string domain;  ///< the domain that the name belongs to

  /// Returns true when name and domain are equal, ignoring ASCII letter case. They are compared as
  /// C strings: only up to the first NUL.
  SSOCLIENT_EXPORT bool operator==(const PrincipalId& other) const;
};

}  // namespace SsoClient

#endif
