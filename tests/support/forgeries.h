#ifndef SSOCLIENT_TESTS_SUPPORT_FORGERIES_H
#define SSOCLIENT_TESTS_SUPPORT_FORGERIES_H

#include <string>
#include <vector>

namespace SsoClient::Testing {

enum class ForgedId { kSame, kNew, kNone };
enum class ForgedSignature { kOriginal, kStranger, kUnsigned, kMadeUp };

/// Where the forged assertion and the signed original stand, one to the other: "parent" is the
/// forged one around the original, "child" the forged one inside of it.
enum class Place {
  kBefore,
  kAfter,
  kParentInObject,
  kParentInObjectWithoutSignature,
  kParentInKeyInfo,
  kParentInAdvice,
  kParentInAttributeValue,
  kParentAtEnd,
  kChildInObject,
  kChildInKeyInfo,
  kChildInX509Data,
  kChildInAdvice,
  kChildInAttributeValue,
  kChildAtEnd,
  kOriginalInSoapHeader,
  kForgedInSoapHeader,
};

const std::vector<Place>& AllPlaces();
const std::vector<ForgedId>& AllForgedIds();
const std::vector<ForgedSignature>& AllForgedSignatures();

/// An assertion of alice's, signed by the trusted credential with its certificate in KeyInfo.
std::string OriginalAssertion();
/// The ds:Signature of a signed assertion, its own or the first in it.
std::string SignatureOf(const std::string& assertion);
/// An assertion of admin's.
std::string ForgedAssertion(ForgedId id, ForgedSignature signature, const std::string& original);
/// A document with both, or "" when they cannot stand so: an unsigned forgery has no signature to
/// hide the original in.
std::string Arranged(Place place, const std::string& forged, const std::string& original);

}  // namespace SsoClient::Testing

#endif
