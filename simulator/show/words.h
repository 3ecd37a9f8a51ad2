// The words and texts of a report, for all outputs. The texts can contain names and details from
// the files, unchanged. The caller must escape each text for its output.
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
  const char* one;   // in the summary, after the number 1
  const char* many;  // in the summary, after any other number
  Mood mood;
};

const VerdictWords& WordsOf(Verdict verdict);

// "good", "mixed" or "bad", for programs.
const char* MoodCode(Mood mood);

// Returns a text such as "3 files: 1 signed, 2 refused". For an interrupted run, `unseen` is the
// number of files that were not reached. The text then also reports the interruption, and this
// number if it is not 0.
std::string Summary(const std::vector<Verdict>& verdicts, std::optional<size_t> unseen = {});

// The package's name, SignerText, and OtherOwnerText. Facts that the report does not have are left
// out. `ellipsis` replaces the middle of a digest.
std::vector<std::string> OwnerFacts(const Report& report, const char* ellipsis);

// The JAR signer and the key, such as "CN=Vault, RSA-2048, key 98302ce8…f64646".
std::string SignerText(const Report& report, const char* ellipsis);

// If the verdict is kOtherSigner, names the signer that phones record for the package. Empty for
// any other verdict.
std::string OtherOwnerText(const Report& report);

// The texts of the warnings that have the severity kAlarm, each with "! " before it.
std::vector<std::string> AlarmFacts(const Report& report);

// The reason of the item that decides the verdict; empty if nothing was refused.
std::string DecisiveReason(const Report& report);

// If apksig, the verifier that phones' installers use, is missing on this computer, returns a
// message with the reason. Else returns an empty text.
std::string MissingInstaller(const Report& report);

// The facts after the file's name in the verdict's line, in this order:
// - DecisiveReason, or OwnerFacts if DecisiveReason is empty;
// - the reasons for which the gate (gate.h) refused the signer, except the decisive reason and a
//   reason of severity kFollows;
// - AlarmFacts;
// - the number of all warnings, unless it is 0.
std::vector<std::string> HeadFacts(const Report& report, const char* ellipsis);

// The mark before the line of an item, or of a link in the chain from the key to the entries (Link
// in report.h).
enum class Mark { kGood, kBad, kNeither };

Mark MarkOf(ItemState state);
Mark MarkOf(LinkState state);

// "good", "bad" or "neither", for programs.
const char* MarkCode(Mark mark);

// Returns "✓", "✗" or "–" if `has_utf8` is true, else "+", "x" or "-".
const char* SymbolOf(Mark mark, bool has_utf8);

std::string NameOf(const Item& item);

// The text after the item's name: the item's result, its reason, or both. `verdict` is the report's
// verdict.
std::string OutcomeOf(const Item& item, Verdict verdict);

// The path at which the tool found the file.
inline const std::string& PathForTool(const Report& report) {
  return report.installed.empty() ? report.path : report.installed;
}

// The note in a report whose `installed` is not empty.
inline constexpr char kLaidOutText[] =
    "its libraries were extracted beside it, as an installer does; --install=no turns this off";

// True if the item's cure (the text that says what to do) is shown below the item. No cure is shown
// if nothing is wrong, or if the item's reason is a consequence of another cause. If consecutive
// items have the same cause, only the last of these items shows the cure. `next` is the next item,
// or null.
bool HasCure(const Item& item, const Item* next);

// The link's text, or "not reached" for each link after a broken link.
std::string TextOf(const Link& link);

// Label and value for each fact. The labels are those of apksigner, except the label of the
// modulus. A user can therefore search for the same label in the output of apksigner.
using Rows = std::vector<std::pair<std::string, std::string>>;
// The facts of a certificate, as libcrypto reads it. The tool has its own parser.
Rows CertificateRows(const CertificateFacts& certificate);
// The facts of the JAR signer: its certificate, and the digest in Report::key. This digest is the
// one that the kernel got. If the kernel got none, it is the one that the tool would send.
Rows SignerRows(const Report& report);

// The words for the parts of the package in Protection (simulator/verdict/report.h).
inline constexpr char kVerifiedWord[] = "verified";
inline constexpr char kVouchedWord[] = "listed and not verified";
inline constexpr char kDifferingWord[] = "other than listed";
inline constexpr char kUncomparedWord[] = "listed and not compared";
inline constexpr char kUnlistedWord[] = "not listed";
inline constexpr char kMissingWord[] = "listed and missing";

}  // namespace simulator
