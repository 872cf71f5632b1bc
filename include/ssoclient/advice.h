#ifndef SSOCLIENT_ADVICE_H
#define SSOCLIENT_ADVICE_H

#include <string>
#include <vector>

namespace SsoClient {

/// One attribute carried by an advice. Name and values may be empty texts, and there may be no
/// value at all.
struct AdviceAttribute {
  std::string name;                 ///< the attribute's name
  std::vector<std::string> values;  ///< its values, in order
};

/// A block of advice that a token request carries and a token returns (SAML 2.0 core, section
/// 2.6.1).
struct Advice {
  std::string source;                       ///< who gives the advice: AdviceSource
  std::vector<AdviceAttribute> attributes;  ///< in order
};

}  // namespace SsoClient

#endif
