#include "apk/entry_digests.h"

#include <algorithm>
#include <utility>

namespace ApkTools {

namespace {

// The name and the value of the section's digest attribute. If the section has several, the last
// name in byte order counts. If it has none, both texts are empty.
ManifestMf::Section::value_type DigestOf(const ManifestMf::Section& section) {
  return section.findLastEndingIn("-Digest");
}

// std::hash is not used. Its unsigned arithmetic wraps, and older releases of the C++ library do
// not mark this as intended. A tool that is built with the sanitizer for unsigned overflow would
// therefore stop in std::hash.
size_t Hash(std::string_view name) {
  size_t hash = 0;
  for (const char c : name) hash = (hash << 9 | hash >> 55) ^ static_cast<uint8_t>(c);
  return hash;
}

}  // namespace

bool EntryDigests::Load(std::vector<uint8_t> text) {
  sections_.clear();
  hashes_.clear();
  return manifest_mf_.load(std::move(text));
}

void EntryDigests::List() {
  sections_.clear();
  hashes_.clear();
  const ManifestMf::Sections& sections = manifest_mf_.getSections();
  sections_.reserve(sections.size());
  std::string_view last;
  bool in_order = true;
  for (uint32_t i = 0; i < sections.size(); ++i) {
    const std::string_view name = NameOf(i);
    // Sections without a name are left out. The main section normally has no name.
    if (name.empty() || DigestOf(sections[i]).first.empty()) continue;
    in_order = in_order && last <= name;
    last = name;
    sections_.push_back(i);
  }
  // apksigner writes the sections in the order of their names. Other tools, such as jarsigner,
  // write the sections in the order of the archive's entries.
  if (!in_order) Sort();
}

bool EntryDigests::Find(std::string_view name, std::string& digest_name,
                        std::string& digest) const {
  auto first = sections_.begin(), last = sections_.end();
  if (!hashes_.empty()) {
    const auto equal = std::equal_range(hashes_.begin(), hashes_.end(), Hash(name));
    last = first + (equal.second - hashes_.begin());
    first += equal.first - hashes_.begin();
  }
  // Finds the last section of this name, because a later section replaces an earlier section of the
  // same name.
  const auto next = std::upper_bound(
      first, last, name,
      [this](std::string_view wanted, uint32_t section) { return wanted < NameOf(section); });
  if (next == first || NameOf(next[-1]) != name) return false;
  const auto [attribute, value] = DigestOf(manifest_mf_.getSections()[next[-1]]);
  digest_name = attribute;
  digest = value;
  return true;
}

// Fills hashes_, and sorts sections_ by the hashes of the names. Sections with equal hashes are
// sorted by their names, and then by their place in the text. Hashing reads each name once, which
// costs less than comparing names that are spread over the text.
void EntryDigests::Sort() {
  std::vector<std::pair<size_t, uint32_t>> hashed;
  hashed.reserve(sections_.size());
  for (const uint32_t section : sections_) hashed.emplace_back(Hash(NameOf(section)), section);
  std::sort(hashed.begin(), hashed.end(), [this](const auto& a, const auto& b) {
    if (a.first != b.first) return a.first < b.first;
    const int order = NameOf(a.second).compare(NameOf(b.second));
    return order != 0 ? order < 0 : a.second < b.second;
  });
  hashes_.reserve(hashed.size());
  for (size_t i = 0; i < hashed.size(); ++i) {
    hashes_.push_back(hashed[i].first);
    sections_[i] = hashed[i].second;
  }
}

std::string_view EntryDigests::NameOf(uint32_t section) const {
  return manifest_mf_.getSections()[section].find("Name");
}

}  // namespace ApkTools
