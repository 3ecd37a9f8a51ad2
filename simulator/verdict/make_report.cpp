#include "simulator/verdict/make_report.h"

#include <algorithm>

#include "sign/libzu.h"
#include "simulator/verdict/library_items.h"
#include "simulator/verdict/package_reason.h"
#include "simulator/verdict/protection.h"
#include "simulator/verdict/warnings.h"

namespace simulator {

namespace {

Item OwnItem(const RunRecord& run, const PackageFacts& facts);
ItemKind KindOf(const RunRecord& run);
Reason WhyJarRefused(const RunRecord& run);
Reason WhyFailed(const Failure& failure);
Reason WhyToolIsAnother(const RunRecord& run);
void AddKeyItems(const RunRecord& run, std::vector<Item>* items);
void AddToolItems(const RunRecord& run, const Item& own, std::vector<Item>* items);
Verdict Judge(const std::vector<Item>& items);
void DescribeSigners(const PackageFacts& facts, Report* report);
Item Refused(ItemKind kind, const std::string& name, const Reason& reason);

}  // namespace

Report MakeReport(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options) {
  Report report;
  report.file = run.file;
  report.path = run.path;
  report.events = run.events;
  report.file_size = facts.size;
  if (run.failure.kind != Failure::Kind::kNone) {
    report.verdict = Verdict::kNotSimulated;
    report.items = {Refused(ItemKind::kTool, "tool", WhyFailed(run.failure))};
    return report;
  }
  if (run.is_silent && !run.signal) {
    Reason reason;
    if (run.status == 0) reason = WhyNotLookedAt(facts, run.has_standard_input);
    const bool is_known = reason.cause != nullptr;
    report.verdict = is_known ? Verdict::kNotLookedAt : Verdict::kNotSimulated;
    report.items = {is_known ? Refused(ItemKind::kFile, "file", reason)
                             : Refused(ItemKind::kTool, "tool", WhyToolIsAnother(run))};
    return report;
  }
  const Item own = OwnItem(run, facts);
  report.items = {own};
  AddLibraryItems(run, facts, own, options.is_strict, &report.items);
  AddKeyItems(run, &report.items);
  AddToolItems(run, own, &report.items);
  report.verdict = Judge(report.items);
  DescribeSigners(facts, &report);
  report.warnings = FindWarnings(facts, own, run.not_laid_out);
  report.protection = FindProtection(facts, report.items);
  if (own.kind == ItemKind::kPackage) {
    report.chain = MakeChain(facts, report.items, report.protection.verified);
  }
  return report;
}

std::string Reason::Text() const {
  if (cause == nullptr) return {};
  std::string text = cause->reason;
  const size_t at = text.find("%s");
  return at == std::string::npos ? text : text.replace(at, 2, detail);
}

int StatusOf(Verdict verdict) {
  switch (verdict) {
    case Verdict::kSigned:
    case Verdict::kTrustedJar:
      return 0;
    case Verdict::kPartlySigned:
    case Verdict::kRefused:
    case Verdict::kNotTrustedJar:
      return 1;
    case Verdict::kNotSimulated:
      return 3;
    case Verdict::kNotLookedAt:
      return 4;
  }
  return 3;
}

namespace {

Item Refused(ItemKind kind, const std::string& name, const Reason& reason) {
  return {kind, name, "", ItemState::kRefused, reason};
}

// The file itself.
Item OwnItem(const RunRecord& run, const PackageFacts& facts) {
  const ItemKind kind = KindOf(run);
  const char* const name = kind == ItemKind::kPackage ? "package"
                           : kind == ItemKind::kJar   ? "JAR"
                                                      : "file";
  if (run.verify_error.value_or(0) != 0) return Refused(kind, name, WhyJarRefused(run));
  if (run.own) {
    const Reason reason = WhyKernelDidNotSign(*run.own);
    const ItemState state = reason.cause == nullptr ? ItemState::kDone : ItemState::kRefused;
    return {kind, name, "", state, reason};
  }
  if (run.signal) return Refused(kind, name, {&cause::kNotReached, ""});
  return Refused(kind, name, run.is_jar ? WhyJarRefused(run) : WhyRefused(run, facts));
}

// As the tool saw it: what it could not open is neither package nor JAR, and a JAR gets no data.
ItemKind KindOf(const RunRecord& run) {
  constexpr char kNoData[] = "0000";
  if (run.is_jar || (run.own && run.own->payload == kNoData)) return ItemKind::kJar;
  const auto& errors = run.opening_errors;
  const bool is_no_archive = std::any_of(errors.begin(), errors.end(), [](const auto& line) {
    return Between(line, "OpenArchiveFd(", "").has_value();
  });
  return is_no_archive ? ItemKind::kFile : ItemKind::kPackage;
}

Reason WhyJarRefused(const RunRecord& run) {
  for (const std::string& line : run.opening_errors) {
    const auto why = Between(line, "Can't extract Android Manifest: ", "");
    if (why && *why != "Entry not found") return {&cause::kAndroidManifestDamaged, ""};
  }
  return {&cause::kJarNotTrusted, DescribeErrno(run.verify_error.value_or(0))};
}

Reason WhyFailed(const Failure& failure) {
  switch (failure.kind) {
    case Failure::Kind::kNone:
      break;
    case Failure::Kind::kNotStarted:
      return {&cause::kToolNotStarted, failure.detail};
    case Failure::Kind::kTimedOut:
      return {&cause::kToolTimedOut, failure.detail};
    case Failure::Kind::kStandInsMissing:
      return {&cause::kStandInsMissing, failure.detail};
    case Failure::Kind::kStateNotKept:
      return {&cause::kStateNotKept, failure.detail};
    case Failure::Kind::kNotInstalled:
      return {&cause::kNotInstalled, failure.detail};
  }
  return {};
}

// Of a run without a word: what ends with another status than 0 is not the tool either.
Reason WhyToolIsAnother(const RunRecord& run) {
  if (run.status == 0) return {&cause::kToolSilent, ""};
  return {&cause::kToolFailed, std::to_string(run.status)};
}

void AddKeyItems(const RunRecord& run, std::vector<Item>* items) {
  for (const auto& registration : run.registrations) {
    if (IsZuSuccess(static_cast<int>(registration.result))) {
      items->push_back({ItemKind::kKey, registration.name, "", ItemState::kDone, {}});
    } else {
      items->push_back(Refused(
          ItemKind::kKey, registration.name,
          {&cause::kRegistrationRefused, std::to_string(static_cast<int>(registration.result))}));
    }
  }
  if (run.is_key_refused_with_package) {
    items->push_back(Refused(ItemKind::kKey, "", {&cause::kPackageRefused, ""}));
  }
  if (run.has_no_key_path) {
    items->push_back(Refused(ItemKind::kKey, "", {&cause::kRegistrationNoPath, ""}));
  }
}

// What else went wrong. What was logged while the file was opened is the reason why a package was
// refused, or what a JAR lacks of a package; beside a package that was signed it is neither.
void AddToolItems(const RunRecord& run, const Item& own, std::vector<Item>* items) {
  const auto add = [items](const Reason& reason) {
    items->push_back(Refused(ItemKind::kTool, "tool", reason));
  };
  if (own.kind != ItemKind::kJar && run.own) {
    for (const std::string& line : run.opening_errors) add({&cause::kToolError, line});
  }
  for (const std::string& line : run.other_errors) add({&cause::kToolError, line});
  if (run.signal) {
    add({&cause::kToolKilled, std::to_string(*run.signal)});
  } else if (run.status != 0) {
    add({&cause::kToolFailed, std::to_string(run.status)});
  }
}

// The first item is the file itself.
Verdict Judge(const std::vector<Item>& items) {
  const auto is_refused = [](const Item& item) { return item.state == ItemState::kRefused; };
  const auto is_signed = [](const Item& item) {
    return item.state == ItemState::kDone && item.kind != ItemKind::kKey;
  };
  const Item& own = items[0];
  const bool is_jar = own.kind == ItemKind::kJar;
  if (is_jar && own.reason.cause == &cause::kJarNotTrusted) return Verdict::kNotTrustedJar;
  if (std::none_of(items.begin(), items.end(), is_refused)) {
    return is_jar ? Verdict::kTrustedJar : Verdict::kSigned;
  }
  const bool is_partly = std::any_of(items.begin(), items.end(), is_signed);
  return is_partly ? Verdict::kPartlySigned : Verdict::kRefused;
}

void DescribeSigners(const PackageFacts& facts, Report* report) {
  report->package_name = facts.manifest.package_name;
  report->signer = facts.jar.certificate;
  report->newer = facts.newer;
  if (!facts.jar.signature_files.empty()) report->schemes.push_back("v1");
  for (const std::string& scheme : NewerSchemes(facts)) report->schemes.push_back(scheme);
}

}  // namespace

}  // namespace simulator
