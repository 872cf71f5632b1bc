#include "crypto/attribute_types.h"

#include <algorithm>
#include <cstddef>
#include <iterator>

#include <openssl/objects.h>

#include "crypto/object_identifier.h"
#include "support/ascii.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

struct NamedType {
  std::string_view name;
  int number;  // OpenSSL's
};

// The names of RFC 4514, section 3, RFC 1779 and RFC 4519, and those that Java and .NET write. `SN`
// is a surname (RFC 4519, section 2.32), also in .NET.
constexpr NamedType kNamedTypes[] = {
    {"CN", NID_commonName},
    {"commonName", NID_commonName},
    {"L", NID_localityName},
    {"localityName", NID_localityName},
    {"ST", NID_stateOrProvinceName},
    {"S", NID_stateOrProvinceName},
    {"stateOrProvinceName", NID_stateOrProvinceName},
    {"O", NID_organizationName},
    {"organizationName", NID_organizationName},
    {"OU", NID_organizationalUnitName},
    {"organizationalUnitName", NID_organizationalUnitName},
    {"C", NID_countryName},
    {"countryName", NID_countryName},
    {"STREET", NID_streetAddress},
    {"streetAddress", NID_streetAddress},
    {"DC", NID_domainComponent},
    {"domainComponent", NID_domainComponent},
    {"UID", NID_userId},
    {"USERID", NID_userId},
    {"E", NID_pkcs9_emailAddress},
    {"EMAIL", NID_pkcs9_emailAddress},
    {"EMAILADDRESS", NID_pkcs9_emailAddress},
    {"mail", NID_rfc822Mailbox},
    {"SERIALNUMBER", NID_serialNumber},
    {"T", NID_title},
    {"TITLE", NID_title},
    {"SN", NID_surname},
    {"SURNAME", NID_surname},
    {"G", NID_givenName},
    {"GN", NID_givenName},
    {"GIVENNAME", NID_givenName},
    {"I", NID_initials},
    {"INITIALS", NID_initials},
    {"GENERATION", NID_generationQualifier},
    {"generationQualifier", NID_generationQualifier},
    {"DNQ", NID_dnQualifier},
    {"DNQUALIFIER", NID_dnQualifier},
    {"PSEUDONYM", NID_pseudonym},
    {"NAME", NID_name},
    {"DESCRIPTION", NID_description},
    {"BUSINESSCATEGORY", NID_businessCategory},
    {"POSTALCODE", NID_postalCode},
    {"POBOX", NID_postOfficeBox},
    {"postOfficeBox", NID_postOfficeBox},
    {"PHONE", NID_telephoneNumber},
    {"telephoneNumber", NID_telephoneNumber},
    {"houseIdentifier", NID_houseIdentifier},
    {"organizationIdentifier", NID_organizationIdentifier},
    {"x500UniqueIdentifier", NID_x500UniqueIdentifier},
};

constexpr std::string_view kIdentifierPrefix = "OID.";

int NumberOfType(std::string_view name) {
  const auto* const known =
      std::find_if(std::begin(kNamedTypes), std::end(kNamedTypes),
                   [name](const NamedType& type) { return EqualsIgnoringCase(type.name, name); });
  if (known != std::end(kNamedTypes)) {
    return known->number;
  }
  const std::string text(name);
  const int number = OBJ_sn2nid(text.c_str());
  return number != NID_undef ? number : OBJ_ln2nid(text.c_str());
}

}  // namespace

std::string AttributeTypeOf(std::string_view text) {
  const OpenSsl::ErrorScope errors;
  const bool hasPrefix =
      EqualsIgnoringCase(text.substr(0, kIdentifierPrefix.size()), kIdentifierPrefix);
  const std::string_view dotted = hasPrefix ? text.substr(kIdentifierPrefix.size()) : text;
  if (hasPrefix || IsDottedIdentifier(dotted)) {
    return ObjectIdentifierOf(dotted);
  }
  const ASN1_OBJECT* const object = OBJ_nid2obj(NumberOfType(text));
  if (object == nullptr || OBJ_length(object) == 0) {
    return {};
  }
  return {reinterpret_cast<const char*>(OBJ_get0_data(object)), OBJ_length(object)};
}

}  // namespace Tarnik::Crypto
