// A package, JAR or any other file in memory, opened as the tool opens it.
#pragma once

#include "apk/apk.h"
#include "support/files.h"
#include "support/package.h"

struct OpenPackage {
  explicit OpenPackage(const Bytes& content) : file(content), apk(file.fd()) {}
  explicit OpenPackage(const Package& package) : OpenPackage(package.Build()) {}
  explicit OpenPackage(const PackageOptions& options) : OpenPackage(MakePackage(options)) {}

  MemoryFile file;
  ApkTools::Apk apk;
};
