#ifndef SSOCLIENT_DESCRIBE_DESCRIBE_H
#define SSOCLIENT_DESCRIBE_DESCRIBE_H

#include <string>

#include <ssoclient/advice.h>
#include <ssoclient/delegate.h>
#include <ssoclient/principal_id.h>
#include <ssoclient/token_spec.h>

namespace SsoClient {

/// One-line descriptions for log lines. The texts are fixed: readers of logs depend on them.
std::string Describe(const PrincipalId& principal);
/// "(null)" when there is no principal.
std::string Describe(const PrincipalId* principal);
std::string Describe(const Delegate& delegate);
std::string Describe(const AdviceAttribute& attribute);
std::string Describe(const Advice& advice);
std::string Describe(const TokenSpec& spec);

}  // namespace SsoClient

#endif
