#include "simulator/verdict/make_report.h"

#include <ziparchive/zip_archive.h>

#include <algorithm>

#include "apk/zip_library.h"
#include "sign/libzu.h"
#include "simulator/verdict/parts.h"

namespace simulator {

namespace {

Item OwnItem(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options);
ItemKind KindOf(const RunRecord& run);
Reason WhyJarRefused(const RunRecord& run, const PackageFacts& facts);
Reason WhyFailed(const Failure& failure);
void AddKeyItems(const RunRecord& run, const JudgeOptions& options, std::vector<Item>* items);
void AddToolItems(const RunRecord& run, const JudgeOptions& options, std::vector<Item>* items);
Verdict Judge(const std::vector<Item>& items);
Verdict JudgeWithInstaller(Verdict verdict, const Report& report);
void DescribeSigners(const RunRecord& run, const PackageFacts& facts, Report* report);
void AddWarnings(const std::vector<Reason>& warnings, const JudgeOptions& options, Report* report);

}  // namespace

Report MakeReport(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options,
                  const Judgement& installer) {
  Report report;
  report.file = run.file;
  report.path = run.path;
  report.installed = run.installed;
  report.events = run.events;
  report.installer = installer;
  report.file_size = facts.size;
  report.file_sha256 = facts.sha256;
  report.tool = run.tool;
  Reason failure = WhyFailed(run.failure);
  if (failure.cause == nullptr && facts.was_changed) failure = {&cause::kFileChanged, ""};
  if (failure.cause == nullptr && run.is_silent && !run.signal) {
    const Reason unseen = WhyNotLookedAt(run, facts);
    if (run.status != 0) {
      failure = {&cause::kToolFailed, std::to_string(run.status)};
    } else if (unseen.cause == nullptr) {
      failure = {&cause::kToolSilent, ""};
    } else {
      report.verdict = Verdict::kNotLookedAt;
      report.items = {NotDone(ItemKind::kFile, "file", unseen, options)};
      return report;
    }
  }
  if (failure.cause != nullptr) {
    report.items = {NotDone(ItemKind::kTool, "tool", failure, options)};
    return report;
  }
  report.items = {OwnItem(run, facts, options)};
  const Item own = report.items[0];
  AddLibraryItems(run, facts, options, &report.items);
  AddKeyItems(run, options, &report.items);
  AddToolItems(run, options, &report.items);
  if (own.kind == ItemKind::kPackage) AddInstallerItem(installer, options, &report.items);
  DescribeSigners(run, facts, &report);
  AddWarnings(FindWarnings(run, facts, report, options.now), options, &report);
  report.verdict = JudgeWithInstaller(Judge(report.items), report);
  report.protection = FindProtection(facts, report.items);
  if (own.kind == ItemKind::kPackage) report.chain = MakeChain(facts, report);
  return report;
}

Item NotDone(ItemKind kind, const std::string& name, const Reason& reason,
             const JudgeOptions& options) {
  ItemState state = ItemState::kRefused;
  if (reason.cause->severity == Severity::kNothing) state = ItemState::kNothing;
  const bool is_absent = reason.cause->severity == Severity::kAbsent;
  if (is_absent && !options.is_strict) state = ItemState::kAbsent;
  return {kind, name, "", state, reason};
}

std::string Reason::Text() const {
  if (cause == nullptr) return {};
  std::string text = cause->reason;
  const size_t at = text.find("%s");
  return at == std::string::npos ? text : text.replace(at, 2, detail);
}

// The verdict kNotSimulated has two possible causes. After a failed run, the report has only one
// item. If the report has more items, the installer's verifier gave up.
const Item* DecisiveItem(const Report& report) {
  const bool is_installers = report.verdict == Verdict::kNotInstallable ||
                             (report.verdict == Verdict::kNotSimulated && report.items.size() > 1);
  for (const Item& item : report.items) {
    const bool counts = !is_installers || item.kind == ItemKind::kInstaller;
    if (counts && item.state == ItemState::kRefused) return &item;
  }
  return nullptr;
}

bool IsByTool(const Item& item) {
  return item.kind != ItemKind::kInstaller && item.kind != ItemKind::kSigner &&
         item.kind != ItemKind::kWarnings;
}

bool IsSigned(const Item& item) {
  return item.state == ItemState::kDone && item.kind != ItemKind::kKey;
}

ExitStatus StatusOf(Verdict verdict) {
  constexpr ExitStatus kStatuses[] = {kAllSigned,   kAllSigned,     kAllSigned,   kSomeRefused,
                                      kSomeRefused, kSomeRefused,   kSomeRefused, kSomeRefused,
                                      kNotLookedAt, kCannotSimulate};
  return kStatuses[static_cast<size_t>(verdict)];
}

namespace {

// The item for the file itself.
Item OwnItem(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options) {
  const ItemKind kind = KindOf(run);
  constexpr const char* kNames[] = {"package", "JAR", "file"};
  const char* const name = kNames[static_cast<size_t>(kind)];
  Reason reason;
  if (run.verify_error.value_or(0) != 0) {
    reason = WhyJarRefused(run, facts);
  } else if (run.own) {
    reason = WhyKernelDidNotSign(*run.own);
  } else if (run.signal) {
    reason = {&cause::kNotReached, ""};
  } else {
    reason = run.is_jar ? WhyJarRefused(run, facts) : WhyRefused(run, facts);
  }
  Item item = {kind, name, "", ItemState::kDone, {}};
  if (reason.cause != nullptr) item = NotDone(kind, name, reason, options);
  // The tool tries to sign a package only after it verified the package.
  item.is_verified = kind == ItemKind::kPackage && run.own.has_value();
  return item;
}

// The kind that the tool saw. A file that the tool could not open as an archive is neither a
// package nor a JAR. The payload of a JAR has no digest (kNoData), and the payload of a package
// has one.
ItemKind KindOf(const RunRecord& run) {
  constexpr char kNoData[] = "0000";
  if (run.is_jar || (run.own && run.own->payload == kNoData)) return ItemKind::kJar;
  const bool is_archive = FindLine(run.opening_errors, LogMeaning::kNoArchive) == nullptr;
  return is_archive ? ItemKind::kPackage : ItemKind::kFile;
}

Reason WhyJarRefused(const RunRecord& run, const PackageFacts& facts) {
  Reason encrypted = WhyEncrypted(facts);
  if (encrypted.detail == kAndroidManifestName) return encrypted;
  const LogLine* const line = FindLine(run.opening_errors, LogMeaning::kNoAndroidManifest);
  if (line != nullptr && line->text != ErrorCodeString(ApkTools::kZipEntryNotFound)) {
    return {&cause::kAndroidManifestDamaged, ""};
  }
  Reason taken_for_a_jar = WhyTakenForAJar(facts);
  if (taken_for_a_jar.cause != nullptr) return taken_for_a_jar;
  return {&cause::kJarNotTrusted, DescribeErrno(run.verify_error.value_or(0))};
}

// The result has a null cause if nothing failed.
Reason WhyFailed(const Failure& failure) {
  constexpr const Cause* kCauses[] = {nullptr,
                                      &cause::kToolNotStarted,
                                      &cause::kToolTimedOut,
                                      &cause::kInterrupted,
                                      &cause::kStandInsMissing,
                                      &cause::kStateNotKept,
                                      &cause::kNotInstalled,
                                      &cause::kFileChanged};
  return {kCauses[static_cast<size_t>(failure.kind)], failure.detail};
}

void AddKeyItems(const RunRecord& run, const JudgeOptions& options, std::vector<Item>* items) {
  const auto add = [&](const std::string& name, const Reason& reason) {
    items->push_back(NotDone(ItemKind::kKey, name, reason, options));
  };
  for (const auto& [name, answer] : run.registrations) {
    const int result = static_cast<int>(answer);
    if (IsZuSuccess(result)) {
      items->push_back({ItemKind::kKey, name, "", ItemState::kDone, {}});
    } else {
      add(name, {&cause::kRegistrationRefused, std::to_string(result)});
    }
  }
  if (run.is_key_refused_with_package) add("", {&cause::kPackageRefused, ""});
  if (run.has_no_key_path) add("", {&cause::kRegistrationNoPath, ""});
}

// Adds an item for each failure that no other item reports. RunRecord::opening_errors are usually
// the reason of the file's own item. For a JAR, these errors show only why the file is not a
// package. If the tool tried to sign a package despite these errors, each of them gets an item.
void AddToolItems(const RunRecord& run, const JudgeOptions& options, std::vector<Item>* items) {
  const auto add = [&](const Reason& reason) {
    items->push_back(NotDone(ItemKind::kTool, "tool", reason, options));
  };
  if (items->front().kind != ItemKind::kJar && run.own) {
    for (const LogLine& line : run.opening_errors) add({&cause::kToolError, line.whole});
  }
  for (const std::string& line : run.other_errors) add({&cause::kToolError, line});
  if (run.signal) {
    add({&cause::kToolKilled, std::to_string(*run.signal)});
  } else if (run.status != 0) {
    add({&cause::kToolFailed, std::to_string(run.status)});
  }
}

// The verdict on the tool's own items alone. The first item must be the item for the file itself.
Verdict Judge(const std::vector<Item>& items) {
  const auto is_refused = [](const Item& item) {
    return item.state == ItemState::kRefused && IsByTool(item);
  };
  const bool is_jar = items[0].kind == ItemKind::kJar;
  if (items[0].reason.cause == &cause::kJarNotTrusted) return Verdict::kNotTrustedJar;
  if (std::none_of(items.begin(), items.end(), is_refused)) {
    return is_jar ? Verdict::kTrustedJar : Verdict::kSigned;
  }
  const bool is_partly = std::any_of(items.begin(), items.end(), IsSigned);
  return is_partly ? Verdict::kPartlySigned : Verdict::kRefused;
}

// Applies the judgement of the phones' installer to `verdict`. Only kSigned and kPartlySigned can
// change.
Verdict JudgeWithInstaller(Verdict verdict, const Report& report) {
  if (verdict != Verdict::kSigned && verdict != Verdict::kPartlySigned) return verdict;
  for (const Item& item : report.items) {
    if (item.kind != ItemKind::kInstaller) continue;
    const bool has_judged = item.reason.cause != &cause::kInstallerGaveUp;
    return has_judged ? Verdict::kNotInstallable : Verdict::kNotSimulated;
  }
  const bool has_other = OtherSigner(report.installer, report) != nullptr;
  return verdict == Verdict::kSigned && has_other ? Verdict::kOtherSigner : verdict;
}

// Fills in the payload, the package's name, the signers, the schemes and the key. The payload is
// that of the signed file itself, or else of the first signed library. Only the report of a package
// can have a key. If the payload has a digest, the key is the one with this digest. If the payload
// has no digest, or if nothing was signed, the key is the one that the tool's own code reads from
// the package.
void DescribeSigners(const RunRecord& run, const PackageFacts& facts, Report* report) {
  constexpr char kDigestFollows[] = "2000";  // the digest's length, 32, the low byte first
  const auto take = [report](const Attempt& attempt) {
    if (attempt.outcome != Attempt::Outcome::kSigned || !report->payload.empty()) return;
    report->payload = attempt.payload;
  };
  if (run.own) take(*run.own);
  for (const Attempt& library : run.libraries) take(library);
  report->package_name = facts.manifest.package_name.value_or("");
  report->signer = facts.jar.certificate;
  report->newer = facts.newer;
  if (!facts.jar.signature_files.empty()) report->schemes.push_back("v1");
  for (const std::string& scheme : NewerSchemes(facts)) report->schemes.push_back(scheme);
  if (report->items[0].kind != ItemKind::kPackage) return;
  if (facts.jar.key) report->key = {facts.jar.key->modulus_sha256, facts.jar.key->bits, false};
  if (report->payload.rfind(kDigestFollows, 0) != 0) return;
  const std::string digest = report->payload.substr(strlen(kDigestFollows));
  const bool is_read = report->key && report->key->sha256 == digest;
  report->key = {digest, is_read ? report->key->bits : 0, true};
}

// Under --strict, a warning of the severity kDoubt counts as a refusal.
void AddWarnings(const std::vector<Reason>& warnings, const JudgeOptions& options, Report* report) {
  for (const Reason& warning : warnings) {
    if (options.is_strict && warning.cause->severity == Severity::kDoubt) {
      report->items.push_back(NotDone(ItemKind::kEntries, "entries", warning, options));
    } else {
      report->warnings.push_back(warning);
    }
  }
}

}  // namespace

}  // namespace simulator
