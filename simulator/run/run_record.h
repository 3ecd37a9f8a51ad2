// The record of a run of the tool for one file: the events of the run, and what the events report
// about the file, the file's libraries and the signer's key. TakeApart makes a RunRecord from the
// journal's events. TakeApart does not set `failure` or the members after `failure`, because the
// journal does not have these facts.
#pragma once

#include <cstdint>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "simulator/run/events.h"
#include "simulator/run/log_lines.h"

namespace simulator {

// The attempt to sign one file.
struct Attempt {
  enum class Outcome {
    kBegun,  // the tool began, and no result is known
    kSigned,
    kKernelRefused,
    kNotAsked,     // because of the member `integrity`, the tool did not ask the kernel
    kNotVerified,  // a library that the tool refused: see `why`
    kVanished,     // a library that could not be opened again after its check
  };

  std::string path;  // from the log or the kernel; can be empty
  Outcome outcome = Outcome::kBegun;
  int64_t error = 0;    // the errno of the kernel's refusal or of the failed open
  std::string payload;  // the bytes that the kernel got, in hexadecimal
  // The integrity value that the tool read last; none: it read no value, or there was no file.
  std::optional<std::string> integrity;
  LogMeaning why = LogMeaning::kUnknown;  // the first error about a refused library, if any
};

// Why a run has no result for the file.
struct Failure {
  enum class Kind {
    kNone,
    kNotStarted,
    kTimedOut,
    kInterrupted,
    kStandInsMissing,
    kStateNotKept,
    kNotInstalled,
    kChanged,
  };

  Kind kind = Kind::kNone;
  std::string detail;
};

// Which tool ran.
struct ToolIdentity {
  bool is_own = false;  // the tool in the simulator's own directory; has the simulator's version
  std::string sha256;   // of the tool's bytes, in lower-case hexadecimal; empty: not readable
};

struct RunRecord {
  Events events;  // all events, in order
  std::string file;
  std::string path;
  std::string installed;  // <install>/base.apk, made by Installation; empty: not made
  bool is_silent = true;  // the journal has no event of the tool, except "exit"

  std::vector<LogLine> opening_errors;  // logged before the tool began to sign
  bool is_dex_refused = false;
  LogMeaning dex_why = LogMeaning::kUnknown;  // the first error about the dex file, if any
  std::vector<Attempt> libraries;             // in the order of the events
  std::optional<Attempt> own;                 // for the file itself; none: no attempt with a result
  std::optional<int64_t> verify_error;        // a plain JAR: 0 if the kernel trusts it, else errno
  bool is_jar = false;

  struct Registration {
    std::string name;
    int64_t result;
  };
  std::vector<Registration> registrations;
  bool is_key_refused_with_package = false;
  bool has_no_key_path = false;

  std::vector<std::string> other_errors;  // errors that belong to none of the members above
  std::optional<int64_t> signal;          // the signal that killed the tool
  int64_t status = 0;

  // Facts about the run that the journal does not have.
  Failure failure;
  ToolIdentity tool;
  bool has_standard_input = true;  // the tool was started with a standard input
  bool has_no_packages = false;    // a directory without packages; the tool was not run
  // Library entries that Installation did not extract:
  std::set<std::string> of_other_abis;     // entries of Arm ABIs that were not chosen
  std::vector<std::string> not_laid_out;   // entries whose names no installer accepts
  std::vector<std::string> not_extracted;  // entries that cannot be extracted

  // The path by which the events name the file.
  const std::string& PathForTool() const { return installed.empty() ? path : installed; }
};

RunRecord TakeApart(const Events& events);

}  // namespace simulator
