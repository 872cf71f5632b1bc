#ifndef SSOCLIENT_TESTS_SUPPORT_THROWN_MESSAGE_H
#define SSOCLIENT_TESTS_SUPPORT_THROWN_MESSAGE_H

#include <exception>
#include <string>
#include <typeinfo>
#include <utility>

#include <tarnik/core/throwable.h>

namespace SsoClient::Testing {

/// The message of the exception that `action` throws if its class is exactly `Expected`, else a
/// text that describes what happened instead.
template <class Expected, class Action>
std::string ThrownMessage(Action&& action) {
  try {
    std::forward<Action>(action)();
  } catch (const Tarnik::Throwable& fault) {
    return typeid(fault) == typeid(Expected) ? fault.Message() : "Other class: " + fault.Dump();
  } catch (const std::exception& fault) {
    return std::string("Foreign exception: ") + fault.what();
  }
  return "Nothing was thrown.";
}

}  // namespace SsoClient::Testing

#endif
