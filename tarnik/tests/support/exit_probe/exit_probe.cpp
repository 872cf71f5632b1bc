// Ends the process while the pool still has work. Usage: exit_probe SCENARIO
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <future>
#include <iostream>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include <openssl/evp.h>
#include <openssl/rsa.h>

#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

namespace {

using Tarnik::System::GetThreadPool;

constexpr int kItems = 100;

std::atomic<int> started{0};

void AwaitStarted(int count) {
  while (started < count) {
    std::this_thread::yield();
  }
}

void RunBusyItems() {
  for (int i = 0; i < kItems; ++i) {
    GetThreadPool()->Run([] {
      ++started;
      for (int spin = 0; spin < 300000; ++spin) {
        asm volatile("" ::: "memory");
      }
    });
  }
  AwaitStarted(1);
}

void RunBlockedItems() {
  for (int i = 0; i < kItems; ++i) {
    GetThreadPool()->Run([] {
      ++started;
      std::promise<void>().get_future().wait_for(std::chrono::hours(1));
    });
  }
  AwaitStarted(kItems);
}

void UseOpenSsl() {
  unsigned char digest[EVP_MAX_MD_SIZE];
  const std::vector<unsigned char> data(4096, 'x');
  for (int i = 0; i < 200; ++i) {
    EVP_MD* algorithm = EVP_MD_fetch(nullptr, "SHA256", nullptr);
    EVP_Digest(data.data(), data.size(), digest, nullptr, algorithm, nullptr);
    EVP_MD_free(algorithm);
  }
  EVP_PKEY* key = EVP_RSA_gen(2048);
  EVP_PKEY_free(key);
}

void RunOpenSslItems() {
  for (int i = 0; i < kItems; ++i) {
    GetThreadPool()->Run([] {
      ++started;
      UseOpenSsl();
    });
  }
  AwaitStarted(10);
}

void RunItemsThatWaitForTimers() {
  for (int i = 0; i < kItems; ++i) {
    GetThreadPool()->Run([] {
      std::promise<void> done;
      ++started;
      const auto timer = GetThreadPool()->RunAfter(1000, [&done] { done.set_value(); });
      done.get_future().wait();
    });
  }
  AwaitStarted(kItems / 2);
}

void PostEndlessCompletions() {
  struct Repeat {
    void operator()() const {
      ++started;
      GetThreadPool()->Post(Repeat{});
    }
  };
  for (int i = 0; i < 4; ++i) {
    GetThreadPool()->Post(Repeat{});
  }
  AwaitStarted(100);
}

void LeaveConnectsPending() {
  for (int i = 0; i < kItems; ++i) {
    const auto socket = Tarnik::System::CreateTCPClientSocket(GetThreadPool().get());
    socket->ConnectAsync(i % 2 == 0 ? "localhost" : "127.0.0.1", 1,
                         [](Tarnik::System::TCPClientSocket*, Tarnik::Exception*) { ++started; });
  }
}

void ExitFromAWorker() {
  RunBlockedItems();
  GetThreadPool()->Run([] { std::exit(0); });
  std::promise<void>().get_future().wait();
}

void ExitFromAnIoThread() {
  RunBusyItems();
  GetThreadPool()->Post([] { std::exit(0); });
  std::promise<void>().get_future().wait();
}

}  // namespace

int main(int argumentCount, char** arguments) {
  const std::map<std::string, void (*)()> scenarios = {
      {"busy", RunBusyItems},
      {"blocked", RunBlockedItems},
      {"openssl", RunOpenSslItems},
      {"timers", RunItemsThatWaitForTimers},
      {"completions", PostEndlessCompletions},
      {"connects", LeaveConnectsPending},
      {"exit-from-worker", ExitFromAWorker},
      {"exit-from-io", ExitFromAnIoThread},
      {"unused", [] {}},
  };
  const auto scenario = scenarios.find(argumentCount == 2 ? arguments[1] : "");
  if (scenario == scenarios.end()) {
    std::cerr << "usage: exit_probe SCENARIO\n";
    return 2;
  }
  scenario->second();
  std::exit(0);
}
