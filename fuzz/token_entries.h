#ifndef FUZZ_TOKEN_ENTRIES_H
#define FUZZ_TOKEN_ENTRIES_H

#include <string>

#include "token_originals.h"

namespace Fuzz {

/// Crashes the process unless every function that creates tokens accepts a token of this signer,
/// which is valid now, with these values of `SsoClient::Testing::AllValues`, and every one that
/// verifies signatures refuses it for each signer with another key.
void RequireSameFromEveryEntry(const std::string& xml, const Signer& signer,
                               const std::string& values);

}  // namespace Fuzz

#endif
