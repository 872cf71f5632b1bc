// Simulates a fleet of servers, each with a token source, over a week of virtual time in which one
// of three security token services dies and comes back. Prints the requests at each service as
// plots, and a table that compares the defaults with other settings in three days of a smaller
// fleet.
#include <algorithm>
#include <cstdio>
#include <exception>
#include <iostream>
#include <numeric>
#include <string>
#include <vector>

#include "fleet.h"

namespace Bench {
namespace {

using std::chrono::hours;
using std::chrono::minutes;

constexpr std::size_t kHour = 60;
constexpr std::size_t kColumns = 84;

/// The requests a second at a service from minute `begin` to `end`.
double Rate(const std::vector<std::uint32_t>& byMinute, std::size_t begin, std::size_t end) {
  const auto first = byMinute.begin();
  const auto sum = std::accumulate(first + static_cast<std::ptrdiff_t>(begin),
                                   first + static_cast<std::ptrdiff_t>(end), std::uint64_t{0});
  return static_cast<double>(sum) / (60.0 * static_cast<double>(end - begin));
}

double PeakRate(const std::vector<std::uint32_t>& byMinute, std::size_t begin, std::size_t end) {
  const auto first = byMinute.begin();
  return *std::max_element(first + static_cast<std::ptrdiff_t>(begin),
                           first + static_cast<std::ptrdiff_t>(end)) /
         60.0;
}

std::size_t Minutes(hours duration) {
  return static_cast<std::size_t>(duration / minutes(1));
}

/// One row for each service; a character is a level of the rate in its part of the time.
void Plot(const std::string& title, const FleetReport& report, std::size_t begin, std::size_t end) {
  static const std::string kLevels = " .:-=+*#%@";
  const std::size_t perColumn = (end - begin) / kColumns;
  double highest = 0;
  for (const auto& byMinute : report.requests) {
    for (std::size_t at = begin; at + perColumn <= end; at += perColumn) {
      highest = std::max(highest, Rate(byMinute, at, at + perColumn));
    }
  }
  std::printf("\n%s; %zu minutes a column, '%s' from 0 to %.1f requests/s\n", title.c_str(),
              perColumn, kLevels.c_str(), highest);
  for (std::size_t service = 0; service < kServices; ++service) {
    std::string row;
    for (std::size_t at = begin; at + perColumn <= end; at += perColumn) {
      const double share = Rate(report.requests[service], at, at + perColumn) / highest;
      row +=
          kLevels[static_cast<std::size_t>(share * static_cast<double>(kLevels.size() - 1) + 0.5)];
    }
    std::printf("  STS %zu |%s|\n", service + 1, row.c_str());
  }
}

void PrintRates(const FleetReport& report, const std::string& when, std::size_t begin,
                std::size_t end) {
  std::printf("  %-28s", when.c_str());
  for (const auto& byMinute : report.requests) {
    const double mean = Rate(byMinute, begin, end);
    const double peak = PeakRate(byMinute, begin, end);
    std::printf("  %6.2f %6.2f %5.1f", mean, peak, mean > 0 ? peak / mean : 0.0);
  }
  std::printf("\n");
}

void PrintCallers(const FleetPlan& plan, const FleetReport& report) {
  const double down =
      static_cast<double>(plan.servers) * static_cast<double>((plan.comeback - plan.death).count());
  std::printf(
      "  callers: %llu calls, %llu waited (longest %.1f s), %llu got no token (longest without "
      "%.1f "
      "s)\n  attempts at the dead STS: %.2f an hour for each server\n",
      static_cast<unsigned long long>(report.calls),
      static_cast<unsigned long long>(report.callsThatWaited),
      static_cast<double>(report.longestWait.count()) / 1000,
      static_cast<unsigned long long>(report.callsWithoutToken),
      static_cast<double>(report.longestWithoutToken.count()) / 1000,
      static_cast<double>(report.attemptsAtDead) / down);
}

void ReportWeek(const FleetPlan& plan) {
  const FleetReport report = SimulateFleet(plan);
  const std::size_t death = Minutes(plan.death);
  const std::size_t comeback = Minutes(plan.comeback);
  const std::size_t end = Minutes(plan.duration);
  std::printf("%zu servers, tokens of %lld s, 3 STSs; STS 1 is down from hour %lld to %lld\n",
              plan.servers, static_cast<long long>(plan.lifetime.count()),
              static_cast<long long>(plan.death.count()),
              static_cast<long long>(plan.comeback.count()));
  Plot("The week", report, 0, end);
  Plot("The first hours", report, 0, 7 * kHour);
  Plot("Around the failure", report, death - kHour, death + 6 * kHour);
  Plot("Around the return", report, comeback - kHour, comeback + 6 * kHour);
  std::printf("\n  requests/s: mean, peak of a minute, peak/mean %9s%s%22s%22s\n", "", "STS 1",
              "STS 2", "STS 3");
  PrintRates(report, "the first hour", 0, kHour);
  PrintRates(report, "hour 2 to the failure", kHour, death);
  PrintRates(report, "while STS 1 is down", death, comeback);
  PrintRates(report, "hour 1 after the return", comeback, comeback + kHour);
  PrintRates(report, "the rest of the week", comeback + kHour, end);
  PrintCallers(plan, report);
}

/// A row of the comparison.
struct Variant {
  std::string name;
  FleetPlan plan;
};

FleetPlan Smaller(std::size_t servers) {
  FleetPlan plan;
  plan.servers = servers;
  plan.duration = hours(48);
  plan.death = hours(24);
  plan.comeback = hours(28);
  return plan;
}

std::vector<Variant> MakeVariants(std::size_t servers) {
  const FleetPlan base = Smaller(servers);
  std::vector<Variant> variants{{"the defaults", base}};
  const auto add = [&](const std::string& name, auto change) {
    variants.push_back({name, base});
    change(variants.back().plan);
  };
  add("all list STS 1 first", [](FleetPlan& plan) { plan.order = ListOrder::kSame; });
  add("refuses when down", [](FleetPlan& plan) { plan.outage = Outage::kRefused; });
  add("jitter 0", [](FleetPlan& plan) { plan.refresh.jitter = 0; });
  add("jitter 0.05", [](FleetPlan& plan) { plan.refresh.jitter = 0.05; });
  add("jitter 0.2", [](FleetPlan& plan) { plan.refresh.jitter = 0.2; });
  add("fraction 0.5", [](FleetPlan& plan) { plan.refresh.fraction = 0.5; });
  add("fraction 0.9", [](FleetPlan& plan) { plan.refresh.fraction = 0.9; });
  add("tokens of 5 minutes", [](FleetPlan& plan) { plan.lifetime = std::chrono::minutes(5); });
  return variants;
}

void PrintVariant(const Variant& variant) {
  const FleetPlan& plan = variant.plan;
  const FleetReport report = SimulateFleet(plan);
  const std::size_t death = Minutes(plan.death);
  const std::size_t comeback = Minutes(plan.comeback);
  const std::size_t end = Minutes(plan.duration);
  std::vector<std::uint32_t> all(end);
  for (const auto& byMinute : report.requests) {
    std::transform(all.begin(), all.end(), byMinute.begin(), all.begin(), std::plus<>());
  }
  const double mean = Rate(all, death - 12 * kHour, death);
  const auto share = [&](std::size_t service, std::size_t from, std::size_t to) {
    return 100 * Rate(report.requests[service], from, to) / Rate(all, from, to);
  };
  const double down =
      static_cast<double>(plan.servers) * static_cast<double>((plan.comeback - plan.death).count());
  std::printf(
      "%-22s %9.2f %6.1f %6.1f %6.1f %6.1f   %3.0f/%3.0f/%3.0f  %3.0f/%3.0f/%3.0f %9.2f %9llu "
      "%7.1f\n",
      variant.name.c_str(), mean * 3600 / static_cast<double>(plan.servers),
      PeakRate(all, kHour / 3, 6 * kHour) / mean, PeakRate(all, 12 * kHour, death) / mean,
      PeakRate(all, death, comeback) / mean, PeakRate(all, comeback, end) / mean,
      share(0, kHour, death), share(1, kHour, death), share(2, kHour, death),
      share(0, end - 12 * kHour, end), share(1, end - 12 * kHour, end),
      share(2, end - 12 * kHour, end), static_cast<double>(report.attemptsAtDead) / down,
      static_cast<unsigned long long>(report.callsWithoutToken),
      static_cast<double>(report.longestWait.count()) / 1000);
  std::fflush(stdout);
}

void CompareVariants(std::size_t servers) {
  std::printf(
      "\n%zu servers for 48 hours, STS 1 down from hour 24 to 28. Per server and hour: requests, "
      "and "
      "attempts at the dead STS.\nPeaks of a minute, of all STSs together, relative to the mean: "
      "from minute 20 to hour 6, from hour 12 to the failure, while\nSTS 1 is down, afterwards. "
      "Share of each STS in percent: before the failure, and in the last 12 hours.\n\n",
      servers);
  std::printf("%-22s %9s %6s %6s %6s %6s   %-11s  %-11s %9s %9s %7s\n", "", "requests", "start",
              "later", "down", "after", "share", "share after", "at dead", "no token", "wait s");
  for (const Variant& variant : MakeVariants(servers)) {
    PrintVariant(variant);
  }
}

}  // namespace
}  // namespace Bench

int main(int argc, char** argv) {
  try {
    const bool isShort = argc == 2 && std::string(argv[1]) == "--short";
    if (!isShort) {
      Bench::ReportWeek({});
    }
    Bench::CompareVariants(isShort ? 1000 : 3000);
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "fleet_report: " << e.what() << '\n';
    return 1;
  }
}
