#include "integration/operation.h"

#include <future>
#include <memory>
#include <optional>
#include <ostream>
#include <stdexcept>
#include <type_traits>
#include <typeinfo>
#include <utility>

#include <gtest/gtest.h>

namespace SsoClient::Testing {

namespace {

Outcome Failed(const Tarnik::Exception& error) {
  return {nullptr, std::nullopt, typeid(error), error.Message()};
}

Outcome Succeeded(std::shared_ptr<const SamlToken> token) {
  return {std::move(token), std::nullopt, typeid(void), {}};
}

Outcome Succeeded(bool verdict) {
  return {nullptr, verdict, typeid(void), {}};
}

Outcome Perform(Operation operation, const SecurityTokenService& service,
                const Arguments& arguments) {
  switch (operation) {
    case Operation::Password:
      return Succeeded(
          service.AcquireToken(arguments.userName, arguments.password, arguments.spec));
    case Operation::Certificate:
      return Succeeded(service.AcquireTokenByCertificate(arguments.spec));
    case Operation::Token:
      return Succeeded(service.AcquireTokenByToken(*arguments.token, arguments.spec));
    case Operation::Renew:
      return Succeeded(service.RenewToken(*arguments.token, arguments.spec.tokenLifetimeSec));
    case Operation::Validate:
      return Succeeded(service.ValidateSubject(*arguments.token));
  }
  throw std::logic_error("no such operation");
}

}  // namespace

const char* NameOf(Operation operation) {
  switch (operation) {
    case Operation::Password:
      return "AcquireToken";
    case Operation::Certificate:
      return "AcquireTokenByCertificate";
    case Operation::Token:
      return "AcquireTokenByToken";
    case Operation::Renew:
      return "RenewToken";
    case Operation::Validate:
      return "ValidateSubject";
  }
  throw std::logic_error("no such operation");
}

std::ostream& operator<<(std::ostream& stream, Operation operation) {
  return stream << NameOf(operation);
}

Outcome CallNow(Operation operation, const SecurityTokenService& service,
                const Arguments& arguments) {
  try {
    return Perform(operation, service, arguments);
  } catch (const Tarnik::Exception& error) {
    return Failed(error);
  }
}

std::future<Outcome> CallAsync(Operation operation, const SecurityTokenService& service,
                               const Arguments& arguments) {
  // Shared, since the callback may not have returned yet when the outcome is available.
  auto promise = std::make_shared<std::promise<Outcome>>();
  auto outcome = promise->get_future();
  const auto report = [promise, presented = arguments.token](const auto& result,
                                                             const Tarnik::Exception* error) {
    if (error != nullptr) {
      EXPECT_FALSE(result);
      promise->set_value(Failed(*error));
      return;
    }
    if constexpr (std::is_same_v<decltype(result), const boost::optional<bool>&>) {
      promise->set_value(Succeeded(result.value()));
    } else {
      promise->set_value(Succeeded(result));
    }
  };
  StartAsync(operation, service, arguments, report);
  return outcome;
}

}  // namespace SsoClient::Testing
