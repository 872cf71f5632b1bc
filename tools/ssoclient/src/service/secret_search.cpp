#include "service/secret_search.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <utility>

#include <tarnik/text/string_util.h>

namespace SsoClient::Tool {
namespace {

constexpr int kMaxEscapings = 4;
constexpr std::size_t kLongestReference = 10;
constexpr std::size_t kShortestPart = 4;
constexpr std::string_view kEllipsis = "...";

void AppendUtf8(std::string& text, std::uint32_t code) {
  const auto add = [&text](std::uint32_t byte) { text.push_back(static_cast<char>(byte)); };
  if (code < 0x80) {
    add(code);
    return;
  }
  if (code < 0x800) {
    add(0xC0 | (code >> 6U));
  } else {
    if (code < 0x10000) {
      add(0xE0 | (code >> 12U));
    } else {
      add(0xF0 | (code >> 18U));
      add(0x80 | ((code >> 12U) & 0x3FU));
    }
    add(0x80 | ((code >> 6U) & 0x3FU));
  }
  add(0x80 | (code & 0x3FU));
}

// The code of a reference such as "#x3c" or "lt", without the ampersand and the semicolon.
std::optional<std::uint32_t> CodeOf(std::string_view name) {
  constexpr std::array<std::pair<std::string_view, char>, 5> kNamed{
      {{"amp", '&'}, {"lt", '<'}, {"gt", '>'}, {"quot", '"'}, {"apos", '\''}}};
  for (const auto& [known, character] : kNamed) {
    if (name == known) {
      return static_cast<std::uint32_t>(character);
    }
  }
  if (!name.starts_with('#')) {
    return std::nullopt;
  }
  const bool isHex = name.starts_with("#x");
  name.remove_prefix(isHex ? 2 : 1);
  std::uint32_t code = 0;
  const auto [end, error] =
      std::from_chars(name.data(), name.data() + name.size(), code, isHex ? 16 : 10);
  const bool isNumber = error == std::errc() && end == name.data() + name.size();
  return isNumber ? std::optional(code) : std::nullopt;
}

// `text` with its references replaced once. It is not longer than `text`.
std::string Unescaped(std::string_view text) {
  std::string result;
  result.reserve(text.size());
  while (!text.empty()) {
    const std::string_view start = text.substr(0, kLongestReference + 1);
    const std::size_t end = text.front() == '&' ? start.find(';') : std::string_view::npos;
    const auto code =
        end == std::string_view::npos ? std::nullopt : CodeOf(text.substr(1, end - 1));
    if (code) {
      AppendUtf8(result, *code);
      text.remove_prefix(end + 1);
    } else {
      result.push_back(text.front());
      text.remove_prefix(1);
    }
  }
  return result;
}

// Without what may have been replaced for display.
std::string Essence(std::string_view text) {
  std::string result;
  result.reserve(text.size());
  std::copy_if(text.begin(), text.end(), std::back_inserter(result), [](char each) {
    const auto byte = static_cast<unsigned char>(each);
    return byte > ' ' && byte != 0x7F && each != '?';
  });
  return result;
}

bool EndsWithPart(std::string_view text, std::string_view secret) {
  if (text.ends_with(kEllipsis)) {
    text.remove_suffix(kEllipsis.size());
  }
  for (std::size_t size = kShortestPart; size < secret.size(); ++size) {
    if (text.ends_with(secret.substr(0, size))) {
      return true;
    }
  }
  return false;
}

}  // namespace

bool ContainsSecret(std::string_view text, std::string_view secret) {
  std::string wanted = Essence(secret);
  std::string searched(text);
  bool isFound = false;
  for (int i = 0; i <= kMaxEscapings && !isFound && !secret.empty(); ++i) {
    std::string essence = Essence(searched);
    // A secret of nothing but such characters could be anywhere.
    isFound = searched.find(secret) != std::string::npos || wanted.empty() ||
              essence.find(wanted) != std::string::npos || EndsWithPart(essence, wanted);
    Tarnik::StringUtil::Cleanse(essence);
    std::string next = Unescaped(searched);
    searched.swap(next);
    Tarnik::StringUtil::Cleanse(next);
  }
  Tarnik::StringUtil::Cleanse(searched);
  Tarnik::StringUtil::Cleanse(wanted);
  return isFound;
}

}  // namespace SsoClient::Tool
