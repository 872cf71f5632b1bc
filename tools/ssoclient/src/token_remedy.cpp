#include "token_remedy.h"

#include <array>
#include <string_view>

#include <ssoclient/exceptions.h>

namespace SsoClient::Tool {
namespace {

// How the client's text begins and continues for such a signature.
constexpr std::string_view kSignatureError = "Signature verification error. ";
constexpr std::array<std::string_view, 4> kAlgorithms{
    "The signature algorithm '", "The digest algorithm '", "The canonicalisation algorithm '",
    "The transform algorithm '"};

bool IsSignature(const Tarnik::Exception& failure) noexcept {
  return dynamic_cast<const InvalidSignatureException*>(&failure) != nullptr;
}

}  // namespace

bool IsAlgorithmUnsupported(const Tarnik::Exception& failure) noexcept {
  std::string_view text = failure.Message();
  if (!IsSignature(failure) || !text.starts_with(kSignatureError)) {
    return false;
  }
  text.remove_prefix(kSignatureError.size());
  for (const std::string_view algorithm : kAlgorithms) {
    if (text.starts_with(algorithm)) {
      return true;
    }
  }
  return false;
}

std::string TokenRemedy(const Tarnik::Exception& failure) {
  if (IsAlgorithmUnsupported(failure)) {
    return kAlgorithmRemedy;
  }
  return IsSignature(failure) ? "check the signing certificate of the service (--sts-certificate)"
                              : "compare the clocks, and look into the log of the service";
}

}  // namespace SsoClient::Tool
