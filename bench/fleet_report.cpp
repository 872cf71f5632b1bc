// Simulates a fleet of servers, each with a token source, over a week of virtual time in which one
// of three security token services (STS) dies and comes back. Prints the requests at each as plots,
// and a table that compares the defaults with other settings over two days of a smaller fleet. With
// --short, prints only the table, for a still smaller fleet.
#include <algorithm>
#include <cstdio>
#include <exception>
#include <functional>
#include <iostream>
#include <numeric>
#include <string>
#include <vector>

#include "fleet.h"

namespace Bench {
namespace {

using std::chrono::hours;
using std::chrono::milliseconds;
using std::chrono::minutes;
using std::chrono::seconds;

using ByMinute = std::vector<std::uint32_t>;

constexpr std::size_t kHour = 60;  // in minutes, as all times of the reports
constexpr std::size_t kColumns = 84;

/// A part of the time of a report.
struct Period {
  std::size_t begin;
  std::size_t end;
};

/// The requests a second.
double Rate(const ByMinute& requests, Period period) {
  const auto first = requests.begin();
  const auto sum = std::accumulate(first + static_cast<std::ptrdiff_t>(period.begin),
                                   first + static_cast<std::ptrdiff_t>(period.end), 0.0);
  return sum / (60.0 * static_cast<double>(period.end - period.begin));
}

/// The requests a second in the minute with the most.
double PeakRate(const ByMinute& requests, Period period) {
  const auto first = requests.begin();
  return *std::max_element(first + static_cast<std::ptrdiff_t>(period.begin),
                           first + static_cast<std::ptrdiff_t>(period.end)) /
         60.0;
}

std::size_t Minutes(minutes duration) {
  return static_cast<std::size_t>(duration.count());
}

double Seconds(milliseconds duration) {
  return static_cast<double>(duration.count()) / 1000;
}

/// Attempts at the dead STS for each server and hour.
double AttemptsAtDead(const FleetPlan& plan, const FleetReport& report) {
  const auto outage = static_cast<double>(Minutes(plan.comeback - plan.death));
  return static_cast<double>(report.attemptsAtDead) * kHour /
         (outage * static_cast<double>(plan.servers));
}

/// One row for each STS; a character is the rate in its part of the time.
void Plot(const std::string& title, const FleetReport& report, Period period) {
  static const std::string kLevels = " .:-=+*#%@";
  const std::size_t width = (period.end - period.begin) / kColumns;
  const auto rate = [&](std::size_t sts, std::size_t column) {
    const std::size_t begin = period.begin + column * width;
    return Rate(report.requests[sts], {begin, begin + width});
  };
  double highest = 0;
  for (std::size_t i = 0; i < kServices * kColumns; ++i) {
    highest = std::max(highest, rate(i / kColumns, i % kColumns));
  }
  std::printf("\n%s: %zu minutes a column, '%s' from 0 to %.1f requests/s\n", title.c_str(), width,
              kLevels.c_str(), highest);
  for (std::size_t sts = 0; sts < kServices; ++sts) {
    std::string row;
    for (std::size_t column = 0; column < kColumns; ++column) {
      const double level =
          rate(sts, column) / highest * static_cast<double>(kLevels.size() - 1) + 0.5;
      row += kLevels[static_cast<std::size_t>(level)];
    }
    std::printf("  STS %zu |%s|\n", sts + 1, row.c_str());
  }
}

void PrintRates(const FleetReport& report, const char* when, Period period) {
  std::printf("  %-26s", when);
  for (const ByMinute& requests : report.requests) {
    const double mean = Rate(requests, period);
    const double peak = PeakRate(requests, period);
    std::printf("   %6.2f %6.2f %6.1f", mean, peak, mean > 0 ? peak / mean : 0.0);
  }
  std::printf("\n");
}

void PrintCalls(const FleetPlan& plan, const FleetReport& report) {
  std::printf("\n  calls: %llu, of which %llu waited, at most %.1f s\n",
              static_cast<unsigned long long>(report.calls),
              static_cast<unsigned long long>(report.callsThatWaited), Seconds(report.longestWait));
  std::printf("  calls without a token: %llu; the longest time without: %.1f s\n",
              static_cast<unsigned long long>(report.callsWithoutToken),
              Seconds(report.longestWithoutToken));
  std::printf("  attempts at STS 1 while it is down: %.2f for each server and hour\n",
              AttemptsAtDead(plan, report));
}

void ReportWeek(const FleetPlan& plan) {
  const FleetReport report = SimulateFleet(plan);
  const std::size_t death = Minutes(plan.death);
  const std::size_t comeback = Minutes(plan.comeback);
  const std::size_t end = Minutes(plan.duration);
  std::printf("%zu servers, tokens of %lld s; STS 1 is silent from hour %zu to %zu\n", plan.servers,
              static_cast<long long>(plan.lifetime.count()), death / kHour, comeback / kHour);
  Plot("The week", report, {0, end});
  Plot("The first hours", report, {0, 7 * kHour});
  Plot("An hour before the failure, and after it", report, {death - kHour, death + 6 * kHour});
  Plot("An hour before the return, and after it", report, {comeback - kHour, comeback + 6 * kHour});
  std::printf("\n  %-26s   %-20s   %-20s   %s\n", "requests/s", "STS 1: mean peak p/m",
              "STS 2: mean peak p/m", "STS 3: mean peak p/m");
  PrintRates(report, "the first hour", {0, kHour});
  PrintRates(report, "from then to the failure", {kHour, death});
  PrintRates(report, "while STS 1 is down", {death, comeback});
  PrintRates(report, "the hour after its return", {comeback, comeback + kHour});
  PrintRates(report, "the rest of the week", {comeback + kHour, end});
  PrintCalls(plan, report);
  std::fflush(stdout);
}

/// A row of the comparison.
struct Variant {
  std::string name;
  FleetPlan plan;
};

std::vector<Variant> MakeVariants(std::size_t servers) {
  FleetPlan base;
  base.servers = servers;
  base.duration = hours(48);
  base.death = hours(24);
  base.comeback = hours(28);
  std::vector<Variant> variants{{"the defaults", base}};
  const auto add = [&](const std::string& name, const std::function<void(FleetPlan&)>& change) {
    variants.push_back({name, base});
    change(variants.back().plan);
  };
  add("all list STS 1 first", [](FleetPlan& plan) { plan.order = ListOrder::kSame; });
  add("STS 1 refuses", [](FleetPlan& plan) { plan.outage = Outage::kRefused; });
  add("jitter 0", [](FleetPlan& plan) { plan.refresh.jitter = 0; });
  add("jitter 0.05", [](FleetPlan& plan) { plan.refresh.jitter = 0.05; });
  add("jitter 0.2", [](FleetPlan& plan) { plan.refresh.jitter = 0.2; });
  add("fraction 0.5", [](FleetPlan& plan) { plan.refresh.fraction = 0.5; });
  add("fraction 0.9", [](FleetPlan& plan) { plan.refresh.fraction = 0.9; });
  // What the limits of attempts and the pauses do shows where the cache helps little.
  base.lifetime = minutes(5);
  add("tokens of 5 minutes", [](FleetPlan&) {});
  add("- 1 failure opens", [](FleetPlan& plan) { plan.retry.failuresToOpen = 1; });
  add("- 10 failures open", [](FleetPlan& plan) { plan.retry.failuresToOpen = 10; });
  add("- first delay 10 s", [](FleetPlan& plan) { plan.retry.firstDelay = seconds(10); });
  add("- longest delay 10 s", [](FleetPlan& plan) { plan.retry.longestDelay = seconds(10); });
  add("- longest delay 5 m", [](FleetPlan& plan) { plan.retry.longestDelay = minutes(5); });
  base.lifetime = hours(1);
  base.betweenCalls = hours(2);
  add("a call in 2 hours", [](FleetPlan&) {});
  add("- attempts of 5 s", [](FleetPlan& plan) { plan.retry.attemptTimeout = seconds(5); });
  add("- attempts of 10 s", [](FleetPlan& plan) { plan.retry.attemptTimeout = seconds(10); });
  add("- attempts of 30 s", [](FleetPlan& plan) { plan.retry.attemptTimeout = seconds(30); });
  add("- 1 failure opens", [](FleetPlan& plan) { plan.retry.failuresToOpen = 1; });
  return variants;
}

/// The share of the calls, in percent, that fail while no STS answers for ten minutes.
double FailuresWithoutAnySts(FleetPlan plan) {
  plan.dying = kServices;
  plan.death = hours(12);
  plan.comeback = plan.death + minutes(10);
  plan.duration = hours(13);
  const FleetReport report = SimulateFleet(plan);
  return 100 * static_cast<double>(report.callsWithoutToken) /
         static_cast<double>(report.callsDuringOutage);
}

ByMinute Sum(const FleetReport& report) {
  ByMinute all(report.requests.front().size());
  for (const ByMinute& requests : report.requests) {
    std::transform(all.begin(), all.end(), requests.begin(), all.begin(), std::plus<>());
  }
  return all;
}

void PrintShares(const FleetReport& report, const ByMinute& all, Period period) {
  std::printf("  ");
  for (const ByMinute& requests : report.requests) {
    std::printf(" %3.0f", 100 * Rate(requests, period) / Rate(all, period));
  }
}

void PrintVariant(const Variant& variant) {
  const FleetPlan& plan = variant.plan;
  const FleetReport report = SimulateFleet(plan);
  const std::size_t death = Minutes(plan.death);
  const std::size_t comeback = Minutes(plan.comeback);
  const std::size_t end = Minutes(plan.duration);
  const ByMinute all = Sum(report);
  const double mean = Rate(all, {death - 12 * kHour, death});
  std::printf("%-20s %8.2f  ", variant.name.c_str(),
              mean * 3600 / static_cast<double>(plan.servers));
  for (const Period period : {Period{kHour / 3, 6 * kHour}, Period{12 * kHour, death},
                              Period{death, comeback}, Period{comeback, end}}) {
    std::printf(" %5.1f", PeakRate(all, period) / mean);
  }
  PrintShares(report, all, {kHour, death});
  PrintShares(report, all, {end - 12 * kHour, end});
  std::printf("  %7.2f %7llu %6.1f %9.1f\n", AttemptsAtDead(plan, report),
              static_cast<unsigned long long>(report.callsWithoutToken),
              Seconds(report.longestWait), FailuresWithoutAnySts(plan));
  std::fflush(stdout);
}

void CompareVariants(std::size_t servers) {
  std::printf(
      "\n%zu servers for 48 hours; STS 1 is down from hour 24 to 28\n"
      "  requests  for each server and hour\n"
      "  peak/mean of a minute, at all STSs together: from minute 20 to hour 6, from hour 12 to "
      "the "
      "failure,\n"
      "            during the failure, and afterwards\n"
      "  share     of each STS in percent, before the failure and in the last 12 hours\n"
      "  dead      attempts at STS 1 while it is down, for each server and hour\n"
      "  failed    calls without a token, and the longest wait of a call in seconds\n"
      "  all down  the calls that fail while no STS answers for ten minutes, in percent\n\n",
      servers);
  std::printf("%-20s %8s   %-23s   %-11s   %-11s  %7s %7s %6s %9s\n", "", "requests", "peak/mean",
              "share", "afterwards", "dead", "failed", "wait", "all down");
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
    Bench::CompareVariants(isShort ? 500 : 3000);
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "fleet_report: " << e.what() << '\n';
    return 1;
  }
}
