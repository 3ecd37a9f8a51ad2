// Runs the simulator on a package, and returns the first lines of the simulator's output.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <string>
#include <vector>

#include "support/files.h"
#include "support/process.h"
#include "support/simulation.h"

using Lines = std::vector<std::string>;

inline constexpr char kSigned[] =
    "  ✓ package                signed with the payload of the signer's key";

inline std::string ByRsa2048() {
  return "   com.example.vault   signer CN=rsa-2048, O=Example, RSA-2048, key 98302ce8…f64646";
}

inline constexpr size_t kAll = 1000;

// Returns the first `lines` lines of `all`, and the last line of `all`, which is the status. The
// first line is the verdict's line. If later lines start with a cross (✗), the verdict's line
// repeats the reason that the first of them gives. This function checks the repeated reason. It
// then removes this reason, and all text after the reason, from the verdict's line.
inline Lines WithoutReason(size_t lines, Lines all) {
  const auto is_cross = [](const std::string& line) { return line.rfind("  ✗ ", 0) == 0; };
  const auto cross = std::find_if(all.begin(), all.end(), is_cross);
  if (cross != all.end()) {
    const size_t file = all[0].find("  ") + 2;
    const size_t reason = all[0].find("   ", file);
    EXPECT_NE(reason, std::string::npos) << all[0];
    const size_t end = std::min(all[0].find("   ", reason + 3), all[0].size());
    std::string why = all[0].substr(reason + 3, end - reason - 3);
    if (why.rfind("lib/", 0) == 0) {
      EXPECT_EQ(cross->find(why.substr(0, why.find(": "))), std::string("  ✗ ").size());
      why = why.substr(why.find(": ") + 2);
    }
    EXPECT_EQ(cross->substr(cross->size() - std::min(cross->size(), why.size())), why);
    EXPECT_NE(why, "");
    all[0].resize(reason);
  }
  const std::string status = all.back();
  all.resize(std::min(all.size() - 1, lines));
  all.push_back(status);
  return all;
}

// A test with a directory of its own. The test runs the simulator in this directory, usually on a
// copy of a package that make_golden_packages made.
class Reason : public testing::Test {
 protected:
  // Copies a result of make_golden_packages into the test's directory. If `name` is a package, its
  // copy is named base.apk. If `name` is a directory, all its files are copied: a package named
  // base.apk, the package's extracted libraries if it has any, and often other files.
  void Take(const std::string& name) {
    const std::filesystem::path source = std::filesystem::path(GOLDEN_PACKAGES) / name;
    if (std::filesystem::is_directory(source)) {
      std::filesystem::copy(source, directory_.path(), std::filesystem::copy_options::recursive);
    } else {
      std::filesystem::copy_file(source, directory_ / "base.apk");
    }
  }

  // Runs a shell command in the test's directory. The test fails if the command fails.
  void Do(const std::string& command) const {
    const ProcessResult run = RunProcess({"bash", "-e", "-c", command}, directory_.path());
    ASSERT_EQ(run.status, 0) << run.errors;
  }

  Lines Told(size_t lines, const Lines& options = {}, const std::string& file = "base.apk",
             const Lines& before = {}) const {
    Lines words = options;
    words.push_back(file);
    return WithoutReason(lines, FirstLines(kAll, words, {before, directory_.path()}));
  }

  const TempDir directory_;
};
