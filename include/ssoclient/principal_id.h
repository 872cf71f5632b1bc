#ifndef SSOCLIENT_PRINCIPAL_ID_H
#define SSOCLIENT_PRINCIPAL_ID_H

#include <string>

#include <ssoclient/export.h>

namespace SsoClient {

/// Identifies a user, a solution user or a group.
struct PrincipalId {
  std::string name;    ///< account or group name
  std::string domain;  ///< the domain that the name belongs to

  /// True when both are one object, or name and domain are equal without regard to ASCII letter
  /// case. As C strings: what stands behind a NUL does not count.
  SSOCLIENT_EXPORT bool operator==(const PrincipalId& other) const;
};

}  // namespace SsoClient

#endif
