// The sections of a manifest, as one flat table. An attribute is two pieces of a text that the
// caller owns; a section is a sequence of attributes. No string is copied, and nothing is logged.
#pragma once

#include <cstddef>
#include <cstdint>
#include <iterator>
#include <string_view>
#include <utility>
#include <vector>

// A piece of the text: its offset and its length, in bytes. 32 bits are enough, because
// ManifestMf::load refuses a text of 4 GiB or more. 32 bits also keep the table small: a large
// manifest has several hundred thousand pieces.
struct ManifestPiece {
  uint32_t start = 0;
  uint32_t length = 0;
};

struct ManifestAttribute {
  ManifestPiece name;
  ManifestPiece value;
};

// Iterates over a range by index. operator* makes the element at the index.
template <typename Range>
class ElementIterator {
 public:
  using iterator_category = std::forward_iterator_tag;
  using value_type = typename Range::value_type;
  using difference_type = ptrdiff_t;
  using pointer = const value_type*;
  using reference = value_type;

  ElementIterator(const Range* range, size_t index) : range_(range), index_(index) {}
  value_type operator*() const { return (*range_)[index_]; }
  ElementIterator& operator++() {
    ++index_;
    return *this;
  }
  bool operator==(const ElementIterator& other) const { return index_ == other.index_; }
  bool operator!=(const ElementIterator& other) const { return index_ != other.index_; }

 private:
  const Range* range_;
  size_t index_;
};

// An ordered map from the names of attributes to their values, in byte order of the names. Of
// attributes with equal names, the map has only the last in the text. Names and values are never
// empty.
class ManifestSection {
 public:
  // Name and value.
  using value_type = std::pair<std::string_view, std::string_view>;

  ManifestSection(const char* text, const ManifestAttribute* attributes, size_t size)
      : text_(text), attributes_(attributes), size_(size) {}

  size_t size() const { return size_; }
  value_type operator[](size_t index) const;
  ElementIterator<ManifestSection> begin() const { return {this, 0}; }
  ElementIterator<ManifestSection> end() const { return {this, size_}; }

  // The value of the attribute `name`; empty if the section has no such attribute.
  std::string_view find(std::string_view name) const;
  // The attribute whose name ends in `suffix`. If several names do, the last name in byte order
  // counts. If no name does, the result is two empty texts.
  value_type findLastEndingIn(std::string_view suffix) const;

 private:
  const char* text_;
  const ManifestAttribute* attributes_;
  size_t size_;
};

// All sections in the order of the text.
class ManifestSections {
 public:
  using value_type = ManifestSection;

  size_t size() const { return ends_.size(); }
  ManifestSection operator[](size_t index) const;
  ElementIterator<ManifestSections> begin() const { return {this, 0}; }
  ElementIterator<ManifestSections> end() const { return {this, size()}; }

  // The parser calls the three functions below to fill the table. reset removes all sections and
  // opens an empty section. Attributes that are added afterwards must be pieces of the `size` bytes
  // at `text`.
  void reset(const uint8_t* text, size_t size);
  // Adds an attribute to the open section. Neither the attribute's name nor its value may be empty.
  // The next sort of the section drops an attribute if a later attribute has the same name.
  void add(const ManifestAttribute& attribute);
  // Sorts and ends the open section, which may be empty, and opens the next section. Only ended
  // sections are visible.
  void endSection();

 private:
  // add() also sorts the open section from time to time, so that repeated names do not fill the
  // memory. After such a sort, add() does not sort the section again within this many bytes of
  // text.
  static constexpr size_t kLittleText = 1024;

  size_t openStart() const { return ends_.empty() ? 0 : ends_.back(); }
  void order();

  const char* text_ = nullptr;
  std::vector<ManifestAttribute> attributes_;
  std::vector<uint32_t> ends_;      // the index in attributes_ at which each section ends
  size_t next_sort_ = kLittleText;  // add() sorts if an attribute starts at or after this offset
};
