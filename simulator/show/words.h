// The words of a report, for the terminal and the page alike. Names and details in them come from
// the files as they are. The caller makes them fit to be shown.
#pragma once

#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "simulator/verdict/report.h"
#include "simulator/verdict/wording.h"

namespace simulator {

// The meaning of a verdict for its reader.
enum class Mood { kGood, kMixed, kBad };

struct VerdictWords {
  const char* code;  // for programs
  const char* word;
  const char* one;  // in the summary, after a number
  const char* many;
  Mood mood;
};

const VerdictWords& WordsOf(Verdict verdict);

// "good", "mixed" or "bad", for programs.
const char* MoodCode(Mood mood);

// Such as "3 files: 1 signed, 2 refused". Of a run that was interrupted also that it was, and
// before how many more files: `unseen`.
std::string Summary(const std::vector<Verdict>& verdicts, std::optional<size_t> unseen = {});

// Whose package it is: its name, the signer and his key, and, where phones install it for another,
// that one. `ellipsis` stands in the midst of a digest.
std::vector<std::string> OwnerFacts(const Report& report, const char* ellipsis);

// The JAR signer and his key, such as "CN=Vault, RSA-2048, key 98302ce8…f64646".
std::string SignerText(const Report& report, const char* ellipsis);

// For whom phones install it, if that is another than the JAR signer; else empty.
std::string OtherOwnerText(const Report& report);

// The warnings that are alarms.
std::vector<std::string> AlarmFacts(const Report& report);

// Why the verdict is not better: the reason of the item that it comes from; empty if nothing was
// refused.
std::string DecisiveReason(const Report& report);

// The line of the verdict has these behind the file: the decisive reason, or else whose package it
// is; then a signer who was not expected, the alarms, and the number of all warnings.
std::vector<std::string> HeadFacts(const Report& report, const char* ellipsis);

// The mark before a line.
enum class Mark { kGood, kBad, kNeither };

Mark MarkOf(ItemState state);
Mark MarkOf(LinkState state);

// "good", "bad" or "neither", for programs.
const char* MarkCode(Mark mark);

// "✓", "✗" and "–", or "+", "x" and "-" where these cannot be shown.
const char* SymbolOf(Mark mark, bool has_utf8);

std::string NameOf(const Item& item);

// The item's result and its reason; `verdict` is its report's.
std::string OutcomeOf(const Item& item, Verdict verdict);

// Where the tool found the file.
inline const std::string& PathForTool(const Report& report) {
  return report.installed.empty() ? report.path : report.installed;
}

// Of a report that has `installed`.
inline constexpr char kLaidOutText[] =
    "libraries laid out beside it as an installer does; --install=no leaves it as it lies";

// Whether what to do is said below the item. It is said once for neighbours that need the same, and
// not where it follows from another; `next` is what stands below, null for nothing.
bool HasCure(const Item& item, const Item* next);

// The text at the link, or "not reached" beyond a break.
std::string TextOf(const Link& link);

// Label and value for each fact. The labels are those of apksigner, so that one search finds both.
using Rows = std::vector<std::pair<std::string, std::string>>;
// Of a certificate as others read it.
Rows CertificateRows(const CertificateFacts& certificate);
// Of the JAR signature: the certificate, and what the kernel got of the key.
Rows SignerRows(const Report& report);

// The words for a share of the package.
inline constexpr char kVerifiedWord[] = "verified";
inline constexpr char kVouchedWord[] = "listed and not verified";
inline constexpr char kDifferingWord[] = "other than listed";
inline constexpr char kUncomparedWord[] = "listed and not compared";
inline constexpr char kUnlistedWord[] = "not listed";
inline constexpr char kMissingWord[] = "listed and missing";

}  // namespace simulator
