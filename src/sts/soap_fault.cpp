#include "sts/soap_fault.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <string>
#include <string_view>

#include <ssoclient/exceptions.h>
#include <tarnik/text/display_text.h>

#include "sts/logger.h"
#include "support/namespaces.h"
#include "support/qname.h"
#include "support/xml_documents.h"
#include "xml/ws_trust_names.h"

namespace SsoClient {

namespace {

struct FaultCode {
  std::string_view namespaceUri;
  std::string_view localName;

  bool Matches(const QName& name) const {
    return name.namespaceUri == namespaceUri && name.localName == localName;
  }
};

constexpr FaultCode kFailedAuthentication = {kWsTrust13.namespaceUri, "FailedAuthentication"};
constexpr std::array kRejectedCredentials = {
    kFailedAuthentication,
    FaultCode{kWsTrust13.namespaceUri, "InvalidSecurityToken"},
    FaultCode{kWsseNamespace, "InvalidSecurityToken"},
};
// Also sent for other faults of the security header.
constexpr std::array kRefusedTimestamp = {
    FaultCode{kWsuNamespace, "MessageExpired"},
    FaultCode{kWsseNamespace, "MessageExpired"},
    FaultCode{kWsseNamespace, "InvalidSecurity"},
};

constexpr std::string_view kPasswordExpired = "Password of the user logging on is expired";
constexpr std::size_t kMaxLoggedText = 1000;
constexpr char kAuthenticationFailed[] = "Authentication failed";

template <std::size_t size>
bool IsOneOf(const std::array<FaultCode, size>& codes, const QName& code) {
  return std::any_of(codes.begin(), codes.end(),
                     [&code](const FaultCode& known) { return known.Matches(code); });
}

// The exception's message has only the code, but operators need the explanation: which clock is
// wrong.
void LogRefusedTimestamp(const QName& code, std::string_view codeText,
                         std::string_view faultString) {
  if (!IsOneOf(kRefusedTimestamp, code) || faultString.empty() ||
      !kLogger.IsEnabled(kWarningLevel)) {
    return;
  }
  Tarnik::Service::LogInternal(kLogger, kWarningLevel, "The service answered with fault `%1': %2",
                               {Tarnik::ToDisplayText(codeText, kMaxLoggedText),
                                Tarnik::ToDisplayText(faultString, kMaxLoggedText)});
}

[[noreturn]] void ThrowFault(const QName& code, std::string_view codeText,
                             std::string_view faultString) {
  if (!IsOneOf(kRejectedCredentials, code)) {
    LogRefusedTimestamp(code, codeText, faultString);
    throw SsoException("Unexpected SOAP fault: " + std::string(codeText) + "; request failed.");
  }
  if (kFailedAuthentication.Matches(code) && faultString.starts_with(kPasswordExpired)) {
    throw PasswordExpiredException(std::string(kAuthenticationFailed) + ": " +
                                   std::string(faultString));
  }
  if (faultString.empty()) {
    throw InvalidCredentialsException(kAuthenticationFailed);
  }
  throw InvalidCredentialsException(std::string(kAuthenticationFailed) + ": " +
                                    std::string(faultString));
}

}  // namespace

void CheckSoapFault(const Tarnik::Xml::ElementNode& envelope) {
  const auto* fault = FindDescendant(envelope, {"Body", "Fault"});
  if (fault == nullptr) {
    return;
  }
  const auto* faultCode = fault->FirstChildElement("faultcode");
  const auto* codeText = FirstTextChild(faultCode);
  if (codeText == nullptr) {
    throw SsoException("Invalid SOAP response: missing faultcode.");
  }
  const QName code = ResolveQName(*faultCode, codeText->Text(), kSoapNamespace);
  ThrowFault(code, codeText->Text(), ElementText(fault->FirstChildElement("faultstring")));
}

}  // namespace SsoClient
