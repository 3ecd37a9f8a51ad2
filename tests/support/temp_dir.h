// A folder of the test's own, gone with everything in it when the test is over.
#pragma once

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

class TempDir {
 public:
  TempDir() : path_(testing::TempDir() + "apktoolkit.XXXXXX") {
    if (mkdtemp(path_.data()) == nullptr) {
      perror(path_.c_str());
      abort();
    }
  }
  ~TempDir() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
  }
  TempDir(const TempDir&) = delete;
  TempDir& operator=(const TempDir&) = delete;

  // Without a "/" at the end.
  const std::string& path() const { return path_; }
  // The path of `name` in the folder; the folders on the way to it are made.
  std::string File(const std::string& name) const {
    const std::filesystem::path file = std::filesystem::path(path_) / name;
    std::filesystem::create_directories(file.parent_path());
    return file;
  }

 private:
  std::string path_;
};
