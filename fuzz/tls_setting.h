#ifndef FUZZ_TLS_SETTING_H
#define FUZZ_TLS_SETTING_H

#include <string>

#include <fuzzer/FuzzedDataProvider.h>

#include <tarnik/core/ref.h>
#include <tarnik/ssl/ssl_context.h>

#include "support/openssl.h"

namespace Fuzz {

/// How the two sides of a TLS connection are set up, as the input says: mostly so that they accept
/// each other.
class TlsSetting {
 public:
  explicit TlsSetting(FuzzedDataProvider& input);

  Tarnik::OpenSsl::OwnedSslContext ServerContext() const;
  /// Null if its files or keys are refused.
  Tarnik::Ref<Tarnik::Ssl::SSLContext> ClientContext() const;
  /// Whether they must be refused.
  bool HasBrokenFile() const { return trust_ >= Trust::kEmptyFile; }

  bool IsTls13() const { return isTls13_; }
  /// The name that the client expects.
  std::string Host() const;
  /// Whether the client must accept the server.
  bool IsServerAcceptable() const;
  /// Whether both must accept each other.
  bool IsAcceptable() const;

 private:
  enum class Trust {
    kMemory,
    kFile,
    kFolder,
    kSystem,
    kEmptyFile,
    kNoFile,
    kBrokenList,
    kOtherKey
  };
  enum class Chain { kDirect, kWithIntermediate, kWithoutIntermediate, kStranger };
  enum class Lists { kNone, kClean, kRevoking, kOfOthers, kOutdated, kBoth };
  enum class Pin { kNone, kServer, kOther };
  enum class Name { kHost, kAddress, kLongAddress, kOtherHost, kOtherAddress };

  void AddTrust(Tarnik::Ssl::SSLContextConfig& config) const;
  void AddLists(Tarnik::Ssl::SSLContextConfig& config) const;

  bool isTls13_;
  Trust trust_;
  Chain chain_;
  Lists lists_;
  Pin pin_;
  Name name_;
  bool asksForCertificate_;
  bool hasCertificate_;
};

}  // namespace Fuzz

#endif
