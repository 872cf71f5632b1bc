// Campaigns of random faults: chaos --campaign NAME [--seed N] [--seconds N], or chaos --list
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <exception>
#include <iostream>
#include <random>
#include <string>
#include <string_view>

#include "chaos/campaigns.h"
#include "chaos/run.h"

namespace {

using SsoClient::Testing::Run;

struct Campaign {
  std::string_view name;
  void (*run)(Run&);
};

constexpr Campaign kCampaigns[] = {
    {"cuts", SsoClient::Testing::RunCuts},
    {"stalls", SsoClient::Testing::RunStalls},
    {"allocations", SsoClient::Testing::RunAllocations},
    {"threads", SsoClient::Testing::RunThreads},
    {"descriptors", SsoClient::Testing::RunDescriptors},
    {"clock", SsoClient::Testing::RunClock},
    {"exits", SsoClient::Testing::RunExits},
    {"forks", SsoClient::Testing::RunForks},
    {"plugins", SsoClient::Testing::RunPlugins},
};

struct Options {
  std::string campaign;
  std::uint64_t seed = std::random_device()();
  std::chrono::seconds time{10};
};

int Usage() {
  std::cerr << "usage: ssoclient_chaos --list\n"
               "       ssoclient_chaos --campaign NAME [--seed N] [--seconds N]\n";
  return 2;
}

int RunCampaign(const Campaign& campaign, const Options& options) {
  std::cout << campaign.name << ": seed " << options.seed << std::endl;
  const auto begin = std::chrono::steady_clock::now();
  Run run(options.campaign, options.seed, options.time);
  try {
    campaign.run(run);
  } catch (const std::exception& failure) {
    run.Fail(std::string("an exception: ") + failure.what());
  }
  const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - begin;
  std::cout << campaign.name << ": " << run.Cases() << " cases in " << elapsed.count() << " s"
            << std::endl;
  return EXIT_SUCCESS;
}

}  // namespace

int main(int argc, char** argv) {
  Options options;
  if (argc == 2 && std::string_view(argv[1]) == "--list") {
    for (const Campaign& campaign : kCampaigns) {
      std::cout << campaign.name << '\n';
    }
    return EXIT_SUCCESS;
  }
  for (int i = 1; i + 1 < argc; i += 2) {
    const std::string_view name = argv[i];
    if (name == "--campaign") {
      options.campaign = argv[i + 1];
    } else if (name == "--seed") {
      options.seed = std::strtoull(argv[i + 1], nullptr, 10);
    } else if (name == "--seconds") {
      options.time = std::chrono::seconds(std::atol(argv[i + 1]));
    } else {
      return Usage();
    }
  }
  for (const Campaign& campaign : kCampaigns) {
    if (argc % 2 == 1 && campaign.name == options.campaign) {
      return RunCampaign(campaign, options);
    }
  }
  return Usage();
}
