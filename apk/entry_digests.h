// The digests that the manifest records for entries: the manifest itself, and an ordered map from
// an entry's name to its digest attribute's name and value. Sections that lack one of the three are
// left out. Only the manifest's parser logs.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "apk/manifest_mf.h"

namespace ApkTools {

class EntryDigests {
 public:
  // Forgets everything and loads the manifest. Returns false if the text does not parse.
  bool Load(std::vector<uint8_t> text);
  // Lists the digests of the loaded manifest's sections. Before this call no entry is found.
  void List();
  // Returns false, with both texts untouched, if no digest is listed for the entry of this name.
  bool Find(std::string_view name, std::string& digest_name, std::string& digest) const;

 private:
  void Sort();
  std::string_view NameOf(uint32_t section) const;

  ManifestMf manifest_mf_;
  // The numbers of the sections that count, ordered by entry name (bytes), then by place in the
  // text. If the text was not in this order, they are ordered first by the hashes of the names,
  // which are then in hashes_.
  std::vector<uint32_t> sections_;
  std::vector<size_t> hashes_;
};

}  // namespace ApkTools
