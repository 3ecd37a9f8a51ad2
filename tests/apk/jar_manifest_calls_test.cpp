// What the readers of a JAR's manifest ask of the C and the C++ library, where their results do not
// tell: how often they compare, which names share a hash, how they copy. The linker sends the calls
// of the whole program here (CMakeLists.txt names them as the compiler does).
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "apk/entry_digests.h"
#include "apk/manifest_mf.h"
#include "apk/manifest_sections.h"

namespace {

size_t comparisons = 0;
// The hash of a name, where it is not the library's.
std::function<size_t(std::string_view)> hash;
// Copies begin at the last byte, as memcpy may, whose pieces do not overlap.
bool copies_backwards = false;

}  // namespace

size_t RealHashBytes(const void*, size_t, size_t) __asm__("__real_" HASH_BYTES);
size_t WrapHashBytes(const void*, size_t, size_t) __asm__("__wrap_" HASH_BYTES);

size_t WrapHashBytes(const void* bytes, size_t size, size_t seed) {
  if (hash) return hash(std::string_view(static_cast<const char*>(bytes), size));
  return RealHashBytes(bytes, size, seed);
}

extern "C" {
int __real_memcmp(const void* a, const void* b, size_t size);
void* __real_memcpy(void* to, const void* from, size_t size);

int __wrap_memcmp(const void* a, const void* b, size_t size) {
  ++comparisons;
  return __real_memcmp(a, b, size);
}

// What compilers make of a memcmp that is asked for no more than equality.
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
  ~JarManifestCalls() override {
    hash = nullptr;
    copies_backwards = false;
  }
};

// How often the text, of one section, has the names of its attributes compared.
size_t ComparisonsOf(const std::vector<std::string>& names) {
  std::string text;
  for (const std::string& name : names) text += name + ": 1\r\n";
  ManifestMf manifest;
  comparisons = 0;
  EXPECT_TRUE(manifest.load(text + "\r\n"));
  EXPECT_EQ(1u, manifest.getSections().size());
  return comparisons;
}

// Distinct names of five bytes.
std::vector<std::string> ShortNames(size_t count) {
  std::vector<std::string> names;
  for (size_t i = 0; i < count; ++i) names.push_back(std::to_string(10000 + i));
  return names;
}

// A sort compares each name with about log2(count) others. To do it again when so much has been
// added that it pays takes no more than twice as many comparisons in all, and twice is allowed.
TEST_F(JarManifestCalls, DistinctShortNamesAreSortedInLogarithmicTime) {
  std::vector<std::string> names = ShortNames(4096);
  std::shuffle(names.begin(), names.end(), std::mt19937(1));
  const size_t count = ComparisonsOf(names);
  EXPECT_GT(count, 12u * 4096);
  EXPECT_LT(count, 4 * 12u * 4096);
}

TEST_F(JarManifestCalls, NamesInOrderAreComparedWithTheirNeighboursAlone) {
  const size_t count = ComparisonsOf(ShortNames(4096));
  EXPECT_GT(count, 4000u);
  EXPECT_LT(count, 4 * 4096u);
}

// Few names again and again: each time that as much has been read as they take.
TEST_F(JarManifestCalls, NamesThatRepeatAreComparedInLogarithmicTime) {
  std::vector<std::string> names;
  for (int round = 0; round < 64; ++round) {
    for (const std::string& name : ShortNames(64)) names.push_back(name);
  }
  EXPECT_LT(ComparisonsOf(names), 4 * 12u * 4096);
}

// Whatever the text before it was like.
TEST_F(JarManifestCalls, ATableThatWasResetSortsAsOftenAsAFreshOne) {
  std::string text(100000, 'a');
  text[90001] = 'b';  // the last name by its place and by its order
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

// ---- Names that share a hash.

std::string Section(const std::string& name, int digest) {
  return "Name: " + name + "\r\nSHA1-Digest: " + std::to_string(digest) + "\r\n\r\n";
}

class Recorded {
 public:
  explicit Recorded(const std::string& text) {
    EXPECT_TRUE(digests_.Load({text.begin(), text.end()}));
    digests_.List();
  }

  // 0: none.
  int Of(const std::string& name) const {
    std::string digest_name, digest;
    return digests_.Find(name, digest_name, digest) ? std::stoi(digest) : 0;
  }

 private:
  ApkTools::EntryDigests digests_;
};

constexpr char kUnordered[] = "bdacbaecdab";

// Sections of these names, numbered from 1.
std::string Sections(const std::string& names) {
  std::string text;
  for (size_t i = 0; i < names.size(); ++i) {
    text += Section(names.substr(i, 1), static_cast<int>(i) + 1);
  }
  return text;
}

// Which of the names have one: all, some, those next to one another, none.
TEST_F(JarManifestCalls, NamesThatShareAHashAreToldApartByTheNames) {
  const std::function<size_t(std::string_view)> hashes[] = {
      [](std::string_view) { return size_t{7}; },
      [](std::string_view name) { return static_cast<size_t>(name[0]) % 2; },
      [](std::string_view name) { return static_cast<size_t>(name[0]) / 2; },
      [](std::string_view name) { return ~static_cast<size_t>(name[0]); }};
  for (const auto& given : hashes) {
    hash = given;
    const Recorded recorded(Sections(kUnordered));
    for (const char name : std::string("abcde")) {
      const std::string names = kUnordered;
      EXPECT_EQ(static_cast<int>(names.rfind(name)) + 1, recorded.Of(std::string(1, name))) << name;
    }
    for (const char* name : {"A", "aa", "bc", "f", "z"}) EXPECT_EQ(0, recorded.Of(name)) << name;
  }
}

// A manifest in order asks for no hash at all.
TEST_F(JarManifestCalls, NamesInOrderAreNotHashed) {
  int hashed = 0;
  hash = [&](std::string_view name) {
    ++hashed;
    return name.size();
  };
  const Recorded ordered(Sections("aabccde"));
  EXPECT_EQ(2, ordered.Of("a"));
  EXPECT_EQ(5, ordered.Of("c"));
  EXPECT_EQ(0, hashed);
  const Recorded unordered(Sections("bca"));
  EXPECT_EQ(3, unordered.Of("a"));
  EXPECT_EQ(4, hashed);
}

// ---- Continuation lines, which move up over what lies before them.

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
