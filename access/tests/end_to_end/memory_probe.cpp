// Logs in, and looks for a text in its memory:
// memory_probe WHERE URL CA_FILE SIGNING_CERTIFICATE_FILE PASSWORD TEXT
// The password and the text are given backwards. The exit status is the number of places where the
// text is: "freed" counts blocks that were released with any ten bytes of it until the source was,
// "memory" all writable memory while the token is in the cache.
#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <memory>
#include <string>
#include <string_view>

#include <ssoclient/exceptions.h>

#include "calls/freed_memory.h"
#include "end_to_end/probe_config.h"

namespace {

using SsoClient::Access::PasswordLogin;
using SsoClient::Access::TokenSource;
using SsoClient::Access::TokenSourceConfig;
using SsoClient::Access::Testing::ProbeSpec;

constexpr int kMostPlaces = 100;
// Also finds copies that were released before they were complete.
constexpr std::size_t kPiece = 10;

std::shared_ptr<TokenSource> MakeSource(char** argv) {
  TokenSourceConfig config = SsoClient::Access::Testing::ProbeConfig(argv[2], argv[3], argv[4]);
  config.login = PasswordLogin{"alice@EXAMPLE.COM", [backwards = std::string_view(argv[5])] {
                                 return std::string(backwards.rbegin(), backwards.rend());
                               }};
  return SsoClient::Access::CreateTokenSource(std::move(config));
}

void LogIn(TokenSource& source) {
  for (int i = 0; i < 3; ++i) {
    try {
      source.GetToken(ProbeSpec(i));
    } catch (const SsoClient::SsoException& failure) {
      std::cerr << failure.what() << '\n';
    }
  }
}

int CountFreed(char** argv) {
  const std::string_view backwards = argv[6];
  const SsoClient::Testing::FreedMemory memory({backwards.rbegin(), backwards.rend()}, kPiece);
  auto source = MakeSource(argv);
  LogIn(*source);
  source.reset();
  return memory.Finds();
}

int CountIn(std::string_view memory, std::string_view backwards) {
  int count = 0;
  const auto isSame = [](char a, char b) { return a == b; };
  for (auto at = memory.begin();; ++at) {
    at = std::search(at, memory.end(), backwards.rbegin(), backwards.rend(), isSame);
    if (at == memory.end()) {
      return count;
    }
    ++count;
  }
}

// The ranges of /proc/self/maps (proc(5)) that are readable and writable.
int CountInMemory(std::string_view backwards) {
  int count = 0;
  std::ifstream maps("/proc/self/maps");
  for (std::string line; std::getline(maps, line);) {
    std::uintptr_t begin = 0;
    std::uintptr_t end = 0;
    char readable = 0;
    char writable = 0;
    if (std::sscanf(line.c_str(), "%lx-%lx %c%c", &begin, &end, &readable, &writable) == 4 &&
        readable == 'r' && writable == 'w' && line.find("[v") == std::string::npos) {
      count += CountIn({reinterpret_cast<const char*>(begin), end - begin}, backwards);
    }
  }
  return count;
}

}  // namespace

int main(int argc, char** argv) {
  const std::string_view where = argc == 7 ? argv[1] : "";
  if (where == "freed") {
    return std::min(CountFreed(argv), kMostPlaces);
  }
  if (where == "memory") {
    const auto source = MakeSource(argv);
    LogIn(*source);
    // The worker may have the password for a moment after the token.
    if (!source->Stop(std::chrono::seconds(10))) {
      return 255;
    }
    return std::min(CountInMemory(argv[6]), kMostPlaces);
  }
  return 255;
}
