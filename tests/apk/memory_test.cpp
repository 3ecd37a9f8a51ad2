// Tests how much memory hostile and large packages take. Each package is opened in its own process,
// because the peak memory of a process never falls.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <fstream>
#include <functional>
#include <random>

#include "support/jar.h"
#include "support/little_endian.h"
#include "support/log_capture.h"
#include "support/open_package.h"

namespace {

constexpr long kMegabyte = 1 << 10;  // in kilobytes

// The freed memory that AddressSanitizer keeps for a while, in kilobytes. By default it
// keeps 256 MB.
#ifndef __has_feature
#define __has_feature(feature) 0
#endif
constexpr long kKept = __has_feature(address_sanitizer) ? 256 * kMegabyte : 0;

// The peak memory of the process, in kilobytes.
long PeakMemory() {
  std::ifstream status("/proc/self/status");
  for (std::string word; status >> word;) {
    if (long kilobytes; word == "VmHWM:" && status >> kilobytes) return kilobytes;
  }
  return -1;
}

// Runs `task` in a child process. Returns the growth of the child's peak memory, in kilobytes; -1
// if the child dies or `task` returns false.
long PeakGrowth(const std::function<bool()>& task) {
  int ends[2];
  EXPECT_EQ(pipe(ends), 0);
  const pid_t child = fork();
  if (child == 0) {
    LogCapture log;
    const long before = PeakMemory();
    const long growth = task() ? PeakMemory() - before : -1;
    _exit(write(ends[1], &growth, sizeof(growth)) == sizeof(growth) ? 0 : 1);
  }
  close(ends[1]);
  long growth = -1;
  EXPECT_EQ(read(ends[0], &growth, sizeof(growth)), static_cast<ssize_t>(sizeof(growth)));
  close(ends[0]);
  int status;
  EXPECT_EQ(waitpid(child, &status, 0), child);
  EXPECT_EQ(status, 0);
  return growth;
}

long GrowthOfOpening(const Bytes& archive) {
  return PeakGrowth([&] { return !OpenPackage(archive).apk.IsApk(); });
}

constexpr long kLittleMemory = 100 * kMegabyte;  // the limit if a package declares 4 GB

TEST(ApkMemory, GarbageThatDeclaresGigabytesTakesLittleMemory) {
  ZipItem item{kAndroidManifestName, {}, true};
  std::mt19937 random(1);
  item.raw = Bytes(4200000);
  for (uint8_t& byte : *item.raw) byte = static_cast<uint8_t>(random());
  const long growth = GrowthOfOpening(BuildZip({ClaimingLength(item, 0xfffffffe)}));
  EXPECT_GE(growth, 0);
  EXPECT_LT(growth, kLittleMemory);
}

TEST(ApkMemory, ShortEntryThatDeclaresGigabytesTakesLittleMemory) {
  const ZipItem item{kAndroidManifestName, Bytes(100, 0), true};
  const long growth = GrowthOfOpening(BuildZip({ClaimingLength(item, 0xfffffffe)}));
  EXPECT_GE(growth, 0);
  EXPECT_LT(growth, kLittleMemory);
}

// The growth of the peak memory for a package whose signature file is `text`. The text must
// compress well, so that the package is small.
long GrowthWithSignatureFile(const std::string& text) {
  Package package = MakePackage(WithoutDex());
  ZipItem& signature_file = package.Item("META-INF/CERT.SF");
  signature_file.deflated = true;
  signature_file.data = ToBytes(text);
  const Bytes archive = package.Build();
  return PeakGrowth([&] { return !OpenPackage(archive).apk.IsGoodApk(); });
}

std::string Repeat(const std::string& text, size_t count) {
  std::string whole;
  for (size_t i = 0; i < count; ++i) whole += text;
  return whole;
}

// The text is one section that repeats one name: 40 MB, compressed to 40 kB. The verification must
// not make a second copy of the text.
TEST(ApkMemory, RepeatedNamesTakeLittleBesidesTheText) {
  const long growth = GrowthWithSignatureFile(Repeat("A: 1\n", 8000000));
  EXPECT_GE(growth, 39 * kMegabyte);
  EXPECT_LT(growth, 60 * kMegabyte + kKept);
}

// A million sections of one attribute each. Each section takes 20 bytes in ManifestSections.
// Repeated names after these sections take almost no memory in ManifestSections, but they make the
// text 20 MB longer.
TEST(ApkMemory, RepeatedNamesAfterManySectionsTakeLittleBesidesTheText) {
  const std::string sections = Repeat("A: 1\n\n", 1000000);
  const long growth = GrowthWithSignatureFile(sections);
  EXPECT_LT(GrowthWithSignatureFile(sections + Repeat("A: 1\n", 4000000)),
            growth + 30 * kMegabyte + kKept);
}

// A document whose string pool has overlapping UTF-8 strings. Each string starts with its two
// lengths, which are also part of the strings before it. All strings end at the same NUL,
// which is the pool's last byte. Each string is the name of an element, and the platform's library
// makes a separate UTF-16 copy of each name.
Bytes DocumentOfOverlappingStrings() {
  constexpr uint32_t kText = 16000, kHeader = 28;
  Bytes text(kText, 'a'), offsets, elements;
  uint32_t count = 0;
  for (uint32_t at = 0; at + 4 < kText; at += 4) {
    const uint32_t length = kText - 1 - (at + 4);
    if ((length & 0xff) == 0 || (length & 0xff) > 0x7f) continue;  // low byte: NUL, or not ASCII
    for (uint32_t i = 0; i < 4; i += 2) {
      text[at + i] = static_cast<uint8_t>(0x80 | length >> 8);
      text[at + i + 1] = static_cast<uint8_t>(length & 0xff);
    }
    Put32(offsets, at);
    for (const uint32_t word : {0x00100102u, 36u, 1u, ~0u, ~0u, count++, 0x00140014u, 0u, 0u}) {
      Put32(elements, word);
    }
  }
  text.back() = 0;
  Bytes pool;
  for (const uint32_t word :
       {0x001c0001u, static_cast<uint32_t>(kHeader + offsets.size() + kText), count, 0u, 0x100u,
        static_cast<uint32_t>(kHeader + offsets.size()), 0u}) {
    Put32(pool, word);
  }
  Bytes document;
  Put32(document, 0x00080003);
  Put32(document,
        static_cast<uint32_t>(8 + pool.size() + offsets.size() + text.size() + elements.size()));
  return Concat({document, pool, offsets, text, elements});
}

// The platform's library keeps each converted string. The tool cannot know in advance how much
// memory a name will take.
TEST(ApkMemory, OverlappingStringsTakeOver100TimesTheDocumentsSize) {
  const Bytes document = DocumentOfOverlappingStrings();
  const long growth = PeakGrowth([&] { return ApkTools::Apk(-1).ParseAndroidManifest(document); });
  EXPECT_GT(growth * 1024, 100 * static_cast<long>(document.size()));
}

// Verifies one library at a time. The sizes rise and fall from one library to the next.
TEST(ApkMemory, LibrariesTakeOnlyTheMemoryOfTheLargest) {
  PackageOptions options = WithoutDex();
  TempDir directory;
  for (const size_t megabytes : {40, 60, 20, 50}) {
    const std::string name = std::to_string(megabytes);
    Bytes content(megabytes << 20, 0);
    directory.Write(name, content);
    options.entries.push_back({name, std::move(content), true});
  }
  const Bytes archive = MakePackage(options).Build();
  options = {};
  const long growth = PeakGrowth([&] {
    OpenPackage open(archive);
    bool good = true;
    for (const char* name : {"40", "60", "20", "50"}) {
      good = open.apk.VerifyFileHash(name, directory / name) && good;
    }
    return good;
  });
  EXPECT_GT(growth, 50 * kMegabyte);
  EXPECT_LT(growth, 80 * kMegabyte + kKept);
}

}  // namespace
