#ifndef SSOCLIENT_TOOL_TOKEN_REMEDY_H
#define SSOCLIENT_TOOL_TOKEN_REMEDY_H

#include <string>

#include <tarnik/core/exception.h>

namespace SsoClient::Tool {

/// What to do about a token whose signature has an algorithm that is not supported.
inline constexpr const char* kAlgorithmRemedy =
    "let the service sign its tokens with a supported algorithm, such as rsa-sha256";

/// Whether a token was not accepted because of an algorithm of its signature.
bool IsAlgorithmUnsupported(const Tarnik::Exception& failure) noexcept;

/// What to do about a token of the service that was not accepted, by the reason.
std::string TokenRemedy(const Tarnik::Exception& failure);

}  // namespace SsoClient::Tool

#endif
