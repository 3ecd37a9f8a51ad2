// Which digest the manifest records for which entry: an ordered map from an entry's name to the
// name and the value of its digest attribute, of the sections that have all three. It points into
// the manifest, which is not to be loaded again while the map is used. Nothing is logged.
#pragma once

#include <cstddef>
#include <cstdint>
#include <forward_list>
#include <string>
#include <string_view>
#include <vector>

#include "apk/manifest_mf.h"

namespace ApkTools {

class EntryDigests {
 public:
  // Loads `manifest` with `text` and collects what its sections record, in an empty map. False
  // when the text does not parse; the map is of no use then.
  bool Load(std::vector<uint8_t> text, ManifestMf& manifest);

  // False, with both texts untouched, when there is none for the entry of this name. `manifest`:
  // the one that was loaded, which may have been moved.
  bool Find(const ManifestMf& manifest, std::string_view name, std::string& digest_name,
            std::string& digest) const;

 private:
  struct Entry {
    std::string_view name;
    size_t section;  // its position in the manifest
    bool operator<(const Entry& other) const { return name < other.name; }
  };

  std::vector<Entry> entries_;  // in byte order of the names, equal ones in the order of the text
  std::forward_list<std::string> joined_names_;
};

}  // namespace ApkTools
