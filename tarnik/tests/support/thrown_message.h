#ifndef TARNIK_TESTS_SUPPORT_THROWN_MESSAGE_H
#define TARNIK_TESTS_SUPPORT_THROWN_MESSAGE_H

#include <string>

namespace Tarnik::Testing {

/// The message of the `ExceptionClass` that `action` throws, or `otherwise` if it throws nothing.
/// Exceptions of other classes propagate.
template <class ExceptionClass, class Action>
std::string ThrownMessage(Action action, const char* otherwise = "nothing was thrown") {
  try {
    action();
  } catch (const ExceptionClass& exception) {
    return exception.Message();
  }
  return otherwise;
}

}  // namespace Tarnik::Testing

#endif
