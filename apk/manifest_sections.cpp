#include "apk/manifest_sections.h"

#include <algorithm>

#include "util/text.h"

namespace {

std::string_view View(const char* text, const ManifestPiece& piece) {
  return {text + piece.start, piece.length};
}

}  // namespace

ManifestSection::value_type ManifestSection::operator[](size_t index) const {
  return {View(text_, attributes_[index].name), View(text_, attributes_[index].value)};
}

std::string_view ManifestSection::find(std::string_view name) const {
  const ManifestAttribute* const end = attributes_ + size_;
  const ManifestAttribute* const found = std::lower_bound(
      attributes_, end, name, [this](const ManifestAttribute& attribute, std::string_view wanted) {
        return View(text_, attribute.name) < wanted;
      });
  if (found == end || View(text_, found->name) != name) return {};
  return View(text_, found->value);
}

// Deliberate: if a section has several digests, the last in the byte order of their names counts.
// "SHA1-Digest" therefore wins over "SHA-256-Digest" for an entry, and "SHA1-Digest-Manifest" over
// "SHA-256-Digest-Manifest" for the whole manifest. Packages with SHA-1 and SHA-256 digests have
// always been verified by this rule.
ManifestSection::value_type ManifestSection::findLastEndingIn(std::string_view suffix) const {
  for (size_t i = size_; i > 0; --i) {
    if (EndsWith(View(text_, attributes_[i - 1].name), suffix)) return (*this)[i - 1];
  }
  return {};
}

ManifestSection ManifestSections::operator[](size_t index) const {
  const size_t start = index == 0 ? 0 : ends_[index - 1];
  return {text_, attributes_.data() + start, ends_[index] - start};
}

void ManifestSections::reset(const uint8_t* text, size_t size) {
  // Reserves the memory of attributes_ in advance, because a growing vector needs its old and its
  // new memory at the same time. Reserved memory is only a range of addresses: the system provides
  // each page when the page is first written. Most attributes take at least kShortAttribute bytes
  // of text, so attributes_ rarely grows beyond the reserved memory. kManyAttributes is enough for
  // two attributes of each of the 65,535 entries that an archive without zip64 can have.
  constexpr size_t kShortAttribute = 32;
  constexpr size_t kManyAttributes = 1 << 17;
  text_ = reinterpret_cast<const char*>(text);
  attributes_.clear();
  attributes_.reserve(std::min(size / kShortAttribute, kManyAttributes));
  ends_.clear();
  next_sort_ = kLittleText;
}

// Sorts the open section if the new attribute starts at or after the offset next_sort_. The sort
// drops repeated names, which could otherwise fill the table. Each sort compares all names of the
// section. To save time, the next sort waits for more text: at least kLittleText bytes. For each
// name that is still in the section, it also waits for as many bytes as the name has, and for
// kTwoAttributes more. kTwoAttributes is the length of two short attributes, such as "A: b", with
// their line ends.
void ManifestSections::add(const ManifestAttribute& attribute) {
  constexpr size_t kTwoAttributes = 10;
  attributes_.push_back(attribute);
  if (attribute.name.start < next_sort_) return;
  order();
  next_sort_ = attribute.name.start + kLittleText;
  for (size_t i = openStart(); i < attributes_.size(); ++i) {
    next_sort_ += attributes_[i].name.length + kTwoAttributes;
  }
}

void ManifestSections::endSection() {
  order();
  ends_.push_back(static_cast<uint32_t>(attributes_.size()));
  next_sort_ = kLittleText + (attributes_.empty() ? 0 : attributes_.back().name.start);
}

// Sorts the open section by name. Of attributes with equal names, keeps only the last one in the
// text.
void ManifestSections::order() {
  const auto name = [this](const ManifestAttribute& a) { return View(text_, a.name); };
  const auto is_out_of_order = [&](const ManifestAttribute& a, const ManifestAttribute& b) {
    return name(a) >= name(b);
  };
  const auto first = attributes_.begin() + static_cast<ptrdiff_t>(openStart());
  const auto last = attributes_.end();
  if (std::adjacent_find(first, last, is_out_of_order) == last) return;

  std::sort(first, last, [&](const ManifestAttribute& a, const ManifestAttribute& b) {
    const int order = name(a).compare(name(b));
    return order != 0 ? order < 0 : a.name.start < b.name.start;
  });
  const auto kept = std::unique(
      std::make_reverse_iterator(last), std::make_reverse_iterator(first),
      [&](const ManifestAttribute& a, const ManifestAttribute& b) { return name(a) == name(b); });
  attributes_.erase(first, kept.base());
}
