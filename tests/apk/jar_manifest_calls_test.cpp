// Counts the comparisons in the classes that read a JAR manifest, because the results of these
// classes do not show the number of comparisons. One test makes memcpy copy backwards. That test
// fails if a class calls memcpy for overlapping pieces. The linker redirects all calls of memcmp,
// bcmp and memcpy in this program to the functions below.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "apk/entry_digests.h"
#include "apk/manifest_mf.h"
#include "apk/manifest_sections.h"

namespace {

size_t comparisons = 0;
// True: memcpy copies the last byte first. The C standard permits this order, because the source
// and the target of memcpy must not overlap.
bool copies_backwards = false;

}  // namespace

extern "C" {
int __real_memcmp(const void* a, const void* b, size_t size);
void* __real_memcpy(void* to, const void* from, size_t size);

int __wrap_memcmp(const void* a, const void* b, size_t size) {
  ++comparisons;
  return __real_memcmp(a, b, size);
}

// Compilers can replace memcmp by bcmp if only equality matters.
int __wrap_bcmp(const void* a, const void* b, size_t size) { return __wrap_memcmp(a, b, size); }

void* __wrap_memcpy(void* to, const void* from, size_t size) {
  if (!copies_backwards) return __real_memcpy(to, from, size);
  volatile auto* const target = static_cast<char*>(to);
  for (size_t i = size; i-- > 0;) target[i] = static_cast<const char*>(from)[i];
  return to;
}
}

namespace {

class JarManifestCalls : public testing::Test {
 protected:
  ~JarManifestCalls() override { copies_backwards = false; }
};

// The number of comparisons when a section with attributes of these names is loaded.
size_t ComparisonsOf(const std::vector<std::string>& names) {
  std::string text;
  for (const std::string& name : names) text += name + ": 1\r\n";
  ManifestMf manifest;
  comparisons = 0;
  EXPECT_TRUE(manifest.load(text + "\r\n"));
  EXPECT_EQ(1u, manifest.getSections().size());
  return comparisons;
}

// Different names of five bytes.
std::vector<std::string> ShortNames(size_t count) {
  std::vector<std::string> names;
  for (size_t i = 0; i < count; ++i) names.push_back(std::to_string(10000 + i));
  return names;
}

// A sort compares each name with about log2(4096) = 12 others. ManifestSections::add() sorts the
// names from time to time. In this test, the number of names more than doubles between two of these
// sorts. endSection() sorts the names once more. All sorts together need about twice as many
// comparisons as the last sort: about 24 for each name. This test allows 48 for each name.
TEST_F(JarManifestCalls, ShuffledNamesNeed12To48ComparisonsEach) {
  std::vector<std::string> names = ShortNames(4096);
  std::shuffle(names.begin(), names.end(), std::mt19937(1));
  const size_t count = ComparisonsOf(names);
  EXPECT_GT(count, 12u * 4096);
  EXPECT_LT(count, 4 * 12u * 4096);
}

TEST_F(JarManifestCalls, NamesInOrderNeedFewerThan4ComparisonsEach) {
  const size_t count = ComparisonsOf(ShortNames(4096));
  EXPECT_GT(count, 4000u);
  EXPECT_LT(count, 4 * 4096u);
}

// Each sort drops the repeated names. add() sorts again only after the text has grown. The growth
// is more bytes than the remaining names have together.
TEST_F(JarManifestCalls, RepeatedNamesNeedFewerThan48ComparisonsEach) {
  std::vector<std::string> names;
  for (int round = 0; round < 64; ++round) {
    for (const std::string& name : ShortNames(64)) names.push_back(name);
  }
  EXPECT_LT(ComparisonsOf(names), 4 * 12u * 4096);
}

// Attributes that were added before reset() do not matter.
TEST_F(JarManifestCalls, TableAfterResetComparesAsOftenAsAFreshTable) {
  std::string text(100000, 'a');
  text[90001] = 'b';  // the name at 90001: it is last in the text and in byte order
  const auto* const bytes = reinterpret_cast<const uint8_t*>(text.data());
  const auto repeat = [&](ManifestSections& sections) {
    comparisons = 0;
    for (uint32_t start = 0; start < 20000; start += 10) sections.add({{start, 8}, {start + 8, 1}});
    return comparisons;
  };
  ManifestSections fresh, used;
  fresh.reset(bytes, text.size());
  used.reset(bytes, text.size());
  used.add({{0, 90000}, {90000, 1}});
  used.add({{90001, 1}, {90002, 1}});
  used.endSection();
  used.reset(bytes, text.size());
  const size_t expected = repeat(fresh);
  EXPECT_GT(expected, 1000u);
  EXPECT_EQ(expected, repeat(used));
}

// ---- Looking up a name.

// The number of comparisons when the name in the middle is looked up.
size_t ComparisonsOfFinding(const std::vector<std::string>& names) {
  std::string text;
  for (const std::string& name : names) text += "Name: " + name + "\r\nSHA1-Digest: 1\r\n\r\n";
  ApkTools::EntryDigests digests;
  EXPECT_TRUE(digests.Load({text.begin(), text.end()}));
  digests.List();
  comparisons = 0;
  std::string digest_name, digest;
  EXPECT_TRUE(digests.Find("12048", digest_name, digest));
  return comparisons;
}

// Each comparison of two entry names also compares a few attribute names. If the entry names are in
// order, the wanted name is compared with about log2(4096) = 12 entry names. Otherwise, the wanted
// name is compared only with the entry name of the same hash.
TEST_F(JarManifestCalls, NamesInOrderAreNotHashed) {
  std::vector<std::string> names = ShortNames(4096);
  const size_t in_order = ComparisonsOfFinding(names);
  std::swap(names.front(), names.back());
  EXPECT_GT(in_order, 3 * ComparisonsOfFinding(names));
  EXPECT_GT(in_order, 12u);
}

// ---- Continuation lines. If a value is not empty, the parser moves the next continuation line to
// the end of the value.

TEST_F(JarManifestCalls, LinesThatOverlapTheirNewPlaceAreMovedWhole) {
  std::string value;
  for (int i = 0; i < 200; ++i) value += std::to_string(i);
  const std::string text = "A: 1\r\n " + value + "\r\n\r\n";
  for (const bool backwards : {false, true}) {
    copies_backwards = backwards;
    ManifestMf manifest;
    EXPECT_TRUE(manifest.load(std::vector<uint8_t>(text.begin(), text.end())));
    ASSERT_EQ(1u, manifest.getSections().size());
    EXPECT_EQ("1" + value, manifest.getSections()[0].find("A"));
  }
}

}  // namespace
