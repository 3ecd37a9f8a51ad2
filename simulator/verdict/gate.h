// The demands on each file in addition to the phone's answer: the expected signer (--signer), no
// warnings (--werror), and one signer for all files with the same package name (always).
#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

struct GateOptions {
  // The expected signers; empty: any signer is allowed. Each is the SHA-256 digest of a
  // certificate, of its SubjectPublicKeyInfo or of its RSA modulus, in the form that ReadDigest
  // returns.
  std::vector<std::string> signers;
  bool refuses_warnings = false;
};

// Returns a SHA-256 digest in lower-case hexadecimal. Accepts the forms in which tools print it: in
// upper or lower case, with colons between the pairs of digits or without colons. Returns none for
// any other text.
std::optional<std::string> ReadDigest(const std::string& text);

class Gate {
 public:
  // `options` must outlive this object.
  explicit Gate(const GateOptions& options) : options_(options) {}

  // Adds at least one item to the report for each demand that the file does not meet. A good
  // verdict, which is a verdict with the status kAllSigned (StatusOf), then becomes kNotAccepted.
  // The demand for no warnings is made only if the verdict was good when Judge was called. A file
  // with the good verdict kOtherSigner never meets this demand. Changes nothing for a file that was
  // not looked at or not simulated. Must be called once per file, in the order of the command line,
  // because each verified package is compared with the first verified package of the same name.
  void Judge(Report* report);

 private:
  // The first verified package of a package name, and its signers.
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
