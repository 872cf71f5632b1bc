#ifndef SSOCLIENT_TOKEN_PRINCIPAL_PARSER_H
#define SSOCLIENT_TOKEN_PRINCIPAL_PARSER_H

#include <string_view>

#include <ssoclient/principal_id.h>

namespace SsoClient {

/// The principal of a name id of the user-principal-name format, "name@domain"; the last at sign
/// separates. Throws `ParseException` for another format or an empty or missing part.
PrincipalId PrincipalFromNameId(std::string_view format, std::string_view value);

/// The group that "domain\group" names; the first backslash separates. Throws `ParseException` for
/// an empty or missing part.
PrincipalId PrincipalFromGroupIdentity(std::string_view value);

}  // namespace SsoClient

#endif
