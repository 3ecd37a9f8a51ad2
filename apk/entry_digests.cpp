#include "apk/entry_digests.h"

#include <algorithm>
#include <utility>

namespace ApkTools {

namespace {

// Name and value of the digest attribute that counts.
ManifestMf::Section::value_type DigestOf(const ManifestMf::Section& section) {
  return section.findLastEndingIn("-Digest");
}

}  // namespace

bool EntryDigests::Load(std::vector<uint8_t> text) {
  sections_.clear();
  return manifest_mf_.load(std::move(text));
}

void EntryDigests::List() {
  const ManifestMf::Sections& sections = manifest_mf_.getSections();
  sections_.reserve(sections.size());
  std::string_view last;
  bool in_order = true;
  for (uint32_t i = 0; i < sections.size(); ++i) {
    const std::string_view name = NameOf(i);
    // The main section, which names no entry, is left out here as well.
    if (name.empty() || DigestOf(sections[i]).first.empty()) continue;
    in_order = in_order && last <= name;
    last = name;
    sections_.push_back(i);
  }
  // As most manifests have them.
  if (!in_order) Sort();
}

bool EntryDigests::Find(std::string_view name, std::string& digest_name,
                        std::string& digest) const {
  // The last of equal names: a later section replaces an earlier one.
  const auto next = std::upper_bound(
      sections_.begin(), sections_.end(), name,
      [this](std::string_view wanted, uint32_t section) { return wanted < NameOf(section); });
  if (next == sections_.begin() || NameOf(next[-1]) != name) return false;
  const auto [attribute, value] = DigestOf(manifest_mf_.getSections()[next[-1]]);
  digest_name = attribute;
  digest = value;
  return true;
}

void EntryDigests::Sort() {
  std::vector<std::pair<std::string_view, uint32_t>> named;
  for (const uint32_t section : sections_) named.emplace_back(NameOf(section), section);
  std::sort(named.begin(), named.end());
  for (size_t i = 0; i < named.size(); ++i) sections_[i] = named[i].second;
}

std::string_view EntryDigests::NameOf(uint32_t section) const {
  return manifest_mf_.getSections()[section].find("Name");
}

}  // namespace ApkTools
