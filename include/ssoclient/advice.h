#ifndef SSOCLIENT_ADVICE_H
#define SSOCLIENT_ADVICE_H

#include <string>
#include <vector>

namespace SsoClient {

/// One attribute carried by an advice.
struct AdviceAttribute {
  std::string name;                 ///< the attribute's name
  std::vector<std::string> values;  ///< its values, in order
};

/// A block of advice that a token request carries and a token returns.
struct Advice {
  std::string source;                       ///< the source that gives the advice
  std::vector<AdviceAttribute> attributes;  ///< in order
};

}  // namespace SsoClient

#endif
