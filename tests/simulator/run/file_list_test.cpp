#include "simulator/run/file_list.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>

#include "simulator/package/package_names.h"
#include "support/files.h"

using namespace simulator;

namespace {

namespace fs = std::filesystem;
using Lines = std::vector<std::string>;

// One line for each listed name, without the path of `directory`. If the tool is not run for the
// name, the line ends with the reason. If ListFiles failed, the only line is its message.
Lines Listed(const TempDir& directory, const FileListOptions& options, size_t* others = nullptr) {
  FileList list;
  if (const auto problem = ListFiles(options, &list)) return {*problem};
  if (others != nullptr) *others = list.others;
  Lines lines;
  const std::string start = directory.path() + "/";
  for (const ListedFile& file : list.files) {
    const bool is_below = file.name.rfind(start, 0) == 0;
    std::string line = is_below ? file.name.substr(start.size()) : file.name;
    if (file.state == ListedFile::State::kWithoutPackages) line += ": no packages";
    if (file.state == ListedFile::State::kUnreadable) line += ": " + std::to_string(file.error);
    lines.push_back(line);
  }
  return lines;
}

FileListOptions Recursive(const Lines& names) { return {names, "", false, true}; }

}  // namespace

TEST(PackageName, HasAPackageEndingInAnyLetterCase) {
  for (const char* name : {"a.apk", "a.APK", "b.jar", "c.apks", "d.xapk", "e.apkm", "f.Aab"}) {
    EXPECT_TRUE(IsPackageName(name)) << name;
  }
  for (const char* name : {"", "apk", "a.apk~", "a.apk.sig", "a.zip", "a.ap"}) {
    EXPECT_FALSE(IsPackageName(name)) << name;
  }
}

TEST(FileList, HasTheNamedFilesWithoutOptions) {
  const TempDir directory;
  directory.Write("b/a.apk", {});
  EXPECT_EQ(Listed(directory, {{directory / "b", "none", directory / "b"}, "", false, false}),
            Lines({"b", "none", "b"}));
}

TEST(FileList, DirectoryIsReplacedByItsPackagesSortedByPath) {
  const TempDir directory;
  for (const char* name : {"s/b/z.apk", "s/b/a.JAR", "s/a.xapk", "s/b.apk", "s/.hidden/c.aab",
                           "s/notes.txt", "s/b/x.zip"}) {
    directory.Write(name, {});
  }
  size_t others = 0;
  EXPECT_EQ(Listed(directory, Recursive({directory / "none", directory / "s"}), &others),
            Lines({"none", "s/.hidden/c.aab", "s/a.xapk", "s/b.apk", "s/b/a.JAR", "s/b/z.apk"}));
  EXPECT_EQ(others, 2U);
}

TEST(FileList, LinksToDirectoriesAreFollowedOnlyIfNamed) {
  const TempDir directory;
  directory.Write("real/a.apk", {});
  fs::create_directory_symlink("real", directory / "named");
  directory.Write("aside/d.apk", {});
  fs::create_directory_symlink("../aside", directory / "real/link");
  fs::create_directory_symlink("../aside", directory / "real/link.apk");
  fs::create_symlink("a.apk", directory / "real/b.apk");
  fs::create_symlink("gone", directory / "real/c.apk");
  EXPECT_EQ(Listed(directory, Recursive({directory / "named"})),
            Lines({"named/a.apk", "named/b.apk", "named/c.apk"}));
}

TEST(FileList, DirectoryWithoutPackagesIsReported) {
  const TempDir directory;
  directory.Write("empty/readme.txt", {});
  directory.Write("full/a.apk", {});
  EXPECT_EQ(Listed(directory, Recursive({directory / "empty", directory / "full"})),
            Lines({"empty: no packages", "full/a.apk"}));
}

// Linux accepts paths of at most 4095 bytes. The test makes directories with longer paths.
// ListFiles cannot read the first of them.
TEST(FileList, DirectoryThatCannotBeReadIsReported) {
  const TempDir directory;
  directory.Write("deep/a.apk", {});
  const std::string name(250, 'd');
  const fs::path before = fs::current_path();
  fs::current_path(directory / "deep");
  for (int i = 0; i < 20; ++i) {
    fs::create_directory(name);
    fs::current_path(name);
  }
  fs::current_path(before);
  const Lines lines = Listed(directory, Recursive({directory / "deep"}));
  ASSERT_EQ(lines.size(), 2U);
  EXPECT_EQ(lines[0], "deep/a.apk");
  EXPECT_EQ(lines[1].substr(lines[1].find(": ")), ": " + std::to_string(ENAMETOOLONG));
}

TEST(FileList, ListsAreReadByLinesOrByNulBytes) {
  const TempDir directory;
  const std::string lines = directory.Write("lines", ToBytes("a b.apk\n\n  c\nlast"));
  EXPECT_EQ(Listed(directory, {{"first"}, lines, false, false}),
            Lines({"first", "a b.apk", "  c", "last"}));
  const std::string with_nul = std::string("a\nb") + '\0' + '\0' + "c" + '\0';
  const std::string nul = directory.Write("nul", ToBytes(with_nul));
  EXPECT_EQ(Listed(directory, {{}, nul, true, false}), Lines({"a\nb", "c"}));
  // Without -0, the part of a name after a NUL byte would be lost, so the list is an error.
  EXPECT_EQ(
      Listed(directory, {{}, nul, false, false}),
      Lines({"the list " + nul + " contains NUL bytes; use -0 if its names end with NUL bytes"}));
}

TEST(FileList, DirectoriesInAListAreSearchedToo) {
  const TempDir directory;
  directory.Write("s/a.apk", {});
  const std::string list = directory.Write("list", ToBytes((directory / "s") + "\n"));
  EXPECT_EQ(Listed(directory, {{}, list, false, true}), Lines({"s/a.apk"}));
  EXPECT_EQ(Listed(directory, {{}, list, false, false}), Lines({"s"}));
}

// A list without names is an error, even if the command line names files.
TEST(FileList, ListWithoutNamesIsAnError) {
  const TempDir directory;
  for (const char* content : {"", "\n\n"}) {
    const std::string list = directory.Write("list", ToBytes(content));
    EXPECT_EQ(Listed(directory, {{"a.apk"}, list, false, false}),
              Lines({"the list " + list + " contains no file names"}));
  }
}

TEST(FileList, ListThatCannotBeReadIsAnError) {
  const TempDir directory;
  EXPECT_EQ(
      Listed(directory, {{}, directory / "none", false, false}),
      Lines({"cannot read the list " + (directory / "none") + ": No such file or directory"}));
  EXPECT_EQ(Listed(directory, {{}, directory.path(), false, false}),
            Lines({"cannot read the list " + directory.path() + ": Is a directory"}));
}
