#ifndef FUZZ_CLIENT_CASE_H
#define FUZZ_CLIENT_CASE_H

#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/ssl/ssl_context.h>

#include "support/temporary_file.h"
#include "words.h"

namespace Fuzz {

/// How a TLS client is set up, as the lines of an input say, and what a model expects of it. The
/// model is written from what ssl_context.h documents. Each line is one of these; others are
/// skipped:
///   ca-file PART...     a file of CA certificates; or one of @missing, @folder, @empty, @nul, der
///   ca-folder PART...   a folder of them, and of lists; or one of @missing, @file, @empty, @nul
///   crl-file PART...    a file of revocation lists, as ca-file
///   ca NAME...          CA certificates in memory; "null" is a null reference
///   pin NAME...         pinned certificates
///   client NAME, key NAME, chain NAME...   the client's identity; the key may be "foreign"
class ClientCase {
 public:
  /// Takes a line; false if it is for somebody else.
  bool Take(const Words& line);

  const Tarnik::Ssl::SSLContextConfig& Config() const { return config_; }
  /// Whether the setting has a fault, so that no context is made of it.
  bool IsRefused() const;
  /// Whether a failure describes one of the faults.
  bool Explains(bool isArgument, const std::string& message) const;
  /// Whether the chain of `server`, sent with its intermediate certificate or without, is trusted.
  bool Trusts(const std::string& server, bool isChainSent) const;
  /// The certificates that the client presents, itself first.
  std::vector<std::string> Presented() const;

 private:
  struct Fault {
    bool isArgument;
    std::string text;
  };

  void AddFile(const Words& parts, bool isForLists);
  void AddFolder(const Words& parts);
  void AddCertificates(const Words& names, const char* nullText,
                       std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>>& certificates,
                       std::set<std::string>& known);
  void SetClient(const std::string& name);
  void SetKey(const std::string& name);
  void AddFault(bool isArgument, std::string text);
  std::vector<Fault> IdentityFaults() const;
  bool IsUnrevoked(const std::string& server) const;
  std::string Keep(const std::string& content);

  Tarnik::Ssl::SSLContextConfig config_;
  std::vector<Fault> faults_;
  std::set<std::string> trusted_;
  std::set<std::string> lists_;
  std::set<std::string> pinned_;
  std::string client_;
  std::string key_;
  Words chain_;
  std::vector<std::unique_ptr<Tarnik::Testing::TemporaryFile>> files_;
  std::vector<std::unique_ptr<Tarnik::Testing::TemporaryFolder>> folders_;
};

}  // namespace Fuzz

#endif
