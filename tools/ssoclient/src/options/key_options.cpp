#include "options/key_options.h"

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <string_view>

#include <CLI/CLI.hpp>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>

#include "failure.h"
#include "input/private_file.h"

namespace SsoClient::Tool {
namespace {

constexpr std::size_t kMaxFileBytes = std::size_t{1024} * 1024;

// The label of each form of a private key in PEM ends like this (RFC 7468, sections 10 and 11).
constexpr std::string_view kPrivateKeyLabel = "PRIVATE KEY-----";

bool HasPrivateKeyBlock(std::string_view content) {
  return content.find(kPrivateKeyLabel) != std::string_view::npos;
}

// PFX begins with its version, which is 3 (RFC 7292, section 4); a certificate does not begin with
// a number (RFC 5280, section 4.1).
bool IsPkcs12(std::string_view content) {
  constexpr char kSequence = '\x30';
  constexpr std::string_view kVersion("\x02\x01\x03", 3);
  constexpr unsigned kLongForm = 0x80;
  if (content.size() < 2 || content[0] != kSequence) {
    return false;
  }
  const auto length = static_cast<unsigned char>(content[1]);
  const std::size_t lengthBytes = (length & kLongForm) != 0 ? length & ~kLongForm : 0;
  return content.substr(std::min(2 + lengthBytes, content.size())).starts_with(kVersion);
}

// Certificates are public.
bool HasNoKey(std::string_view content) {
  return !HasPrivateKeyBlock(content) && !IsPkcs12(content);
}

SecretText ReadKeyFile(const std::string& path, bool mayBeOpen) {
  return ReadPrivateFile({.path = path,
                          .what = "key",
                          .maxBytes = kMaxFileBytes,
                          .isPublic = HasNoKey,
                          .mayBeOpen = mayBeOpen});
}

// Whether it begins with a scheme (RFC 3986, section 3.1). A file of such a name is "./a:b".
bool IsUri(const std::string& text) {
  const std::size_t colon = text.find(':');
  const auto isSchemeCharacter = [](unsigned char each) {
    return std::isalnum(each) != 0 || each == '+' || each == '-' || each == '.';
  };
  return colon != std::string::npos && colon > 0 &&
         std::isalpha(static_cast<unsigned char>(text[0])) != 0 &&
         std::all_of(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(colon),
                     isSchemeCharacter);
}

// Without regard to case. `what` is in lower case.
bool ContainsText(std::string_view text, std::string_view what) {
  return std::search(text.begin(), text.end(), what.begin(), what.end(),
                     [](unsigned char a, unsigned char b) { return std::tolower(a) == b; }) !=
         text.end();
}

// OpenSSL would read the file of a "file:" URI itself, whoever can read or change it. The PIN in a
// URI (RFC 7512, section 2.4) would be a secret among the arguments.
std::string CheckKey(const std::string& key) {
  constexpr std::string_view kFileScheme = "file:";
  if (ContainsText(std::string_view(key).substr(0, kFileScheme.size()), kFileScheme)) {
    return "name a file by its path, not by a URI";
  }
  return IsUri(key) && ContainsText(key, "pin-value")
             ? "it must not contain the PIN, which is the passphrase: see --passphrase-file"
             : std::string();
}

Tarnik::Crypto::KeyAndCertificate ReadPkcs12(const SecretText& content,
                                             const Tarnik::Crypto::PassphraseCallback& ask) {
  return Tarnik::Crypto::CreateKeyAndCertificateFromPkcs12(
      reinterpret_cast<const unsigned char*>(content.Text().data()), content.Text().size(), ask);
}

// The name of what failed is added, since the library's texts do not have it.
template <class Load>
auto Named(const std::string& name, const Load& load) {
  try {
    return load();
  } catch (const Tarnik::Exception& failure) {
    throw ToolException({ExitStatus::kLocal, "key", "cannot use " + name + ": " + failure.what(),
                         "check the files of --certificate and --key, and the passphrase"});
  }
}

}  // namespace

CLI::Option* KeyOptions::AddTo(CLI::App& command, bool isRequired) {
  const std::string group = "Key";
  CLI::Option* const certificate = command.add_option(
      "--certificate", certificate_,
      "The user's certificate, in PEM or DER; or a PKCS#12 or PEM file that contains the key, too");
  certificate->type_name("FILE")->required(isRequired)->group(group);
  command
      .add_option("--key", key_,
                  "The private key of the certificate: a PEM or PKCS#12 file, or a URI such as "
                  "pkcs11:object=me of a provider that OpenSSL is configured for")
      ->type_name("FILE|URI")
      ->check(CheckKey)
      ->needs(certificate)
      ->group(group);
  passphrase_.AddTo(command, "passphrase", group);
  return certificate;
}

std::string KeyOptions::KeyFile() const {
  if (key_.empty()) {
    return certificate_;
  }
  return IsUri(key_) ? std::string() : key_;
}

Tarnik::Crypto::PassphraseCallback KeyOptions::AskPassphrase(const std::string& of,
                                                             bool mayBeOpen) const {
  return [this, of, mayBeOpen] {
    // The library overwrites the copy.
    return passphrase_.Read("Passphrase for " + of + ": ", mayBeOpen).Text();
  };
}

HolderOfKeyConfig KeyOptions::LoadFile(const std::string& path, bool mayBeOpen) const {
  const SecretText content = ReadKeyFile(path, mayBeOpen);
  const auto ask = AskPassphrase(path, mayBeOpen);
  if (IsPkcs12(content.Text())) {
    const auto both = ReadPkcs12(content, ask);
    return {both.certificate, both.privateKey};
  }
  if (!HasPrivateKeyBlock(content.Text())) {
    throw ToolException({ExitStatus::kUsage, "no-key", path + " contains no private key",
                         "name the file or the URI of the key with --key"});
  }
  return {Tarnik::Crypto::CreateCertificatesFromPem(content.Text()).front(),
          Tarnik::Crypto::CreatePrivateKeyFromPem(content.Text(), ask)};
}

Tarnik::Ref<const Tarnik::Crypto::PrivateKey> KeyOptions::LoadKey(bool mayBeOpen) const {
  const auto ask = AskPassphrase(key_, mayBeOpen);
  if (IsUri(key_)) {
    return Tarnik::Crypto::LoadPrivateKeyFromUri(key_, ask);
  }
  const SecretText content = ReadKeyFile(key_, mayBeOpen);
  return IsPkcs12(content.Text()) ? ReadPkcs12(content, ask).privateKey
                                  : Tarnik::Crypto::CreatePrivateKeyFromPem(content.Text(), ask);
}

HolderOfKeyConfig KeyOptions::LoadPair(bool mayBeOpen) const {
  if (key_.empty()) {
    return Named(certificate_, [&] { return LoadFile(certificate_, mayBeOpen); });
  }
  HolderOfKeyConfig pair;
  pair.certificate = Named(certificate_, [&] {
    const SecretText content = ReadKeyFile(certificate_, mayBeOpen);
    return Tarnik::Crypto::CreateCertificatesFromPemOrDer(content.Text()).front();
  });
  pair.privateKey = Named(key_, [&] { return LoadKey(mayBeOpen); });
  return pair;
}

HolderOfKeyConfig KeyOptions::Load(bool mayBeOpen) const {
  HolderOfKeyConfig pair = LoadPair(mayBeOpen);
  const bool isPair =
      Named(certificate_, [&] { return pair.privateKey->Matches(*pair.certificate); });
  if (!isPair) {
    throw ToolException({ExitStatus::kLocal, "key-mismatch",
                         "the key " + key_ + " does not belong to the certificate " + certificate_,
                         ""});
  }
  return pair;
}

}  // namespace SsoClient::Tool
