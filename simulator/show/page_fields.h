// Shared by the parts of the page: texts that are fit to be shown, and lists of bounded length.
#pragma once

#include <algorithm>
#include <cstdint>
#include <kainjow/mustache.hpp>
#include <string>
#include <string_view>

#include "simulator/verdict/report.h"

namespace simulator {

// Of each file at most so many lines of a kind are shown. The rest are counted. If items are left
// out, the refused ones go first.
inline constexpr size_t kMostPageLines = 200;
// Of a text that came from a file at most so many bytes are shown, with "…" for the rest, before
// they are escaped.
inline constexpr size_t kMostPageText = 400;
// The same in the table of files, where the file's own part has more.
inline constexpr size_t kMostCellText = 120;

// Nothing is shown that would deceive the eye. Characters that HTML gives a meaning are escaped
// where the template is filled in.
kainjow::mustache::data Shown(std::string_view bytes);

// The beginning of what is too long, without a part of a character at its end.
std::string Short(std::string_view bytes, size_t most = kMostPageText);
Reason Short(Reason reason);
Item Short(Item item);

// A section of the template that is shown or not, without fields of its own.
kainjow::mustache::list OneIf(bool condition);

// Such as "1,234,567".
std::string Grouped(uint64_t number);

// Sets the section "NAME_shown" with the section `name` in it: what `make` makes of the first
// lines, and how many there are beyond them.
template <typename Lines, typename Make>
void AddLines(const std::string& name, const Lines& lines, const std::string& remark, Make make,
              kainjow::mustache::data* file) {
  using kainjow::mustache::list;
  list made;
  while (made.size() < std::min(lines.size(), kMostPageLines)) {
    made.push_back(kainjow::mustache::data(make(lines[made.size()])));
  }
  const size_t hidden = lines.size() - made.size();
  const std::string text = Grouped(hidden) + " more" + (remark.empty() ? "" : "; " + remark);
  file->set(name + "_shown", OneIf(!made.empty()));
  file->set(name, made);
  file->set(name + "_count", Shown(Grouped(lines.size())));
  file->set(name + "_more", hidden > 0 ? list{{"more", Shown(text)}} : list());
}

}  // namespace simulator
