#ifndef SSOCLIENT_TOOL_OUTPUT_BAR_H
#define SSOCLIENT_TOOL_OUTPUT_BAR_H

#include <cstddef>
#include <string>

namespace SsoClient::Tool {

/// A bar of `width` columns, at least 8, from the start to the end of a period, with a marker at
/// the moment that is `position` of the period after its start. Before the start (negative) and at
/// or after the end (1 and more) the marker is outside of the bar. Of ASCII unless `isUtf8`.
std::string PeriodBar(double position, std::size_t width, bool isUtf8);

}  // namespace SsoClient::Tool

#endif
