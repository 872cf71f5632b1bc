#ifndef SSOCLIENT_TESTS_INTEGRATION_OPERATION_H
#define SSOCLIENT_TESTS_INTEGRATION_OPERATION_H

#include <future>
#include <iosfwd>
#include <memory>
#include <optional>
#include <string>
#include <typeindex>
#include <typeinfo>

#include <ssoclient/ssoclient.h>

#include "integration/sts_fixture.h"

namespace SsoClient::Testing {

/// The operations of a service, for tests of all of them.
enum class Operation { Password, Certificate, Token, Renew, Validate };

inline constexpr Operation kOperations[] = {Operation::Password, Operation::Certificate,
                                            Operation::Token, Operation::Renew,
                                            Operation::Validate};

/// The synchronous operation's name in `SecurityTokenService`.
const char* NameOf(Operation operation);
std::ostream& operator<<(std::ostream& stream, Operation operation);

/// Arguments for any operation; each uses the ones it needs. Renewal uses the spec's lifetime.
struct Arguments {
  TokenSpec spec = TenMinutes();
  std::shared_ptr<const SamlToken> token;
  std::string userName = kUser;
  std::string password = kPassword;
};

/// The outcome of an operation. Without an error, its class is `void`.
struct Outcome {
  std::shared_ptr<const SamlToken> token;
  std::optional<bool> verdict;
  std::type_index errorClass = typeid(void);
  std::string message;

  bool IsSuccess() const { return errorClass == typeid(void); }
};

/// Runs the synchronous operation.
Outcome CallNow(Operation operation, const SecurityTokenService& service,
                const Arguments& arguments);

/// Starts the asynchronous operation with a callback for results of both kinds.
template <class Callback>
void StartAsync(Operation operation, const SecurityTokenService& service,
                const Arguments& arguments, const Callback& callback) {
  switch (operation) {
    case Operation::Password:
      service.AcquireTokenAsync(arguments.userName, arguments.password, arguments.spec, callback);
      break;
    case Operation::Certificate:
      service.AcquireTokenByCertificateAsync(arguments.spec, callback);
      break;
    case Operation::Token:
      service.AcquireTokenByTokenAsync(*arguments.token, arguments.spec, callback);
      break;
    case Operation::Renew:
      service.RenewTokenAsync(*arguments.token, arguments.spec.tokenLifetimeSec, callback);
      break;
    case Operation::Validate:
      service.ValidateSubjectAsync(*arguments.token, callback);
      break;
  }
}

/// Starts the asynchronous operation. `arguments.token` must stay alive until the callback has run.
std::future<Outcome> CallAsync(Operation operation, const SecurityTokenService& service,
                               const Arguments& arguments);

}  // namespace SsoClient::Testing

#endif
