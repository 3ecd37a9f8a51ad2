#include "simulator/show/protection_bar.h"

#include <algorithm>
#include <string_view>

#include "simulator/show/words.h"

namespace simulator {

namespace {

// Returns the number of bytes in the file that belong to no entry. Overlapping entries can together
// have more bytes than the file. The number is then 0.
Share Between(const Protection& protection, uint64_t file_size) {
  uint64_t rest = file_size;
  for (const Share* share : {&protection.verified, &protection.vouched, &protection.differing,
                             &protection.uncompared, &protection.unlisted, &protection.signature}) {
    rest -= std::min(rest, share->bytes);
  }
  return {0, rest};
}

}  // namespace

std::vector<DrawnPart> DrawBar(const Protection& protection, uint64_t file_size) {
  constexpr double kLeast = 0.75;  // percent of the bar's width, for each part that has bytes
  std::vector<DrawnPart> parts = {
      {"verified", kVerifiedWord, "dex and native libraries, compared with the manifest", true,
       protection.verified, 0, 0, 0},
      {"vouched", kVouchedWord, "match the manifest: compared by the simulator, not by the tool",
       true, protection.vouched, 0, 0, 0},
      {"differing", kDifferingWord, "changed after signing: the manifest has another digest", true,
       protection.differing, 0, 0, 0},
      {"uncompared", kUncomparedWord,
       "damaged, too long, without a supported digest, or not reached in time", true,
       protection.uncompared, 0, 0, 0},
      {"missing",
       kMissingWord,
       "removed after signing: the manifest still lists them",
       true,
       {protection.missing_names.size(), 0},
       0,
       0,
       0},
      {"unlisted", kUnlistedWord, "no digest in the manifest: anyone can change them", true,
       protection.unlisted, 0, 0, 0},
      {"signature", "the signature itself", "manifest, signature files and their blocks", true,
       protection.signature, 0, 0, 0},
      {"between", "between the entries", "headers, directory, padding, newer signing block", false,
       Between(protection, file_size), 0, 0, 0}};
  // A part that stands for a fault is drawn only if the package has this fault.
  parts.erase(
      std::remove_if(parts.begin(), parts.end(),
                     [](const DrawnPart& part) {
                       const std::string_view code = part.code;
                       return part.share.entries == 0 &&
                              (code == "differing" || code == "uncompared" || code == "missing");
                     }),
      parts.end());
  double all = 0;
  size_t entries = 0;
  double free_width = 100;
  for (const DrawnPart& part : parts) {
    all += static_cast<double>(part.share.bytes);
    entries += part.share.entries;
    if (part.share.bytes > 0) free_width -= kLeast;
  }
  if (entries == 0) return {};
  double start = 0;
  for (DrawnPart& part : parts) {
    part.start = start;
    if (part.share.bytes == 0) continue;
    const double share = static_cast<double>(part.share.bytes) / all;
    part.percent = 100 * share;
    part.width = kLeast + free_width * share;
    start += part.width;
  }
  return parts;
}

}  // namespace simulator
