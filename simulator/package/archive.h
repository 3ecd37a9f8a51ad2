// The entries of a zip archive, by the platform's own zip library and the tool's way to it: the
// same entries, in the same order. Nobody vouches for the file, so each reading has a bound. Log
// messages of the library and of the tool's code are dropped here.
//
// The library maps a part of the file into memory. Should the file become shorter meanwhile, the
// missing part reads as zeros while an Archive lives, and HasShrunk() tells.
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

// How the names of entries of a kind begin and end.
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

// Entries of a kind, in the order in which the tool meets them.
struct ArchiveWalk {
  std::vector<std::string> names;  // of all but the damaged ones
  // How many of them the tool meets. Its walk ends at the first entry that is damaged.
  size_t met = 0;
};

class Archive {
 public:
  // Longer entries are not read to explain anything, in bytes.
  static constexpr uint32_t kLongestRead = 64 << 20;

  // Longer entries are not compared with the manifest, in bytes.
  static constexpr uint32_t kLongestCompared = 512 << 20;

  enum class ReadResult { kRead, kMissing, kDamaged, kTooLong };

  // Opens the file that is open as `fd` and stays so as long as this object lives. `result` is the
  // library's code, 0 for success; without that nothing may be called. One thread uses the object.
  Archive(int fd, int32_t* result);
  ~Archive();
  Archive(const Archive&) = delete;
  Archive& operator=(const Archive&) = delete;

  // All entries, in the order of the central directory.
  std::vector<ArchiveEntry> Entries() const;
  ArchiveWalk Walk(const EntryNames& names) const;

  // Whether there is an entry of this name, be it one that cannot be extracted.
  bool Has(const std::string& name) const;
  // The whole entry as the tool extracts it. `content` is changed by kRead alone.
  ReadResult Read(const std::string& name, std::vector<uint8_t>* content);
  // The same for longer ones, up to kLongestCompared; too_long() does not name them.
  ReadResult ReadToCompare(const std::string& name, std::vector<uint8_t>* content) const;
  // Those that were too long to be read so far.
  const std::vector<std::string>& too_long() const { return too_long_; }
  // The entry, part by part, until `take` answers false. False when it did not come to its end.
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
