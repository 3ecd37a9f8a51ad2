// A run of the tool, taken apart: which error belongs to which file. Made from the journal's events
// and nothing else, but for what stands last in the record.
#pragma once

#include <cstdint>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "simulator/run/events.h"
#include "simulator/run/log_lines.h"

namespace simulator {

// One file that the tool took up, to have it signed.
struct Attempt {
  enum class Outcome {
    kBegun,  // and nothing came of it
    kSigned,
    kKernelRefused,
    kNotAsked,     // the tool may not sign: `integrity` tells
    kNotVerified,  // a library: `why` tells
    kVanished,     // a library, after it was verified
  };

  std::string path;  // as log or kernel told; may be empty
  Outcome outcome = Outcome::kBegun;
  int64_t error = 0;                      // the kernel's errno, or that of opening
  std::string payload;                    // that the kernel was handed, in hexadecimal
  std::optional<std::string> integrity;   // the tool's own value, as read last; none: no file
  LogMeaning why = LogMeaning::kUnknown;  // of the first error logged before, if any
};

// Why a run tells nothing of the file.
struct Failure {
  enum class Kind {
    kNone,
    kNotStarted,
    kTimedOut,
    kInterrupted,
    kStandInsMissing,
    kStateNotKept,
    kNotInstalled,
  };

  Kind kind = Kind::kNone;
  std::string detail;
};

// Which tool ran.
struct ToolIdentity {
  bool is_own = false;  // the one beside the simulator, which is of the simulator's version
  std::string sha256;   // of its bytes, in lower-case hexadecimal; empty: they cannot be read
};

struct RunRecord {
  Events events;  // all that happened, in order
  std::string file;
  std::string path;
  std::string installed;  // of a package that was laid out: <install>/base.apk; else empty
  bool is_silent = true;  // the tool neither said nor did anything

  std::vector<LogLine> opening_errors;  // before the first step
  bool is_dex_refused = false;
  LogMeaning dex_why = LogMeaning::kUnknown;  // of the first error logged before, if any
  std::vector<Attempt> libraries;             // in order
  std::optional<Attempt> own;           // the file itself, where the kernel was or should be asked
  std::optional<int64_t> verify_error;  // a plain JAR: 0, or why the kernel does not trust it
  bool is_jar = false;

  struct Registration {
    std::string name;
    int64_t result;
  };
  std::vector<Registration> registrations;
  bool is_key_refused_with_package = false;
  bool has_no_key_path = false;

  std::vector<std::string> other_errors;  // that belong to nothing of the above
  std::optional<int64_t> signal;          // that the tool was killed by
  int64_t status = 0;

  // Facts that the simulator itself knows of the run.
  Failure failure;
  ToolIdentity tool;
  bool has_standard_input = true;  // the tool was started with one
  bool has_no_packages = false;    // a directory that was walked for them; the tool was not run
  // The library entries of a package that is laid out: of processors that were not asked for; that
  // no installer takes, for their names; that cannot be extracted.
  std::set<std::string> of_other_processors;
  std::vector<std::string> not_laid_out;
  std::vector<std::string> not_extracted;

  // As the tool was told.
  const std::string& PathForTool() const { return installed.empty() ? path : installed; }
};

RunRecord TakeApart(const Events& events);

}  // namespace simulator
