#include "simulator/package/archive.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <csignal>
#include <cstddef>
#include <functional>
#include <optional>

#include "support/files.h"
#include "support/zip.h"

using namespace simulator;

namespace {

using Lines = std::vector<std::string>;

// An entry whose CRC in the local header differs from the CRC in the central directory. The
// platform's library refuses this entry.
ZipItem Damaged(const std::string& name) {
  ZipItem item = {name, ToBytes("data of " + name)};
  item.local.crc = 1;
  return item;
}

ZipItem Good(const std::string& name) { return {name, ToBytes("data of " + name)}; }

// "name size" of each entry, with "damaged" if the entry is damaged.
Lines EntriesOf(const Bytes& zip) {
  const MemoryFile file(zip);
  int32_t result = -1;
  const Archive archive(file.fd(), &result);
  EXPECT_EQ(result, 0);
  Lines lines;
  for (const ArchiveEntry& entry : archive.Entries()) {
    lines.push_back(entry.name + " " + std::to_string(entry.size) +
                    (entry.is_damaged ? " damaged" : ""));
  }
  return lines;
}

ArchiveWalk WalkOf(const Bytes& zip) {
  const MemoryFile file(zip);
  int32_t result = -1;
  const Archive archive(file.fd(), &result);
  return archive.Walk(kLibraryNames);
}

}  // namespace

TEST(Archive, EntriesAreInTheOrderOfTheDirectory) {
  EXPECT_EQ(EntriesOf(BuildZip({Good("b"), Good("a"), Good("\x01\u00e9")})),
            Lines({"b 9", "a 9", "\x01\u00e9 11"}));
}

TEST(Archive, DamagedEntryIsMarkedAndOthersAreListed) {
  EXPECT_EQ(EntriesOf(BuildZip({Good("a"), Damaged("b"), Good("c")})),
            Lines({"a 9", "b 9 damaged", "c 9"}));
}

// The zip library chooses the order of Walk(). The test therefore finds out this order first, and
// then damages each entry in turn.
TEST(Archive, WalkShowsWhereTheToolStops) {
  const Lines names = {"lib/x/a.so", "lib/x/b.so", "lib/x/c.so"};
  const Lines order = WalkOf(BuildZip({Good(names[0]), Good(names[1]), Good(names[2])})).names;
  ASSERT_EQ(order.size(), 3U);
  for (size_t damaged = 0; damaged < 3; ++damaged) {
    std::vector<ZipItem> items = {Good("res/a"), Damaged("res/b")};
    for (const std::string& name : names) {
      items.push_back(name == order[damaged] ? Damaged(name) : Good(name));
    }
    const ArchiveWalk walk = WalkOf(BuildZip(items));
    Lines expected = order;
    expected.erase(expected.begin() + static_cast<ptrdiff_t>(damaged));
    EXPECT_EQ(walk.names, expected);
    EXPECT_EQ(walk.met, damaged);
  }
  EXPECT_EQ(WalkOf(BuildZip({Good("res/a"), Damaged("res/b")})).names, Lines());
}

TEST(Archive, WalkWithoutDamageReachesAllNames) {
  EXPECT_EQ(WalkOf(BuildZip({Good("lib/x/a.so"), Good("lib/x/b.so")})).met, 2U);
}

TEST(Archive, ReadsWhatTheToolExtracts) {
  ZipItem deflated = Good("deflated");
  deflated.deflated = true;
  const MemoryFile file(
      BuildZip({deflated, Damaged("damaged"), ClaimingLength(Good("lying"), 0xfffffff0)}));
  int32_t result = -1;
  Archive archive(file.fd(), &result);
  std::vector<uint8_t> content = ToBytes("before");
  EXPECT_EQ(archive.Read("none", &content), Archive::ReadResult::kMissing);
  EXPECT_EQ(archive.Read(std::string(65536, 'n'), &content), Archive::ReadResult::kMissing);
  EXPECT_EQ(archive.Read("damaged", &content), Archive::ReadResult::kDamaged);
  EXPECT_EQ(archive.Read("lying", &content), Archive::ReadResult::kDamaged);
  EXPECT_EQ(content, ToBytes("before"));
  EXPECT_EQ(archive.Read("deflated", &content), Archive::ReadResult::kRead);
  EXPECT_EQ(content, ToBytes("data of deflated"));
  EXPECT_TRUE(archive.Has("damaged"));
  EXPECT_FALSE(archive.Has("none"));
  EXPECT_FALSE(archive.Has(std::string(65536, 'n')));
}

TEST(Archive, LongEntriesAreNotRead) {
  ZipItem longest = {"longest", Bytes(Archive::kLongestRead, 'a'), true};
  ZipItem longer = {"longer", Bytes(Archive::kLongestRead + 1, 'a'), true};
  const MemoryFile file(BuildZip({longest, longer}));
  int32_t result = -1;
  Archive archive(file.fd(), &result);
  std::vector<uint8_t> content;
  EXPECT_EQ(archive.Read("longer", &content), Archive::ReadResult::kTooLong);
  EXPECT_EQ(archive.too_long(), Lines({"longer"}));
  EXPECT_TRUE(content.empty());
  EXPECT_EQ(archive.Read("longest", &content), Archive::ReadResult::kRead);
  EXPECT_EQ(content.size(), Archive::kLongestRead);
}

// An entry counts as damaged if its compressed data is too short for the length that the entry
// claims. It does not count as too long, even if the claimed length is above kLongestRead.
TEST(Archive, EntryThatClaimsTooMuchIsDamaged) {
  const MemoryFile file(BuildZip(
      {ClaimingLength({"liar", Bytes(100, 'a'), true}, Archive::kLongestRead + 1), Good("a")}));
  int32_t result = -1;
  Archive archive(file.fd(), &result);
  std::vector<uint8_t> content;
  EXPECT_EQ(archive.Read("liar", &content), Archive::ReadResult::kDamaged);
  EXPECT_EQ(archive.too_long(), Lines());
}

// The zip library maps the central directory into memory. When the file shrinks, the pages beyond
// its new end no longer exist.
TEST(Archive, SurvivesAFileThatShrinks) {
  std::vector<ZipItem> items;
  for (int i = 0; i < 2000; ++i) items.push_back({"assets/" + std::to_string(i), {}});
  const TempDir directory;
  const std::string path = directory.Write("a.zip", BuildZip(items));
  const int fd = open(path.c_str(), O_RDONLY);
  int32_t result = -1;
  {
    const Archive archive(fd, &result);
    ASSERT_EQ(result, 0);
    EXPECT_EQ(archive.Entries().size(), 2000U);
    EXPECT_FALSE(archive.HasShrunk());
    ASSERT_EQ(truncate(path.c_str(), 10), 0);
    EXPECT_TRUE(archive.Entries().empty());
    EXPECT_EQ(archive.Walk(kAllNames).met, 0U);
    EXPECT_TRUE(archive.HasShrunk());
  }
  close(fd);
  // The next archive does not count as shrunk.
  const MemoryFile other(BuildZip({Good("a")}));
  const Archive archive(other.fd(), &result);
  EXPECT_FALSE(archive.HasShrunk());
}

// The page is beyond the end of an empty file, so a read of the page raises SIGBUS. SIGBUS ends the
// process if no ShrinkGuard exists.
TEST(ShrinkGuardDeathTest, GuardsOnlyWhileItExists) {
  const auto touch = [](bool guarded) {
    const int fd = memfd_create("page", MFD_CLOEXEC);
    volatile char* const page =
        static_cast<char*>(mmap(nullptr, 4096, PROT_READ, MAP_SHARED, fd, 0));
    std::optional<ShrinkGuard>(std::in_place).reset();
    if (guarded) {
      const ShrinkGuard guard;
      const bool is_zero = *page == 0 && guard.HasShrunk();
      _exit(is_zero ? 0 : 1);
    }
    _exit(*page);
  };
  EXPECT_EXIT(touch(true), testing::ExitedWithCode(0), "");
  EXPECT_EXIT(touch(false), testing::KilledBySignal(SIGBUS), "");
}

TEST(ArchiveEnd, IsTheLastMarkThatHasRoomForARecord) {
  const auto end_of = [](const std::string& comment) {
    Bytes zip = BuildZip({Good("a")});
    zip[zip.size() - 2] = static_cast<uint8_t>(comment.size());
    zip[zip.size() - 1] = static_cast<uint8_t>(comment.size() >> 8);
    zip.insert(zip.end(), comment.begin(), comment.end());
    const MemoryFile file(zip);
    const auto end = FindArchiveEnd(file.fd());
    return end ? static_cast<int>(end->entry_count) : -1;
  };
  EXPECT_EQ(end_of(""), 1);
  EXPECT_EQ(end_of("a comment"), 1);
  EXPECT_EQ(end_of(std::string(65535, 'c')), 1);
  // The end record's signature, PK\5\6, does not count here: only 17 bytes follow it, and a
  // record has 18 bytes after its signature.
  EXPECT_EQ(end_of(std::string("PK\5\6") + std::string(17, '\0')), 1);
  // Here the signature begins a whole record, so it counts, as in the platform's library.
  EXPECT_EQ(end_of(std::string("PK\5\6") + std::string(18, '\0')), 0);
}

// Builds an archive with the entries "a" and "bcd", and calls `change` with its bytes and the
// offset of its central directory. Returns the names in the changed directory.
Lines NamesAfter(const std::function<void(Bytes* zip, ptrdiff_t directory)>& change) {
  Bytes zip = BuildZip({Good("a"), Good("bcd")});
  const auto end = FindArchiveEnd(MemoryFile(zip).fd());
  EXPECT_TRUE(end.has_value());
  change(&zip, end->directory_offset);
  const MemoryFile changed(zip);
  Lines names;
  for (const ArchiveEntry& entry : ReadDirectory(changed.fd(), *end)) names.push_back(entry.name);
  return names;
}

// A central directory header has 46 bytes, then the name, the extra field and the comment. The
// lengths of the extra field and the comment are at the offsets 30 and 32 (APPNOTE.TXT 4.3.12).
TEST(ReadDirectory, SkipsTheExtraFieldAndTheComment) {
  const auto add = [](Bytes* zip, ptrdiff_t directory) {
    const Bytes more = ToBytes("extracomment");
    (*zip)[static_cast<size_t>(directory) + 30] = 5;
    (*zip)[static_cast<size_t>(directory) + 32] = 7;
    zip->insert(zip->begin() + directory + 47, more.begin(), more.end());
  };
  EXPECT_EQ(NamesAfter(add), Lines({"a", "bcd"}));
}

TEST(ReadDirectory, EndsWhereItIsCutOrHasNoMark) {
  EXPECT_EQ(NamesAfter([](Bytes*, ptrdiff_t) {}), Lines({"a", "bcd"}));
  EXPECT_EQ(NamesAfter([](Bytes* zip, ptrdiff_t) { zip->resize(zip->size() - 22 - 1); }),
            Lines({"a"}));
  const auto unmark = [](Bytes* zip, ptrdiff_t at) { (*zip)[static_cast<size_t>(at) + 47] = 'p'; };
  EXPECT_EQ(NamesAfter(unmark), Lines({"a"}));
}

TEST(ArchiveEnd, FalseDirectoryOffsetGivesNoEntries) {
  Bytes zip = BuildZip({Good("a")});
  zip[zip.size() - 22 + 19] = 0xff;  // the highest byte of the directory's offset
  const MemoryFile file(zip);
  const auto end = FindArchiveEnd(file.fd());
  ASSERT_TRUE(end.has_value());
  EXPECT_GT(end->directory_offset, zip.size());
  EXPECT_TRUE(ReadDirectory(file.fd(), *end).empty());
}

TEST(ArchiveEnd, IsNotFoundInAFileThatIsNoArchive) {
  const MemoryFile empty({});
  EXPECT_FALSE(FindArchiveEnd(empty.fd()).has_value());
  const MemoryFile text(ToBytes("no archive, but long enough to hold the record of an end"));
  EXPECT_FALSE(FindArchiveEnd(text.fd()).has_value());
  EXPECT_FALSE(FindArchiveEnd(-1).has_value());
}
