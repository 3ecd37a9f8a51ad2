// Which digest the manifest records for which entry: the manifest itself, and an ordered map from
// an entry's name to the name and the value of its digest attribute, of the sections that have all
// three. Only the manifest's parser logs.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "apk/manifest_mf.h"

namespace ApkTools {

class EntryDigests {
 public:
  // Forgets everything and loads the manifest. False when the text does not parse.
  bool Load(std::vector<uint8_t> text);
  // Lists what the loaded manifest's sections record; until then no entry is found.
  void List();
  // False, with both texts untouched, when nothing is listed for the entry of this name.
  bool Find(std::string_view name, std::string& digest_name, std::string& digest) const;

 private:
  void Sort();
  std::string_view NameOf(uint32_t section) const;

  ManifestMf manifest_mf_;
  // The numbers of the sections that count, in byte order of the entries' names, those of equal
  // names in the order of the text. Unless the text has them so, they are first of all in the order
  // of the hashes of the names, which are then in hashes_.
  std::vector<uint32_t> sections_;
  std::vector<size_t> hashes_;
};

}  // namespace ApkTools
