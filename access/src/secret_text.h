#ifndef SSOCLIENT_ACCESS_SECRET_TEXT_H
#define SSOCLIENT_ACCESS_SECRET_TEXT_H

#include <string>
#include <string_view>

namespace SsoClient::Access {

/// Returns `text`, which a service has a part in, with three asterisks in place of each occurrence
/// of `secret`; with three of another character if the secret contains an asterisk. An occurrence
/// is also one whose characters are escaped as in XML (1.0, section 4.1), several times over, one
/// whose control characters and blanks are replaced, and four or more bytes of the secret's
/// beginning at the end of the text, which may be cut. A long text may be cut itself: what is left
/// out begins after the first 4096 bytes. Returns the text as it is for an empty secret.
std::string HideSecret(std::string text, std::string_view secret);

/// `text` for records: without control characters, and at most 1000 bytes long.
std::string ToRecordText(std::string_view text);

}  // namespace SsoClient::Access

#endif
