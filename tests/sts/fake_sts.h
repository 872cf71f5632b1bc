#ifndef SSOCLIENT_TESTS_STS_FAKE_STS_H
#define SSOCLIENT_TESTS_STS_FAKE_STS_H

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <boost/none.hpp>
#include <boost/optional.hpp>

#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/security_token_service.h>

#include "sts/fakes.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "sts/security_token_service_impl.h"

namespace SsoClient::Testing {

/// Makes services that send real requests to a fake transport and read its answers.
class FakeSts {
 public:
  /// `answers` as for `FakeTransport`. Requests are signed if there is a `holderOfKeyConfig`.
  explicit FakeSts(std::vector<std::string> answers,
                   boost::optional<HolderOfKeyConfig> holderOfKeyConfig = boost::none)
      : transport(std::make_shared<FakeTransport>(std::move(answers))),
        holderOfKeyConfig_(std::move(holderOfKeyConfig)) {}

  std::shared_ptr<const SecurityTokenService> Service() const {
    return std::make_shared<SecurityTokenServiceImpl>(
        std::make_shared<RequestBuilderImpl>(holderOfKeyConfig_), transport,
        std::make_shared<ResponseHandlerImpl>(), factory);
  }

  std::shared_ptr<FakeTransport> transport;
  std::shared_ptr<FakeTokenFactory> factory = std::make_shared<FakeTokenFactory>();

 private:
  boost::optional<HolderOfKeyConfig> holderOfKeyConfig_;
};

}  // namespace SsoClient::Testing

#endif
