// A report for tests. Each text that a hostile file can control contains the text that the test
// passes to HostileReport.
#pragma once

#include <string>

#include "simulator/phone/journal.h"
#include "simulator/verdict/report.h"

namespace simulator {

// A hostile text. It has HTML that tries to end an element, an attribute or a comment of the page.
// It also has tags of the page's Mustache template, control sequences of a terminal, bytes that are
// not UTF-8, and characters that change the direction of the text.
inline const char kHostileText[] =
    "</title></style><script>document.title='hostile'</script><img src=x onerror=alert(1)>"
    "\"'><a href='javascript:alert(1)'>&lt;&{{verdict}}{{{verdict}}}{{&verdict}}-->"
    "\x1b]0;x\x07\t\n\r\x7f\xff\xc3\u009b\u061c\u200b\u202e\u2066\ufeff";

inline CertificateFacts HostileCertificate(const std::string& text) {
  CertificateFacts certificate;
  certificate.subject = certificate.sha256 = text;
  certificate.key = {text, 2048, text, text + std::string(64, '0')};
  return certificate;
}

inline Judgement HostileJudgement(const std::string& text) {
  Judgement judgement;
  judgement.state = Judgement::State::kJudged;
  const InstallerIssue issue = {text, {text}, text};
  const InstallerSigner signer = {text, HostileCertificate(text)};
  judgement.ranges = {{{27, 29}, true, {"v1", text}, {signer}, {}, {issue}},
                      {{30, kNewestLevel}, false, {text}, {signer}, {issue}, {issue}}};
  return judgement;
}

// An event of each kind that the timeline shows, and one of an unknown kind.
inline Events HostileEvents(const std::string& text) {
  const auto answer = [&text](const char* kind, int64_t result) {
    return Event(kind).Text("path", text).Text("payload", text).Number("result", result).Line();
  };
  return ParseEvents(
      Event("log").Number("priority", 4).Text("tag", text).Text("text", text).Line() +
      Event("log").Number("priority", 6).Text("tag", "ApkToolkit").Text("text", text).Line() +
      Event("integrity").Number("pid", 7).Text("text", text).Line() + answer("sign", 0) +
      answer("verify", -1) +
      Event("register").Text("name", text).Text("data", text).Number("result", 0).Line() +
      Event("stdout").Text("text", text).Line() + Event("odd").Text("text", text).Line() +
      Event("exit").Number("status", 0).Line());
}

inline Report HostileReport(const std::string& text) {
  Report report;
  report.file = report.path = report.package_name = text;
  report.verdict = Verdict::kPartlySigned;
  report.items = {
      {ItemKind::kPackage, text, text, ItemState::kRefused, {&cause::kToolError, text}},
      {ItemKind::kLibrary, text, text, ItemState::kDone, {}},
      {ItemKind::kLibrary, text, text, ItemState::kAbsent, {&cause::kToolError, text}},
      {ItemKind::kKey, text, text, ItemState::kDone, {}},
      {ItemKind::kTool, text, text, ItemState::kRefused, {&cause::kToolNotStarted, text}}};
  report.warnings = {{&cause::kOtherKey, text}, {&cause::kOtherPackageName, text}};
  report.key = {std::string(64, '0'), 2048, true};
  report.signer = HostileCertificate(text);
  report.schemes = {text};
  report.newer = {{text, HostileCertificate(text + "!")}};
  report.protection.verified = {3, 300};
  report.protection.vouched = {2, 200};
  report.protection.unlisted = {1, 100};
  report.protection.signature = {3, 50};
  report.protection.unlisted_names = {text};
  report.file_size = 1000;
  report.file_sha256 = text;
  report.installer = HostileJudgement(text);
  report.chain = {{"key", LinkState::kHolds, text},
                  {"certificate", LinkState::kBroken, text},
                  {"manifest", LinkState::kNotReached, text}};
  report.events = HostileEvents(text);
  return report;
}

}  // namespace simulator
