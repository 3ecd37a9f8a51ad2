// Passes directories and lists of files to apktoolkit-sim, as a pipeline does. Checks for which
// files the tool is run, and how apktoolkit-sim reports and counts these files.
#include <gtest/gtest.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "support/files.h"
#include "support/namespaces.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

namespace fs = std::filesystem;
using Lines = std::vector<std::string>;

// Makes two directories. `good` has one good package. `shop` has one good package, one unsigned
// package, one text file, and a directory `more` with one good package.
class ManyFiles : public testing::Test {
 protected:
  ManyFiles() {
    const fs::path golden = GOLDEN_PACKAGES;
    for (const char* place : {"good", "shop", "shop/more"}) {
      fs::create_directories(directory_ / place);
      fs::copy(golden / "apksigner-sha256-2048/base.apk", directory_ / place);
    }
    fs::copy(golden / "unsigned.apk", directory_ / "shop");
    directory_.Write("shop/notes.txt", ToBytes("notes"));
  }

  // Runs `script` in the shell. In the script, "sim" runs the simulator.
  ProcessResult Do(const std::string& script, const Lines& before = {}) const {
    Lines command = before;
    command.insert(
        command.end(),
        {"env", "LC_ALL=C.UTF-8", "bash", "-c",
         "sim() { \"$SIM\" --installer=off --quiet \"$@\"; }\nSIM=$0\n" + script, SimulatorPath()});
    return RunProcess(command, directory_.path());
  }

  // The lines of the output, then the exit status, then the text on standard error, if any. Each
  // line of the output is cut at its first three blanks in a row.
  static Lines Told(const ProcessResult& run) {
    Lines lines;
    std::istringstream text(run.output);
    for (std::string line; std::getline(text, line);) {
      lines.push_back(line.substr(0, line.find("   ")));
    }
    lines.push_back("-> " + std::to_string(run.status));
    if (!run.errors.empty()) lines.push_back(run.errors);
    return lines;
  }

  const TempDir directory_;
};

constexpr char kOthers[] =
    "apktoolkit-sim: skipped 1 file below the directories: not named like a package\n";

}  // namespace

TEST_F(ManyFiles, RecursiveLooksAtThePackagesOfADirectory) {
  EXPECT_EQ(Told(Do("sim --recursive shop")),
            Lines({"SIGNED  shop/base.apk", "SIGNED  shop/more/base.apk",
                   "REFUSED  shop/unsigned.apk", "-> 1", kOthers}));
  EXPECT_EQ(Told(Do("sim --recursive good")), Lines({"SIGNED  good/base.apk", "-> 0"}));
}

TEST_F(ManyFiles, DirectoryWithoutRecursiveIsRefusedWithTheCure) {
  const ProcessResult run =
      RunProcess({"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--installer=off", "shop", "."},
                 directory_.path());
  EXPECT_EQ(run.status, 1);
  EXPECT_NE(run.output.find(
                "  ✗ file  not signed: it is a directory with 2 packages in it\n"
                "      Name every package in it, the base and its splits: DIRECTORY/*.apk. Or\n"
                "      give --recursive.\n"),
            std::string::npos)
      << run.output;
  EXPECT_NE(run.output.find("  ✗ file  not signed: it is a directory\n"
                            "      Name the package inside it, or give --recursive.\n"),
            std::string::npos);
}

// The tool looked at no file in the empty directory, so the run must fail.
TEST_F(ManyFiles, DirectoryWithoutPackagesGivesStatus4) {
  fs::create_directory(directory_ / "empty");
  ASSERT_EQ(Told(Do("sim --recursive good empty --journal journal")),
            Lines({"SIGNED  good/base.apk", "NOT LOOKED AT  empty", "-> 4"}));
  const std::string journal = ContentOf(directory_ / "journal");
  const size_t last = journal.rfind("{\"event\":\"verdict\"");
  const nlohmann::json verdict = nlohmann::json::parse(journal.substr(last));
  EXPECT_EQ(verdict["file"], "empty");
  EXPECT_EQ(verdict["status"], 4);
  EXPECT_EQ(verdict["items"][0]["reason"], "no-packages");
}

TEST_F(ManyFiles, UnreadableDirectoryGivesStatus4) {
  if (!CanMakeNamespaces()) GTEST_SKIP() << kNoNamespaces;
  fs::create_directory(directory_ / "good/locked");
  fs::permissions(directory_ / "good/locked", fs::perms::none);
  EXPECT_EQ(Told(Do("sim --recursive good", {"unshare", "-U"})),
            Lines({"SIGNED  good/base.apk", "NOT LOOKED AT  good/locked", "-> 4"}));
}

TEST_F(ManyFiles, NamesComeFromAList) {
  EXPECT_EQ(Told(Do("printf '%s\\n' good/base.apk shop/unsigned.apk >list; sim --files-from list")),
            Lines({"SIGNED  good/base.apk", "REFUSED  shop/unsigned.apk", "-> 1"}));
  EXPECT_EQ(Told(Do("cp good/base.apk $'two\\nlines.apk';"
                    "find . -name '*lines.apk' -print0 | sim --files-from - -0")),
            Lines({"SIGNED  ./two\\x0alines.apk", "-> 0"}));
  EXPECT_EQ(
      Told(Do("printf 'good\\nshop' | sim --recursive --files-from=- --null shop/unsigned.apk")),
      Lines({"REFUSED  shop/unsigned.apk", "NOT LOOKED AT  good\\x0ashop", "-> 4"}));
}

TEST_F(ManyFiles, EmptyOrMissingListGivesStatus2) {
  EXPECT_EQ(Told(Do("sim good/base.apk --files-from - </dev/null")),
            Lines({"-> 2", "apktoolkit-sim: the list on standard input contains no file names\n"}));
  EXPECT_EQ(Told(Do("sim --files-from none")),
            Lines({"-> 2",
                   "apktoolkit-sim: cannot read the list none: No such file or "
                   "directory\n"}));
}

// Each run extracts the package's libraries into a new temporary directory. No output contains the
// name of this directory. Only the process ID and the time differ, and the script replaces both.
TEST_F(ManyFiles, TwoRunsOverOneFileGiveTheSameOutput) {
  const std::string both =
      "for run in 1 2; do sim --journal $run.journal --html $run.html good/base.apk; "
      "\"$SIM\" --installer=off --verbose good/base.apk >$run.text; "
      "sed -i 's/\"pid\":[1-9][0-9]*/\"pid\":N/' $run.journal; "
      "sed -i -E 's/20[0-9-]{8}[T ][0-9:]{8}(Z| UTC)/TIME/g' $run.html; done\n";
  const ProcessResult run =
      Do(both + "cmp 1.journal 2.journal && cmp 1.html 2.html && cmp 1.text 2.text");
  EXPECT_EQ(run.status, 0) << run.output << run.errors;
  const std::string journal = ContentOf(directory_ / "1.journal");
  EXPECT_NE(
      journal.find("{\"event\":\"start\",\"file\":\"good/base.apk\",\"path\":\"" +
                   directory_.path() + "/good/base.apk\",\"installed\":\"<install>/base.apk\"}"),
      std::string::npos)
      << journal;
  EXPECT_NE(journal.find("\"path\":\"<install>/lib/arm64/libvault.so\""), std::string::npos);
  for (const char* file : {"1.journal", "1.html", "1.text"}) {
    const std::string content = ContentOf(directory_ / file);
    EXPECT_EQ(content.find("apktoolkit-sim."), std::string::npos) << file;
    EXPECT_NE(content.find("lib/arm64/libvault.so"), std::string::npos) << file;
  }
}

// A file name that contains the placeholder <install> is shown unchanged. In the journal, a `path`
// begins with the placeholder only if the file is in the temporary directory. The `path` of the
// user's file begins with a slash.
TEST_F(ManyFiles, NameThatLooksLikeThePlaceholderIsShownUnchanged) {
  const ProcessResult run =
      Do("mkdir '<install>'; cp good/base.apk '<install>'/; sim --journal journal "
         "'<install>'/base.apk");
  EXPECT_EQ(Told(run), Lines({"SIGNED  <install>/base.apk", "-> 0"}));
  EXPECT_NE(ContentOf(directory_ / "journal")
                .find("\"path\":\"" + directory_.path() + "/<install>/base.apk\",\"installed\":"),
            std::string::npos);
}

// The list is the user's file, so no output may replace it.
TEST_F(ManyFiles, ListIsNotOverwritten) {
  const ProcessResult run =
      Do("echo good/base.apk >list; sim --files-from list --journal list; cat list");
  EXPECT_EQ(run.output, "good/base.apk\n");
  EXPECT_NE(run.errors, "");
}
