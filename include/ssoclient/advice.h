#ifndef SSOCLIENT_ADVICE_H
#define SSOCLIENT_ADVICE_H

#include <string>
#include <vector>

namespace SsoClient {

/// One attribute of an advice. The name and the values may be empty, and there may be no values.
struct AdviceAttribute {
  std::string name;                 ///< the attribute's name
  std::vector<std::string> values;  ///< its values, in order
};

/// A block of advice in a token request and in the issued token (SAML 2.0 core, section 2.6.1).
struct Advice {
  std::string source;                       ///< the author of the advice: AdviceSource
  std::vector<AdviceAttribute> attributes;  ///< in order
};

}  // namespace SsoClient

#endif
