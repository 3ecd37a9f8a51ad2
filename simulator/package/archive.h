// The entries of a zip archive, by the platform's own zip library, which is the one that the tool
// reads it with: the same entries, in the same order. Nobody vouches for the file, so what is read
// is bounded. What the library logs goes nowhere.
#pragma once

#include <ziparchive/zip_archive.h>

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace simulator {

struct ArchiveEntry {
  std::string name;  // any bytes
  uint64_t size;     // what its data takes in the archive
  uint64_t length;   // what it says that it extracts to
  bool is_stored;    // not compressed
};

class Archive {
 public:
  // Opens the file that is open as `fd` and stays so as long as this object lives. `result` is the
  // library's code, 0 for success; without that nothing may be called.
  Archive(int fd, int32_t* result);
  ~Archive();
  Archive(const Archive&) = delete;
  Archive& operator=(const Archive&) = delete;

  // Those entries whose names begin and end so, in the order in which the tool meets them.
  std::vector<ArchiveEntry> Entries(std::string_view prefix = "",
                                    std::string_view suffix = "") const;

  // Whether there is an entry of this name, be it one that cannot be extracted.
  bool Has(const std::string& name) const;
  // The whole entry; none when there is no such entry, when it cannot be extracted, or when it is
  // longer than `most`.
  std::optional<std::string> Read(const std::string& name, uint64_t most) const;
  // The entry, part by part, until `take` answers false. False when it did not come to its end.
  bool Stream(const std::string& name,
              const std::function<bool(std::string_view part)>& take) const;

 private:
  ZipArchiveHandle handle_ = nullptr;
};

}  // namespace simulator
