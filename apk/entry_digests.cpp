#include "apk/entry_digests.h"

#include <algorithm>
#include <utility>

#include "util/text.h"

namespace ApkTools {

namespace {

// What a section records of its entry. Each may be empty, for lack of the attribute.
struct Record {
  std::string_view name, digest_name, digest;
};

Record ReadRecord(const ManifestMf::Section& section);

}  // namespace

bool EntryDigests::Load(std::vector<uint8_t> text, ManifestMf& manifest) {
  const auto collect = [&](const ManifestMf::Section& section, size_t position) {
    Record record = ReadRecord(section);
    // The main section, which names no entry, is left out here as well.
    if (record.name.empty() || record.digest_name.empty() || record.digest.empty()) return;
    if (!manifest.holds(record.name)) record.name = joined_names_.emplace_front(record.name);
    entries_.push_back({record.name, position});
  };
  if (!manifest.load(std::move(text), collect)) return false;
  // Most manifests list the entries in the order of their names.
  if (!std::is_sorted(entries_.begin(), entries_.end())) {
    std::stable_sort(entries_.begin(), entries_.end());
  }
  return true;
}

bool EntryDigests::Find(const ManifestMf& manifest, std::string_view name, std::string& digest_name,
                        std::string& digest) const {
  // The last of equal names: a later section replaces an earlier one.
  const auto behind = std::upper_bound(entries_.begin(), entries_.end(), Entry{name, 0});
  if (behind == entries_.begin() || behind[-1].name != name) return false;
  const ManifestMf::Section section = manifest.readSection(behind[-1].section);
  const Record record = ReadRecord(section);
  digest_name = record.digest_name;
  digest = record.digest;
  return true;
}

namespace {

Record ReadRecord(const ManifestMf::Section& section) {
  Record record;
  for (const auto& [name, value] : section) {
    if (name == "Name") record.name = value;
    // Deliberate: of several digests the last in the order of names counts, so that "SHA1-Digest"
    // goes before "SHA-256-Digest". The signature file's are chosen in the same way.
    if (EndsWith(name, "-Digest")) {
      record.digest_name = name;
      record.digest = value;
    }
  }
  return record;
}

}  // namespace

}  // namespace ApkTools
