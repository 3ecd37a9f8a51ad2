// An open archive with one entry, in memory. `entry` is this entry as the zip library finds it.
#pragma once

#include <gtest/gtest.h>

#include "apk/zip_library.h"
#include "support/files.h"
#include "support/zip.h"

class OpenEntry {
 public:
  explicit OpenEntry(const ZipItem& item) : file_(BuildZip({item})) {
    EXPECT_EQ(OpenArchiveFd(file_.fd(), "test", &handle, false), 0);
    EXPECT_EQ(ApkTools::FindZipEntry(handle, item.name, &entry), 0);
  }
  ~OpenEntry() { CloseArchive(handle); }

  ZipArchiveHandle handle = nullptr;
  ZipEntry entry = {};

 private:
  MemoryFile file_;
};
