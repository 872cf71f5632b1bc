#ifndef EXAMPLES_PROMETHEUS_METRICS_H
#define EXAMPLES_PROMETHEUS_METRICS_H
#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <prometheus/collectable.h>
#include <prometheus/histogram.h>
#include <prometheus/registry.h>

#include <ssoclient/access/token_source.h>

/// The durations of the attempts of token sources, by endpoint and by what failed.
class AttemptDurations final : public SsoClient::Access::AccessListener {
 public:
  explicit AttemptDurations(std::shared_ptr<prometheus::Registry> registry)
      : registry_(std::move(registry)) {}
  void OnAttemptEnded(const SsoClient::Access::AttemptRecord& attempt) override {
    const prometheus::Histogram::BucketBoundaries limits{0.01, 0.1, 1, 10};
    family_.Add({{"endpoint", attempt.endpoint}, {"failure", NameOf(attempt.failure)}}, limits)
        .Observe(std::chrono::duration<double>(attempt.duration).count());
  }

 private:
  const std::shared_ptr<prometheus::Registry> registry_;
  prometheus::Family<prometheus::Histogram>& family_{
      prometheus::BuildHistogram().Name("token_attempt_seconds").Register(*registry_)};
};

/// The counters of a token source at the moment at which Prometheus asks for them.
class SourceCounters final : public prometheus::Collectable {
 public:
  explicit SourceCounters(std::shared_ptr<SsoClient::Access::TokenSource> source)
      : source_(std::move(source)) {}
  std::vector<prometheus::MetricFamily> Collect() const override {
    const auto now = source_->Metrics();
    std::vector<prometheus::MetricFamily> all{
        Counter("token_hits_total", now.hits),
        Counter("token_misses_total", now.misses),
        Counter("token_shared_total", now.shared),
        Counter("token_refused_from_memory_total", now.refusedFromMemory),
        Counter("token_evictions_total", now.evictions),
        Counter("token_logins_total", now.logins),
        Counter("token_renewals_total", now.renewals),
        Counter("token_exchanges_total", now.exchanges),
        Counter("token_refresh_failures_total", now.refreshFailures),
        Counter("token_deviations_total", now.deviations)};
    if (now.earliestExpiration) {
      all.push_back(Gauge("token_earliest_expiration_seconds",
                          static_cast<double>(now.earliestExpiration->GetUtcTime()) / 1e6));
    }
    return all;
  }

 private:
  static prometheus::MetricFamily Counter(const std::string& name, std::uint64_t value) {
    prometheus::ClientMetric metric;
    metric.counter.value = static_cast<double>(value);
    return {name, "", prometheus::MetricType::Counter, {metric}};
  }
  /// A time is in seconds since 1970.
  static prometheus::MetricFamily Gauge(const std::string& name, double value) {
    prometheus::ClientMetric metric;
    metric.gauge.value = value;
    return {name, "", prometheus::MetricType::Gauge, {metric}};
  }
  const std::shared_ptr<SsoClient::Access::TokenSource> source_;
};
#endif
