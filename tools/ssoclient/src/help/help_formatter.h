#ifndef SSOCLIENT_TOOL_HELP_HELP_FORMATTER_H
#define SSOCLIENT_TOOL_HELP_HELP_FORMATTER_H

#include <string>

#include <CLI/CLI.hpp>

namespace SsoClient::Tool {

/// The help of the program and of its commands, in lines of at most 80 columns. The man pages and
/// the completion of the shell are made from it, so its form is fixed: headings end in a colon,
/// options are indented by two columns and their texts by 28.
///
/// A command's help starts with its footer, as the example, and the first line of its description
/// is its summary. The parts use only what all supported versions of the command line library have.
class HelpFormatter final : public CLI::Formatter {
 public:
  std::string make_help(const CLI::App* app, std::string name,
                        CLI::AppFormatMode mode) const override;
};

}  // namespace SsoClient::Tool

#endif
