#ifndef SSOCLIENT_TESTS_SUPPORT_FORGERIES_H
#define SSOCLIENT_TESTS_SUPPORT_FORGERIES_H

#include <string>
#include <vector>

namespace SsoClient::Testing {

enum class ForgedId { kSame, kNew, kNone };
enum class ForgedSignature { kOriginal, kStranger, kUnsigned, kMadeUp };

/// The arrangement of the forged assertion and the signed original: with "parent" the forged one
/// contains the original, with "child" the original contains the forged one.
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

/// An assertion about alice, signed by the trusted credential with its certificate in KeyInfo.
std::string OriginalAssertion();
/// The first ds:Signature in a signed assertion.
std::string SignatureOf(const std::string& assertion);
/// An assertion about admin.
std::string ForgedAssertion(ForgedId id, ForgedSignature signature, const std::string& original);
/// A document with both, or "" if this arrangement is impossible because an unsigned forgery has no
/// signature to hide the original in.
std::string Arranged(Place place, const std::string& forged, const std::string& original);

}  // namespace SsoClient::Testing

#endif
