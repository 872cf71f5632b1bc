// Calls on several threads, all of which fail, for a check with ThreadSanitizer.
#include <atomic>
#include <future>
#include <iostream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <ssoclient/ssoclient.h>

namespace {

bool FailsInCallback(const SsoClient::SecurityTokenService& service,
                     const SsoClient::TokenSpec& spec) {
  const auto result = std::make_shared<std::promise<std::string>>();
  service.AcquireTokenAsync("user", "password", spec,
                            [result](const auto&, const Tarnik::Exception* error) {
                              result->set_value(error == nullptr ? "" : error->Message());
                            });
  return result->get_future().get().find("127.0.0.1:1") != std::string::npos;
}

bool Fails(const SsoClient::SecurityTokenService& service, const SsoClient::TokenSpec& spec) {
  try {
    service.AcquireToken("user", "password", spec);
  } catch (const SsoClient::CommunicationException&) {
    return true;
  }
  return false;
}

}  // namespace

int main() {
  SsoClient::SecurityTokenServiceConfig config;
  config.url = "http://127.0.0.1:1/sts";
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(nullptr);
  const auto service = SsoClient::CreateSecurityTokenService(config);
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&] {
      for (int i = 0; i < 10; ++i) {
        failures += Fails(*service, spec) ? 1 : 0;
        failures += FailsInCallback(*service, spec) ? 1 : 0;
      }
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  std::cout << failures << " of 80 calls failed as they should\n";
  return failures == 80 ? 0 : 1;
}
