#include "xml/security/digest_writer.h"

#include <cstddef>
#include <string>

#include <gtest/gtest.h>

#include "support/algorithm_uris.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;

std::string Hex(const Digest& digest) {
  static constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  for (std::size_t i = 0; i < digest.length; ++i) {
    text.push_back(kDigits[digest.bytes[i] >> 4]);
    text.push_back(kDigits[digest.bytes[i] & 15]);
  }
  return text;
}

// The message "abc" is the example of FIPS 180-4.
TEST(DigestWriterTest, HashesWhatIsWritten) {
  DigestWriter writer;
  writer.Start(Crypto::Hash::kSha256);
  writer.Write("a");
  writer.Write("");
  writer.Write("bc");
  EXPECT_EQ(Hex(writer.Finish()),
            "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad");
  writer.Start(Crypto::Hash::kSha384);
  writer.Write("abc");
  EXPECT_EQ(Hex(writer.Finish()),
            "cb00753f45a35e8bb5a03d699ac65007272c32ab0eded1631a8b605a43ff5bed"
            "8086072ba1e7cc2358baeca134c825a7");
  writer.Start(Crypto::Hash::kSha512);
  writer.Write("abc");
  EXPECT_EQ(Hex(writer.Finish()),
            "ddaf35a193617abacc417349ae20413112e6fa4e89a97ea20a9eeee64b55d39a"
            "2192992a274fc1a836ba3c23a3feebbd454d4423643ce80e2a9ac94fa54ca49f");
}

TEST(DigestWriterTest, DiscardsADigestThatWasNotFinished) {
  DigestWriter writer;
  writer.Start(Crypto::Hash::kSha256);
  writer.Write("left over");
  writer.Start(Crypto::Hash::kSha256);
  EXPECT_EQ(Hex(writer.Finish()),
            "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855");
}

}  // namespace
}  // namespace Tarnik::Testing
