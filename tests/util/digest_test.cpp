// The digests, compared with the vectors of their standards and with the openssl command.
#include "util/digest.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <memory>
#include <string>

#include "support/files.h"

namespace {

using Digest = void (*)(const Bytes&, Bytes&);

std::string HexDigest(Digest digest, const std::string& text) {
  Bytes out;
  digest(ToBytes(text), out);
  return Hex(out);
}

// The hexadecimal digest that `openssl dgst -NAME` prints for `bytes`, or "no answer".
std::string OpensslDigest(const std::string& name, const Bytes& bytes) {
  const DiskFile file(bytes);
  const std::string command = "openssl dgst -r -" + name + " " + file.path();
  const std::unique_ptr<FILE, int (*)(FILE*)> pipe(popen(command.c_str(), "r"), pclose);
  char hex[65] = {};
  if (pipe == nullptr || fscanf(pipe.get(), "%64[0-9a-f]", hex) != 1) return "no answer";
  return hex;
}

// RFC 1321, A.5.
TEST(Digest, Md5MatchesThePublishedVectors) {
  EXPECT_EQ("d41d8cd98f00b204e9800998ecf8427e", HexDigest(ComputeMD5Digest, ""));
  EXPECT_EQ("0cc175b9c0f1b6a831c399e269772661", HexDigest(ComputeMD5Digest, "a"));
  EXPECT_EQ("900150983cd24fb0d6963f7d28e17f72", HexDigest(ComputeMD5Digest, "abc"));
  EXPECT_EQ("f96b697d7cb7938d525a2f31aaf161d0", HexDigest(ComputeMD5Digest, "message digest"));
}

// FIPS 180-2, appendix A, and NIST's digest of an empty message.
TEST(Digest, Sha1MatchesThePublishedVectors) {
  EXPECT_EQ("da39a3ee5e6b4b0d3255bfef95601890afd80709", HexDigest(ComputeSHA1Digest, ""));
  EXPECT_EQ("a9993e364706816aba3e25717850c26c9cd0d89d", HexDigest(ComputeSHA1Digest, "abc"));
  EXPECT_EQ(
      "84983e441c3bd26ebaae4aa1f95129e5e54670f1",
      HexDigest(ComputeSHA1Digest, "abcdbcdecdefdefgefghfghighijhijkijkljklmklmnlmnomnopnopq"));
}

// FIPS 180-2, appendix B, and NIST's digest of an empty message.
TEST(Digest, Sha256MatchesThePublishedVectors) {
  EXPECT_EQ("e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855",
            HexDigest(ComputeSHA256Digest, ""));
  EXPECT_EQ("ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad",
            HexDigest(ComputeSHA256Digest, "abc"));
  EXPECT_EQ(
      "248d6a61d20638b8e5c026930c3e6039a33ce45964ff2167f6ecedd419db06c1",
      HexDigest(ComputeSHA256Digest, "abcdbcdecdefdefgefghfghighijhijkijkljklmklmnlmnomnopnopq"));
}

TEST(Digest, AgreesWithTheOpensslCommand) {
  Bytes bytes;
  for (uint32_t i = 0; i < 100003; ++i) bytes.push_back(static_cast<uint8_t>(i * i >> 3));
  const std::pair<const char*, Digest> digests[] = {
      {"md5", ComputeMD5Digest}, {"sha1", ComputeSHA1Digest}, {"sha256", ComputeSHA256Digest}};
  for (const auto& [name, digest] : digests) {
    Bytes out;
    digest(bytes, out);
    EXPECT_EQ(OpensslDigest(name, bytes), Hex(out)) << name;
  }
}

TEST(Digest, OutputOfAnotherLengthBecomesTheDigestAlone) {
  for (const size_t length : {0, 1, 16, 20, 32, 40, 1000}) {
    Bytes md5(length, 0xEE);
    Bytes sha1(length, 0xEE);
    Bytes sha256(length, 0xEE);
    ComputeMD5Digest(ToBytes("abc"), md5);
    ComputeSHA1Digest(ToBytes("abc"), sha1);
    ComputeSHA256Digest(ToBytes("abc"), sha256);
    EXPECT_EQ("900150983cd24fb0d6963f7d28e17f72", Hex(md5)) << length;
    EXPECT_EQ("a9993e364706816aba3e25717850c26c9cd0d89d", Hex(sha1)) << length;
    EXPECT_EQ("ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad", Hex(sha256))
        << length;
  }
}

TEST(Digest, Sha256ShortensAVectorOf40BytesTo32Bytes) {
  Bytes out(40, 0xEE);
  ComputeSHA256Digest(ToBytes("abc"), out);
  EXPECT_EQ(32U, out.size());
}

TEST(Digests, EachMemberHoldsTheDigestOfItsName) {
  const Digests digests = ComputeDigests(ToBytes("abc"));
  EXPECT_EQ("a9993e364706816aba3e25717850c26c9cd0d89d", Hex(digests.sha1));
  EXPECT_EQ("ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad",
            Hex(digests.sha256));
  EXPECT_EQ("900150983cd24fb0d6963f7d28e17f72", Hex(digests.md5));
}

}  // namespace
