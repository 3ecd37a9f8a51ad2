// The entries of a zip archive. They are read with the platform's own zip library and the tool's
// code, as in the tool. A hostile entry could use up the memory, so Read() and ReadToCompare()
// refuse entries that are too long. The first Archive silences the log in the whole process: the
// messages of the library and of the tool's code are dropped.
//
// The library maps a part of the file into memory. If the file becomes shorter while an Archive
// exists, pages beyond the new end read as zeros. HasShrunk() is true after such a read. Both
// statements hold only in the thread that made the Archive (simulator/package/shrinking.h).
#pragma once

#include <ziparchive/zip_archive.h>

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include "simulator/package/archive_directory.h"
#include "simulator/package/shrinking.h"
#include "util/text.h"

namespace simulator {

inline constexpr char kAndroidManifestName[] = "AndroidManifest.xml";

// The prefix and the suffix of the names of one kind of entries.
struct EntryNames {
  const char* prefix;
  const char* suffix;

  bool Has(const std::string& name) const {
    return name.rfind(prefix, 0) == 0 && EndsWith(name, suffix);
  }
};

inline constexpr EntryNames kAllNames = {"", ""};
inline constexpr EntryNames kLibraryNames = {"lib/", ".so"};
inline constexpr EntryNames kSignatureFileNames = {"META-INF/", ".SF"};

// The entries of one kind, in the order in which the zip library returns them to the tool.
struct ArchiveWalk {
  std::vector<std::string> names;  // without those of damaged entries
  // The number of these names that the tool reaches. The tool stops at the first damaged entry
  // of this kind.
  size_t met = 0;
};

class Archive {
 public:
  // Read() refuses entries with more bytes of uncompressed data.
  static constexpr uint32_t kLongestRead = 64 << 20;

  // ReadToCompare() refuses entries with more bytes of uncompressed data.
  static constexpr uint32_t kLongestCompared = 512 << 20;

  enum class ReadResult { kRead, kMissing, kDamaged, kTooLong };

  // Opens the archive in the open file `fd`. The caller owns `fd` and keeps it open while this
  // object exists. `result` is the library's code, 0 for success. If it is not 0, no other function
  // may be called. Only one thread may use the object.
  Archive(int fd, int32_t* result);
  ~Archive();
  Archive(const Archive&) = delete;
  Archive& operator=(const Archive&) = delete;

  // All entries, in the order of the central directory.
  std::vector<ArchiveEntry> Entries() const;
  ArchiveWalk Walk(const EntryNames& names) const;

  // True if the archive has an entry with this name, even if it cannot be extracted.
  bool Has(const std::string& name) const;
  // Extracts the whole entry as the tool does. Changes `content` only if the result is kRead.
  ReadResult Read(const std::string& name, std::vector<uint8_t>* content);
  // Like Read(), but for entries of up to kLongestCompared bytes. Does not add to too_long().
  ReadResult ReadToCompare(const std::string& name, std::vector<uint8_t>* content) const;
  // The names of the entries that Read() has refused so far, because they are too long.
  const std::vector<std::string>& too_long() const { return too_long_; }
  // Passes the uncompressed data of the entry to `take`, part by part, until `take` returns false.
  // Returns false if `take` returned false, or if the entry cannot be read to its end.
  bool Stream(const std::string& name,
              const std::function<bool(std::string_view part)>& take) const;

  bool HasShrunk() const { return guard_.HasShrunk(); }

 private:
  ReadResult ReadUpTo(uint32_t most, const std::string& name, std::vector<uint8_t>* content) const;

  const ShrinkGuard guard_;
  const int fd_;
  ZipArchiveHandle handle_ = nullptr;
  std::vector<std::string> too_long_;
};

}  // namespace simulator
