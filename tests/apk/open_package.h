// A package, JAR or any other file in memory, opened as the tool opens it.
#pragma once

#include <string>

#include "apk/apk.h"
#include "support/package.h"
#include "support/temp_dir.h"

struct OpenPackage {
  explicit OpenPackage(const Bytes& content) : file(content), apk(file.fd()) {}
  explicit OpenPackage(const Package& package) : OpenPackage(package.Build()) {}
  explicit OpenPackage(const PackageOptions& options) : OpenPackage(SignPackage(options)) {}

  MemoryFile file;
  ApkTools::Apk apk;
};

// A file on disk with this content, in a folder of its own.
class DiskFile {
 public:
  explicit DiskFile(const Bytes& content) : path_(folder_.File("file")) {
    WriteFile(path_, content);
  }
  const std::string& path() const { return path_; }

 private:
  TempDir folder_;
  std::string path_;
};
