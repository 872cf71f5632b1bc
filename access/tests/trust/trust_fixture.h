#ifndef SSOCLIENT_ACCESS_TESTS_TRUST_TRUST_FIXTURE_H
#define SSOCLIENT_ACCESS_TESTS_TRUST_TRUST_FIXTURE_H

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <sys/resource.h>

#include <ssoclient/access/trust_store.h>

#include "support/temporary_file.h"
#include "support/test_pki.h"
#include "support/virtual_runtime.h"
#include "trust/trust_store_impl.h"

namespace SsoClient::Access::Testing {

using Tarnik::Testing::Identity;

inline constexpr const char* kIssuer = "https://sts.example";

/// "CN=sts-0" and so on, issued by `TrustCa`; made once.
const Identity& Sts(std::size_t number);
const Identity& TrustCa();
/// Has the name of `TrustCa`, but another key.
const Identity& StrangeCa();

/// Sees the records of a store.
struct RecordingTrustListener final : TrustListener {
  void OnTrustReplaced(const TrustRecord& record) override { replaced.push_back(record); }
  void OnTrustKept(const TrustRecord& record) override { kept.push_back(record); }

  std::vector<TrustRecord> replaced;
  std::vector<TrustRecord> kept;
};

using Names = std::vector<std::string>;

/// The subjects of those who may sign tokens of `issuer`.
Names SignersOf(const TrustSnapshot& trust, const std::string& issuer = kIssuer);

/// What `action` throws as an `E`; "nothing" if it throws nothing.
template <class E, class Action>
std::string MessageOf(const Action& action) {
  try {
    action();
  } catch (const E& error) {
    return error.Message();
  }
  return "nothing";
}

/// During its lifetime this process can open no descriptor.
class DescriptorShortage {
 public:
  /// UndefinedBehaviorSanitizer needs descriptors to check the types of exceptions.
#ifdef __SANITIZE_ADDRESS__
  static constexpr bool kIsPossible = false;
#else
  static constexpr bool kIsPossible = true;
#endif

  DescriptorShortage();
  ~DescriptorShortage() {
    setrlimit(RLIMIT_NOFILE, &before_);
  }
  DescriptorShortage(const DescriptorShortage&) = delete;
  DescriptorShortage& operator=(const DescriptorShortage&) = delete;

 private:
  rlimit before_{};
};

/// A store of the folder "trust" below a temporary one, with virtual time.
class TrustFixture : public ::testing::Test {
 protected:
  TrustFixture();

  /// Renames a complete file to this path below `root`.
  std::string Put(const std::string& name, const std::string& content) const;
  std::string PathOf(const std::string& name) const { return root.Path() + "/" + name; }
  void Remove(const std::string& name) const;
  void Rename(const std::string& from, const std::string& to) const;

  void Make() { store = CreateTrustStore(config, runtime); }
  Names Signers(const std::string& issuer = kIssuer) const {
    return SignersOf(*store->Current(), issuer);
  }
  /// Lets the time pass in which a change must have been seen.
  void Wait() const { runtime->Advance(std::chrono::seconds(1)); }
  /// `failure` of the description, without the path of `root`.
  std::string Failure() const;
  /// The same of a text.
  std::string WithoutRoot(std::string text) const;

  Tarnik::Testing::TemporaryFolder root;
  const std::shared_ptr<VirtualRuntime> runtime = std::make_shared<VirtualRuntime>();
  const std::shared_ptr<RecordingTrustListener> listener =
      std::make_shared<RecordingTrustListener>();
  TrustStoreConfig config;
  std::shared_ptr<TrustStoreImpl> store;
};

}  // namespace SsoClient::Access::Testing

#endif
