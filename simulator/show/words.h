// The words of a report, for all outputs. They contain names and details from the files, unchanged.
// The caller must escape them.
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

// Returns a text such as "3 files: 1 signed, 2 refused". For an interrupted run, `unseen` is the
// number of files that were not reached. The text then also reports the interruption, and this
// number if it is not 0.
std::string Summary(const std::vector<Verdict>& verdicts, std::optional<size_t> unseen = {});

// The package's name, its JAR signer and key, and the text of OtherOwnerText. `ellipsis` replaces
// the middle of a digest.
std::vector<std::string> OwnerFacts(const Report& report, const char* ellipsis);

// The JAR signer and the key, such as "CN=Vault, RSA-2048, key 98302ce8…f64646".
std::string SignerText(const Report& report, const char* ellipsis);

// Names the signer whom phones record as the package's signer, if this is not the JAR signer. Empty
// unless the verdict is kOtherSigner.
std::string OtherOwnerText(const Report& report);

// The texts of the warnings that have the severity kAlarm.
std::vector<std::string> AlarmFacts(const Report& report);

// The reason of the item that decides the verdict; empty if nothing was refused.
std::string DecisiveReason(const Report& report);

// If the verifier of the phones' installer is missing, returns a message that reports this. Else
// returns an empty text.
std::string MissingInstaller(const Report& report);

// The facts after the file's name in the verdict's line, in this order: the decisive reason or, if
// nothing was refused, OwnerFacts; the gate's refusals of the signer (gate.h), except the decisive
// reason; the alarms; the number of all warnings.
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

// The item's result and its reason. `verdict` is the report's verdict.
std::string OutcomeOf(const Item& item, Verdict verdict);

// The path at which the tool found the file.
inline const std::string& PathForTool(const Report& report) {
  return report.installed.empty() ? report.path : report.installed;
}

// The note in a report whose `installed` is not empty.
inline constexpr char kLaidOutText[] =
    "its libraries were extracted beside it, as an installer does; --install=no turns this off";

// True if the cure, which says what to do, is shown below the item. It is not shown if nothing is
// wrong, or for a consequence of another cause. If consecutive items have the same cause, only the
// last of these items shows the cure. `next` is the next item, or null.
bool HasCure(const Item& item, const Item* next);

// The link's text, or "not reached" for each link after a broken one.
std::string TextOf(const Link& link);

// Label and value for each fact. Except for the modulus, the labels are those of apksigner. One
// search then finds a fact in the outputs of both programs.
using Rows = std::vector<std::pair<std::string, std::string>>;
// The facts of a certificate, as libcrypto reads it. The tool has its own parser.
Rows CertificateRows(const CertificateFacts& certificate);
// The facts of the JAR signature: its certificate, and the digest of the key for the kernel.
Rows SignerRows(const Report& report);

// The words for a share of the package.
inline constexpr char kVerifiedWord[] = "verified";
inline constexpr char kVouchedWord[] = "listed and not verified";
inline constexpr char kDifferingWord[] = "other than listed";
inline constexpr char kUncomparedWord[] = "listed and not compared";
inline constexpr char kUnlistedWord[] = "not listed";
inline constexpr char kMissingWord[] = "listed and missing";

}  // namespace simulator
