// Shared by the parts of the page: texts that are safe to show, and lists of limited length.
#pragma once

#include <algorithm>
#include <cstdint>
#include <kainjow/mustache.hpp>
#include <string>
#include <string_view>

#include "simulator/verdict/report.h"

namespace simulator {

// At most this many lines of each list are shown for a file. The other lines are only counted. If
// a report has more items than this, the refused items are shown first.
inline constexpr size_t kMostPageLines = 200;
// At most this many bytes of a text from a file are shown, with "…" for the rest. Bytes are counted
// before the text is escaped.
inline constexpr size_t kMostPageText = 400;
// The limit for the package name and the signer's name in the table of files. The file's own part
// of the page shows more.
inline constexpr size_t kMostCellText = 120;

// Replaces characters that could mislead the reader. The special characters of HTML are escaped
// when the template is filled in.
kainjow::mustache::data Shown(std::string_view bytes);

// Cuts a text that is too long, but not inside a UTF-8 character.
std::string Short(std::string_view bytes, size_t most = kMostPageText);
Reason Short(Reason reason);
Item Short(Item item);

// The value of a section of the template. The section is shown once if `condition` is true, and
// otherwise not at all.
kainjow::mustache::list OneIf(bool condition);

// The number in groups of three digits, such as "1,234,567".
std::string Grouped(uint64_t number);

// Sets the fields of `file` that show a list of lines. NAME is the value of `name`:
//   NAME_shown  a section that is shown if there are lines
//   NAME        the fields that `make` returns, for each of the first kMostPageLines lines
//   NAME_count  the number of all lines
//   NAME_more   a section with the number of lines that are left out, and then `remark`. It is
//               shown only if lines are left out.
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
