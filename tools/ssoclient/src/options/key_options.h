#ifndef SSOCLIENT_TOOL_OPTIONS_KEY_OPTIONS_H
#define SSOCLIENT_TOOL_OPTIONS_KEY_OPTIONS_H

#include <string>

#include <ssoclient/holder_of_key_config.h>

#include "input/secret.h"
#include "input/standard_input.h"

namespace CLI {
class App;
class Option;
}  // namespace CLI

namespace SsoClient::Tool {

/// The key of the user and its certificate.
class KeyOptions {
 public:
  /// Adds --certificate, --key, --passphrase-file and --passphrase-fd to the command, and returns
  /// the first. The object must live as long as the command.
  CLI::Option* AddTo(CLI::App& command, bool isRequired);

  bool IsGiven() const { return !certificate_.empty() || !key_.empty(); }

  /// The passphrase, if it comes from a descriptor.
  Input PassphraseInput() const { return {"--passphrase-fd", passphrase_.IsStandardInput()}; }

  /// The file of --certificate.
  const std::string& CertificateFile() const { return certificate_; }
  /// The file that contains the key: that of --key, or else of --certificate. Empty if the key has
  /// a URI.
  std::string KeyFile() const;

  /// The key and its certificate: from a PKCS#12 file, from a PEM file that has both, or from a
  /// certificate file and a key, which is in a PEM or PKCS#12 file or has a URI. Asks for a
  /// passphrase if one is needed. Throws `ToolException` when a file cannot be read, when one that
  /// contains a key can be read by others, unless `mayBeOpen`, when the key or the certificate is
  /// missing or not usable, and when they do not belong together.
  HolderOfKeyConfig Load(bool mayBeOpen) const;

 private:
  HolderOfKeyConfig LoadPair(bool mayBeOpen) const;
  HolderOfKeyConfig LoadFile(const std::string& path, bool mayBeOpen) const;
  Tarnik::Ref<const Tarnik::Crypto::PrivateKey> LoadKey(bool mayBeOpen) const;
  Tarnik::Crypto::PassphraseCallback AskPassphrase(const std::string& of, bool mayBeOpen) const;

  std::string certificate_;
  std::string key_;
  SecretOption passphrase_;
};

}  // namespace SsoClient::Tool

#endif
