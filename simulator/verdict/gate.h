// The demands of the command line on each file, beside the phone's answer: its signer, and that it
// has no warnings.
#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

struct GateOptions {
  // The signers who are expected; none: anybody may sign. Each by the SHA-256 digest of his
  // certificate, of its SubjectPublicKeyInfo or of its RSA modulus, as ReadDigest gives it.
  std::vector<std::string> signers;
  bool refuses_warnings = false;
};

// A SHA-256 digest in lower-case hexadecimal, from the forms in which tools print it: in either
// case, all digits in one or each two of them behind a colon. None for anything else.
std::optional<std::string> ReadDigest(const std::string& text);

class Gate {
 public:
  // `options` must outlive this object.
  explicit Gate(const GateOptions& options) : options_(options) {}

  // Adds an item to the report for each demand that its file does not meet; what was good until
  // then is kNotAccepted. To be called once for each file, in the order of the command line: it is
  // compared with the first file of its package name.
  void Judge(Report* report);

 private:
  // Who signed the first file of a package name.
  struct First {
    std::string file;
    CertificateFacts jar;
    std::vector<CertificateFacts> installed;
  };

  void DemandExpectedSigner(Report* report) const;
  void DemandOneSigner(Report* report);
  static void DemandNoWarnings(bool is_other_signers, Report* report);

  const GateOptions& options_;
  std::map<std::string, First> first_;  // by the package's name
};

}  // namespace simulator
