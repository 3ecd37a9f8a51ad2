// The digests that the manifest records for entries. The object contains the manifest, and an
// ordered map from each entry's name to the name and the value of its digest attribute. A section
// that lacks one of these three texts is left out. Only the manifest's parser logs.
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
  // Lists the digests of the loaded manifest's sections. Before this call, Find returns false for
  // every name.
  void List();
  // Returns false, with both texts untouched, if no digest is listed for the entry of this name.
  bool Find(std::string_view name, std::string& digest_name, std::string& digest) const;

 private:
  void Sort();
  std::string_view NameOf(uint32_t section) const;

  ManifestMf manifest_mf_;
  // The indexes of the listed sections. If the text has its names in byte order, the indexes are in
  // the order of the text, and hashes_ is empty. Otherwise the indexes are sorted by the hash of
  // the name, then by the name, then by the place in the text. hashes_ then contains the hash for
  // each element of sections_.
  std::vector<uint32_t> sections_;
  std::vector<size_t> hashes_;
};

}  // namespace ApkTools
