#include "wire/wire_answer.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <utility>

#include <strings.h>

namespace DevSts {
namespace {

constexpr std::size_t kPaddingField = 1000;

HttpAnswer AsHttp(SoapReply reply, const Misbehavior& misbehavior) {
  if (misbehavior.httpAnswer) {
    return *misbehavior.httpAnswer;
  }
  if (misbehavior.editEnvelope) {
    misbehavior.editEnvelope(reply.envelope);
  }
  HttpAnswer answer;
  answer.status = reply.status;
  answer.reason = reply.status == 200 ? "OK" : "Internal Server Error";
  answer.headers = {{"Content-Type", "text/xml; charset=utf-8"}};
  for (const std::string& cookie : reply.setCookies) {
    answer.headers.emplace_back("Set-Cookie", cookie);
  }
  answer.body = std::move(reply.envelope);
  return answer;
}

bool HasField(const HttpAnswer& answer, const char* name) {
  return std::any_of(answer.headers.begin(), answer.headers.end(),
                     [&](const auto& field) { return strcasecmp(field.first.c_str(), name) == 0; });
}

// The preferred form of RFC 9110, section 5.6.7, in which the names do not depend on the locale.
std::string HttpDate(std::time_t time) {
  constexpr std::array<const char*, 7> kDays{"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
  constexpr std::array<const char*, 12> kMonths{"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                                "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
  std::tm fields{};
  gmtime_r(&time, &fields);
  std::array<char, 40> rest{};
  std::strftime(rest.data(), rest.size(), " %Y %H:%M:%S GMT", &fields);
  std::array<char, 16> day{};
  std::snprintf(day.data(), day.size(), "%s, %02d %s", kDays.at(fields.tm_wday), fields.tm_mday,
                kMonths.at(fields.tm_mon));
  return std::string(day.data()) + rest.data();
}

void AddFields(HttpAnswer& answer, const Misbehavior& misbehavior, bool closes) {
  for (const std::string& cookie : misbehavior.setCookies) {
    answer.headers.emplace_back("Set-Cookie", cookie);
  }
  answer.headers.insert(answer.headers.end(), misbehavior.extraHeaders.begin(),
                        misbehavior.extraHeaders.end());
  for (std::size_t done = 0; done < misbehavior.padHeaderBytes; done += kPaddingField) {
    const std::size_t size = std::min(kPaddingField, misbehavior.padHeaderBytes - done);
    answer.headers.emplace_back("X-Padding-" + std::to_string(done / kPaddingField),
                                std::string(size, 'p'));
  }
  if (closes && !misbehavior.closeUnannounced) {
    answer.headers.emplace_back("Connection", "close");
  }
}

std::string InChunks(const std::string& body, const std::vector<std::size_t>& sizes) {
  std::string chunks;
  std::size_t at = 0;
  for (std::size_t i = 0; at < body.size(); ++i) {
    const std::size_t wanted = std::max<std::size_t>(1, sizes[std::min(i, sizes.size() - 1)]);
    const std::size_t size = std::min(wanted, body.size() - at);
    std::array<char, 20> line{};
    std::snprintf(line.data(), line.size(), "%zx\r\n", size);
    chunks += line.data();
    chunks.append(body, at, size);
    chunks += "\r\n";
    at += size;
  }
  return chunks + "0\r\n\r\n";
}

void SetBody(HttpAnswer& answer, const Misbehavior& misbehavior) {
  answer.body.append(misbehavior.padBodyBytes, ' ');
  if (!misbehavior.chunkSizes.empty()) {
    answer.headers.emplace_back("Transfer-Encoding", "chunked");
    answer.body = InChunks(answer.body, misbehavior.chunkSizes);
    return;
  }
  if (!HasField(answer, "Content-Length") && !HasField(answer, "Transfer-Encoding")) {
    answer.headers.emplace_back("Content-Length", std::to_string(answer.body.size()));
  }
}

}  // namespace

WireAnswer MakeWireAnswer(SoapReply reply, const Misbehavior& misbehavior, bool keepAlive,
                          std::time_t now) {
  WireAnswer wire;
  wire.closes = !keepAlive || misbehavior.closeConnection || misbehavior.closeUnannounced;
  wire.octets = misbehavior.rawPrefix;
  if (misbehavior.rawAnswer) {
    wire.octets += *misbehavior.rawAnswer;
    const std::size_t end = wire.octets.find("\r\n\r\n");
    wire.headSize = end != std::string::npos ? end + 4 : wire.octets.size();
    return wire;
  }
  HttpAnswer answer = AsHttp(std::move(reply), misbehavior);
  AddFields(answer, misbehavior, wire.closes);
  if (!misbehavior.httpAnswer && !misbehavior.omitDate && !HasField(answer, "Date")) {
    answer.headers.emplace_back("Date", HttpDate(now));
  }
  SetBody(answer, misbehavior);
  wire.status = answer.status;
  wire.octets += "HTTP/1.1 " + std::to_string(answer.status) + " " + answer.reason + "\r\n";
  for (const auto& [name, value] : answer.headers) {
    wire.octets.append(name).append(": ").append(value).append("\r\n");
  }
  wire.octets += "\r\n";
  wire.headSize = wire.octets.size();
  wire.octets += answer.body;
  return wire;
}

}  // namespace DevSts
