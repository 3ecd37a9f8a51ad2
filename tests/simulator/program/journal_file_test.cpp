#include "simulator/program/journal_file.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include "support/files.h"

namespace {

const std::string kJournal = "{\"event\":\"journal\",\"version\":1}\n{}\n";

}  // namespace

TEST(JournalFile, ReplacesAnEarlierJournal) {
  const TempDir folder;
  const std::string path = folder.Write("journal", ToBytes(kJournal));
  EXPECT_EQ(JournalFile::Objection(path, {}), std::nullopt);
  JournalFile file;
  ASSERT_TRUE(file.Open(path));
  EXPECT_TRUE(file.Append("a\n"));
  EXPECT_TRUE(file.Append("b\n"));
  EXPECT_EQ(ContentOf(path), "a\nb\n");
}

TEST(JournalFile, ReplacesWhatIsEmptyOrNotThereOrNoFile) {
  const TempDir folder;
  EXPECT_EQ(JournalFile::Objection(folder.Write("empty", {}), {}), std::nullopt);
  EXPECT_EQ(JournalFile::Objection(folder / "none", {}), std::nullopt);
  EXPECT_EQ(JournalFile::Objection("/dev/null", {}), std::nullopt);
}

TEST(JournalFile, LeavesAnythingElseAlone) {
  const TempDir folder;
  const std::string path = folder.Write("base.apk", ToBytes("PK\3\4 and more than a journal has"));
  EXPECT_EQ(JournalFile::Objection(path, {}),
            "--journal " + path + " is there and holds no journal; it is left alone");
}

TEST(JournalFile, LeavesAFileThatIsLookedAtAloneUnderAnyName) {
  const TempDir folder;
  const std::string path = folder.Write("journal", ToBytes(kJournal));
  const std::string link = folder / "link";
  ASSERT_EQ(symlink("journal", link.c_str()), 0);
  EXPECT_EQ(JournalFile::Objection(path, {"/nowhere", link}),
            "--journal " + path + " is a file that is to be looked at; it is left alone");
}

TEST(JournalFile, SaysThatItCannotBeWritten) {
  JournalFile file;
  EXPECT_FALSE(file.Open("/nowhere/journal"));
  JournalFile full;
  ASSERT_TRUE(full.Open("/dev/full"));
  EXPECT_FALSE(full.Append("a\n"));
}
