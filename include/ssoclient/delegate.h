#ifndef SSOCLIENT_DELEGATE_H
#define SSOCLIENT_DELEGATE_H

#include <ssoclient/principal_id.h>
#include <tarnik/system/date_time.h>

namespace SsoClient {

/// One link of a token's delegation chain (SAML 2.0 Condition for Delegation Restriction, section
/// 2).
struct Delegate {
  PrincipalId delegate;                        ///< who may act for the subject
  Tarnik::System::DateTime delegationInstant;  ///< since when, in UTC
};

}  // namespace SsoClient

#endif
