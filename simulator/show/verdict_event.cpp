#include "simulator/show/verdict_event.h"

#include <functional>
#include <utility>

#include "simulator/phone/journal.h"
#include "simulator/phone/text.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

// The members of a JSON object: keys, and values that are already JSON.
using Members = std::vector<std::pair<const char*, std::string>>;

std::string Object(const Members& members) {
  std::string text;
  for (const auto& [key, value] : members) {
    text += (text.empty() ? "" : ",") + EncodeText(key) + ":" + value;
  }
  return "{" + text + "}";
}

template <typename Range, typename Function>
std::string List(const Range& range, Function to_json) {
  std::string text;
  for (const auto& each : range) text += (text.empty() ? "" : ",") + to_json(each);
  return "[" + text + "]";
}

const char* StateCode(const Item& item) {
  constexpr const char* kCodes[] = {"signed", "refused", "absent", "nothing-to-sign"};
  const bool is_registered = item.state == ItemState::kDone && item.kind == ItemKind::kKey;
  return is_registered ? "registered" : kCodes[static_cast<size_t>(item.state)];
}

Members ReasonMembers(const Reason& reason) {
  return {{"reason", EncodeText(reason.cause->code)},
          {"text", EncodeText(reason.Text())},
          {"cure", EncodeText(reason.cause->cure)}};
}

std::string ItemJson(const Item& item) {
  constexpr const char* kKinds[] = {"package", "jar",  "file",      "entries", "library",
                                    "key",     "tool", "installer", "signer",  "warnings"};
  Members members = {{"kind", EncodeText(kKinds[static_cast<size_t>(item.kind)])},
                     {"name", EncodeText(item.name)}};
  if (item.kind == ItemKind::kLibrary) members.emplace_back("entry", EncodeText(item.entry));
  members.emplace_back("state", EncodeText(StateCode(item)));
  if (item.reason.cause != nullptr) {
    for (auto& member : ReasonMembers(item.reason)) members.push_back(std::move(member));
  }
  return Object(members);
}

std::string SignerJson(const std::string& scheme, const CertificateFacts& signer,
                       const std::string& modulus_sha256) {
  Members members = {{"scheme", EncodeText(scheme)},
                     {"subject", EncodeText(signer.subject)},
                     {"certificate_sha256", EncodeText(signer.sha256)},
                     {"certificate_sha1", EncodeText(signer.sha1)},
                     {"key_algorithm", EncodeText(signer.key.algorithm)},
                     {"key_bits", std::to_string(signer.key.bits)},
                     {"key_sha256", EncodeText(signer.key.sha256)}};
  if (!modulus_sha256.empty()) members.emplace_back("modulus_sha256", EncodeText(modulus_sha256));
  return Object(members);
}

// For the JAR signer ("v1"), `modulus_sha256` is the digest that the kernel got. If the kernel got
// none, it is the digest of the modulus that the tool reads. If the tool reads none, it is the
// digest of the modulus that libcrypto finds in the certificate.
std::string SignersJson(const Report& report) {
  std::vector<std::string> signers;
  if (report.signer || report.key) {
    const CertificateFacts certificate = report.signer.value_or(CertificateFacts());
    signers.push_back(SignerJson("v1", certificate,
                                 report.key ? report.key->sha256 : certificate.key.modulus_sha256));
  }
  for (const auto& [scheme, certificate] : report.newer) {
    signers.push_back(SignerJson(scheme, certificate, certificate.key.modulus_sha256));
  }
  return List(signers, [](const std::string& signer) { return signer; });
}

std::string ShareJson(const Share& share) {
  return Object(
      {{"entries", std::to_string(share.entries)}, {"bytes", std::to_string(share.bytes)}});
}

Share Sum(std::initializer_list<Share> shares) {
  Share sum;
  for (const Share& share : shares) {
    sum.entries += share.entries;
    sum.bytes += share.bytes;
  }
  return sum;
}

std::string NamesJson(const std::vector<std::string>& names) {
  return List(names, [](const std::string& name) { return EncodeText(name); });
}

// The entries, divided by the result of their comparison with the manifest. In `matching` and
// `differing`, `looked_at` is the number of these entries that the tool itself checked.
std::string EntriesJson(const Protection& all) {
  const auto share = [](const Share& counted, Members members) {
    members.insert(members.begin(), {{"entries", std::to_string(counted.entries)},
                                     {"bytes", std::to_string(counted.bytes)}});
    return Object(members);
  };
  const std::string matching_seen = std::to_string(all.verified.entries);
  return Object(
      {{"matching", share(Sum({all.verified, all.vouched}), {{"looked_at", matching_seen}})},
       {"differing", share(all.differing, {{"looked_at", std::to_string(all.differing_seen)},
                                           {"names", NamesJson(all.differing_names)}})},
       {"missing", Object({{"entries", std::to_string(all.missing_names.size())},
                           {"names", NamesJson(all.missing_names)}})},
       {"unlisted", share(all.unlisted, {{"names", NamesJson(all.unlisted_names)}})},
       {"uncompared", share(all.uncompared, {})}});
}

std::string ProtectionJson(const Protection& protection) {
  return Object({{"verified", ShareJson(protection.verified)},
                 {"vouched", ShareJson(Sum({protection.vouched, protection.differing,
                                            protection.uncompared}))},
                 {"unlisted", ShareJson(protection.unlisted)},
                 {"signature", ShareJson(protection.signature)}});
}

std::string LinkJson(const Link& link) {
  constexpr const char* kStates[] = {"holds", "broken", "not-reached"};
  return Object({{"link", EncodeText(link.name)},
                 {"state", EncodeText(kStates[static_cast<size_t>(link.state)])},
                 {"text", EncodeText(link.text)}});
}

std::string IssueJson(const InstallerIssue& issue) {
  return Object({{"issue", EncodeText(issue.name)},
                 {"parameters",
                  List(issue.parameters, [](const std::string& text) { return EncodeText(text); })},
                 {"text", EncodeText(issue.text)}});
}

std::string RangeJson(const RangeJudgement& range) {
  Members members = {{"first", std::to_string(range.levels.first)}};
  if (range.levels.last != kNewestLevel) {
    members.emplace_back("last", std::to_string(range.levels.last));
  }
  members.insert(members.end(), {{"installs", range.is_verified ? "true" : "false"},
                                 {"signers", List(range.signers,
                                                  [](const InstallerSigner& signer) {
                                                    const CertificateFacts& shown =
                                                        signer.certificate;
                                                    return SignerJson(signer.scheme, shown,
                                                                      shown.key.modulus_sha256);
                                                  })},
                                 {"errors", List(range.errors, IssueJson)},
                                 {"warnings", List(range.warnings, IssueJson)}});
  return Object(members);
}

// The version is known only for the tool in the simulator's own directory. One build makes this
// tool and the simulator, so their versions are equal.
std::string ToolJson(const ToolIdentity& tool) {
  Members members = {{"sha256", EncodeText(tool.sha256)}};
  if (tool.is_own) members.emplace_back("version", EncodeText(APKTOOLKIT_VERSION));
  return Object(members);
}

std::string InstallerJson(const Judgement& judgement) {
  constexpr const char* kStates[] = {"not-asked", "missing", "gave-up", "judged"};
  return Object({{"state", EncodeText(kStates[static_cast<size_t>(judgement.state)])},
                 {"levels", List(judgement.ranges, RangeJson)}});
}

}  // namespace

std::string VerdictEvent(const Report& report) {
  Event event("verdict");
  event.Text("file", report.file).Text("path", report.path);
  event.Number("size", static_cast<int64_t>(report.file_size)).Text("sha256", report.file_sha256);
  event.Text("version", APKTOOLKIT_VERSION).Json("tool", ToolJson(report.tool));
  event.Text("verdict", WordsOf(report.verdict).code).Number("status", StatusOf(report.verdict));
  event.Text("package", report.package_name).Text("payload", report.payload);
  event.Json("items", List(report.items, ItemJson));
  event.Json("warnings", List(report.warnings, [](const Reason& warning) {
               return Object(ReasonMembers(warning));
             }));
  event.Json("signers", SignersJson(report));
  event.Json("installer", InstallerJson(report.installer));
  event.Json("protection", ProtectionJson(report.protection));
  event.Json("entries", EntriesJson(report.protection));
  event.Json("chain", List(report.chain, LinkJson));
  return event.Line();
}

}  // namespace simulator
