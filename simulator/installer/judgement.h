// The judgement of apksig, the platform's own verifier: whether a phone's installer installs the
// package. apksig runs in a separate program. A hostile file can influence the answer of this
// program. The form of each answer is therefore checked. A malformed answer counts as no answer.
#pragma once

#include <climits>
#include <string>
#include <vector>

#include "simulator/package/certificate.h"

namespace simulator {

// The phones whose platforms have the API levels from `first` to `last`, both included.
struct LevelRange {
  int first;
  int last;
};

// The value of `last` in a range without an upper limit.
inline constexpr int kNewestLevel = INT_MAX;

// An error or a warning of apksig.
struct InstallerIssue {
  std::string name;  // such as "JAR_SIG_ZIP_ENTRY_NOT_SIGNED"
  std::vector<std::string> parameters;
  std::string text;  // apksig's own sentence
};

// A signer of the package in one verified signature scheme.
struct InstallerSigner {
  std::string scheme;  // "v1", "v2", "v3" or "v3.1"
  CertificateFacts certificate;
};

// apksig's judgement of the package, for the phones in one range of API levels.
struct RangeJudgement {
  LevelRange levels = {0, 0};
  bool is_verified = false;
  std::vector<std::string> schemes;      // the verified ones, the oldest first
  std::vector<InstallerSigner> signers;  // the signers of these schemes, in the same order
  std::vector<InstallerIssue> errors;
  std::vector<InstallerIssue> warnings;
};

struct Judgement {
  enum class State {
    kNotAsked,  // the verifier was not asked, for example because the file is not a package
    kMissing,   // Java, apksig or the program that calls apksig is missing
    kGaveUp,    // the verifier failed, or gave no valid answer before the deadline
    kJudged,
  };

  State state = State::kNotAsked;
  std::string why;                     // the reason, for kMissing and kGaveUp
  std::vector<RangeJudgement> ranges;  // from low to high levels, without gaps or overlaps
};

// Parses one line of the verifier's output. The result's state is kJudged or kGaveUp.
Judgement ParseJudgement(const std::string& line);

}  // namespace simulator
