#ifndef DEVSTS_OPERATIONS_SECRETS_H
#define DEVSTS_OPERATIONS_SECRETS_H

#include <string>

namespace DevSts {

// Whether the secrets are equal. The time depends on their sizes only.
bool IsSameSecret(const std::string& left, const std::string& right);

}  // namespace DevSts

#endif
