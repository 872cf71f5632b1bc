// The parts of SPNEGO messages that the service reads itself, and its safety against malformed
// ones.
#include "kerberos/spnego_token.h"

#include <cstddef>
#include <functional>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace DevSts::Testing {
namespace {

using testing::IsEmpty;

const Octets kMechTypes = {0x30, 0x0d, 0x06, 0x09, 0x2a, 0x86, 0x48, 0x86,
                           0xf7, 0x12, 0x01, 0x02, 0x02, 0x06, 0x00};
const Octets kMic = {1, 2, 3};

// One element of DER (X.690) with a content of less than 128 bytes.
Octets Element(unsigned char tag, const Octets& content) {
  Octets whole{tag, static_cast<unsigned char>(content.size())};
  whole.insert(whole.end(), content.begin(), content.end());
  return whole;
}

Octets Joined(Octets left, const Octets& right) {
  left.insert(left.end(), right.begin(), right.end());
  return left;
}

// A NegTokenInit (RFC 4178, section 4.2.1) with a message of Kerberos.
Octets FirstLeg() {
  const Octets token = Element(0xa2, Element(0x04, {0xde, 0xad}));
  const Octets fields = Joined(Element(0xa0, kMechTypes), token);
  return Element(0x60, Joined({0x06, 0x06, 0x2b, 0x06, 0x01, 0x05, 0x05, 0x02},
                              Element(0xa0, Element(0x30, fields))));
}

// A NegTokenResp (RFC 4178, section 4.2.2) that accepts.
Octets Answer(const Octets& more = {}) {
  const Octets fields = Joined(Element(0xa0, {0x0a, 0x01, 0x00}), Element(0xa2, {0x04, 0x01, 9}));
  return Element(0xa1, Element(0x30, Joined(fields, more)));
}

TEST(SpnegoTokenTest, FindsTheMechanismsOfAFirstLeg) {
  EXPECT_EQ(MechTypesIn(FirstLeg()), kMechTypes);
}

TEST(SpnegoTokenTest, FindsTheMicThatItAdds) {
  EXPECT_THAT(MicIn(Answer()), IsEmpty());
  const Octets answer = WithMic(Answer(), NegState::AcceptIncomplete, kMic);
  EXPECT_EQ(MicIn(answer), kMic);
  // The state is replaced, and the fields after it are unchanged.
  EXPECT_EQ(answer, Element(0xa1, Element(0x30, Joined(Joined(Element(0xa0, {0x0a, 0x01, 0x01}),
                                                              Element(0xa2, {0x04, 0x01, 9})),
                                                       Element(0xa3, Element(0x04, kMic))))));
}

TEST(SpnegoTokenTest, ReadsTheLongLengthsThatItWrites) {
  for (const std::size_t size : {0x7fU, 0x80U, 0xffU, 0x100U, 0x1000U}) {
    const Octets mic(size, 7);
    EXPECT_EQ(MicIn(WithMic(Answer(), NegState::AcceptIncomplete, mic)), mic) << size;
  }
}

using Reader = std::function<void(const Octets&)>;

// Passes memory of exactly the message's size, so that sanitizers detect a read past its end.
bool IsRefused(const Octets& octets, const Reader& reader) {
  const Octets exact(octets.begin(), octets.end());
  try {
    reader(exact);
    return false;
  } catch (const SpnegoError&) {
    return true;
  }
}

const Reader kReaders[] = {
    [](const Octets& leg) { MechTypesIn(leg); }, [](const Octets& answer) { MicIn(answer); },
    [](const Octets& answer) { WithMic(answer, NegState::AcceptIncomplete, kMic); }};

TEST(SpnegoTokenTest, RefusesAMessageCutAtAnyByte) {
  for (const Octets& whole : {FirstLeg(), Answer(Element(0xa3, Element(0x04, kMic)))}) {
    for (std::size_t size = 0; size < whole.size(); ++size) {
      for (const auto& reader : kReaders) {
        const auto end = whole.begin() + static_cast<std::ptrdiff_t>(size);
        EXPECT_TRUE(IsRefused(Octets(whole.begin(), end), reader)) << size;
      }
    }
  }
}

TEST(SpnegoTokenTest, SurvivesAnyByteAtAnyPosition) {
  std::size_t refusals = 0;
  for (const Octets& whole : {FirstLeg(), Answer(Element(0xa3, Element(0x04, kMic)))}) {
    for (std::size_t place = 0; place < whole.size(); ++place) {
      for (unsigned value = 0; value < 0x100; ++value) {
        Octets changed = whole;
        changed[place] = static_cast<unsigned char>(value);
        for (const auto& reader : kReaders) {
          refusals += IsRefused(changed, reader) ? 1 : 0;
        }
      }
    }
  }
  EXPECT_GT(refusals, 0U);
}

TEST(SpnegoTokenTest, RefusesLengthsThatItCannotHold) {
  for (const Octets& length :
       {Octets{0x80}, Octets{0x84, 0xff, 0xff, 0xff, 0xff}, Octets{0x85, 0, 0, 0, 0, 1},
        Octets{0xff}, Octets{0x82, 0xff}, Octets{0x84, 0x80, 0, 0, 0}}) {
    for (const unsigned char tag : {0x60, 0xa1}) {
      for (const auto& reader : kReaders) {
        EXPECT_TRUE(IsRefused(Joined({tag}, Joined(length, Octets(40, 0))), reader));
      }
    }
  }
}

}  // namespace
}  // namespace DevSts::Testing
