// Finds the digest that a JAR manifest lists for an entry. An EntryDigests owns the manifest's text
// and an index, in which it looks up the section that has the entry's name. The index leaves out
// sections without a name or without a digest attribute. If several sections of the index have the
// same name, the last section counts. Only Load logs: the messages of ManifestMf::load.
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
  // Fills the index from the loaded manifest. Before this call, Find returns false for every name.
  void List();
  // Stores the name of the entry's digest attribute in `digest_name`, and its value in `digest`.
  // Returns false, and changes neither text, if no digest is listed for the entry `name`.
  bool Find(std::string_view name, std::string& digest_name, std::string& digest) const;

 private:
  void Sort();
  std::string_view NameOf(uint32_t section) const;

  ManifestMf manifest_mf_;
  // The index: the numbers of its sections, counted from 0 in the order of the text. If the names
  // of these sections are in byte order in the text, sections_ has the order of the text, and
  // hashes_ is empty. Otherwise sections_ is sorted by the hash of the name, then by the name, then
  // by the section's number. In that case, hashes_[i] is the hash of the name of sections_[i].
  std::vector<uint32_t> sections_;
  std::vector<size_t> hashes_;
};

}  // namespace ApkTools
