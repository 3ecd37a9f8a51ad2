#include "apk/manifest_mf.h"

#include <utility>

#include "apk/manifest_parser.h"

bool ManifestMf::load(std::vector<uint8_t> text) {
  text_ = std::move(text);
  sections_.reset(text_.data(), text_.size());
  valid_ = text_.size() <= UINT32_MAX && parse();
  return valid_;
}

bool ManifestMf::parse() { return ManifestParser(text_, sections_).parse(); }
