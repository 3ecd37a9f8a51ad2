#include "simulator/show/verdict_event.h"

#include <functional>
#include <utility>

#include "simulator/phone/journal.h"
#include "simulator/phone/text.h"

namespace simulator {

namespace {

// Values as JSON: objects are lists of keys and values that are JSON already.
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

const char* CodeOf(ItemKind kind) {
  switch (kind) {
    case ItemKind::kPackage:
      return "package";
    case ItemKind::kJar:
      return "jar";
    case ItemKind::kFile:
      return "file";
    case ItemKind::kLibrary:
      return "library";
    case ItemKind::kKey:
      return "key";
    case ItemKind::kTool:
      return "tool";
  }
  return "";
}

const char* StateCode(const Item& item) {
  switch (item.state) {
    case ItemState::kDone:
      return item.kind == ItemKind::kKey ? "registered" : "signed";
    case ItemState::kRefused:
      return "refused";
    case ItemState::kAbsent:
      return "absent";
    case ItemState::kNothing:
      return "nothing-to-sign";
  }
  return "";
}

const char* CodeOf(LinkState state) {
  switch (state) {
    case LinkState::kHolds:
      return "holds";
    case LinkState::kBroken:
      return "broken";
    case LinkState::kNotReached:
      return "not-reached";
  }
  return "";
}

Members ReasonMembers(const Reason& reason) {
  return {{"reason", EncodeText(reason.cause->code)}, {"text", EncodeText(reason.Text())}};
}

std::string ItemJson(const Item& item) {
  Members members = {{"kind", EncodeText(CodeOf(item.kind))}, {"name", EncodeText(item.name)}};
  if (item.kind == ItemKind::kLibrary) members.emplace_back("entry", EncodeText(item.entry));
  members.emplace_back("state", EncodeText(StateCode(item)));
  if (item.reason.cause != nullptr) {
    for (auto& member : ReasonMembers(item.reason)) members.push_back(std::move(member));
  }
  return Object(members);
}

std::string SignerJson(const std::string& scheme, const CertificateFacts& signer) {
  Members members = {{"scheme", EncodeText(scheme)},
                     {"subject", EncodeText(signer.subject)},
                     {"certificate_sha256", EncodeText(signer.sha256)},
                     {"key_algorithm", EncodeText(signer.key.algorithm)},
                     {"key_bits", std::to_string(signer.key.bits)},
                     {"key_sha256", EncodeText(signer.key.sha256)}};
  if (!signer.key.modulus_sha256.empty()) {
    members.emplace_back("modulus_sha256", EncodeText(signer.key.modulus_sha256));
  }
  return Object(members);
}

std::string SignersJson(const Report& report) {
  std::vector<NewerSignerFacts> signers;
  if (report.signer) signers.push_back({"v1", *report.signer});
  signers.insert(signers.end(), report.newer.begin(), report.newer.end());
  return List(signers, [](const auto& each) { return SignerJson(each.scheme, each.certificate); });
}

std::string ShareJson(const Share& share) {
  return Object(
      {{"entries", std::to_string(share.entries)}, {"bytes", std::to_string(share.bytes)}});
}

std::string ProtectionJson(const Protection& protection) {
  return Object({{"verified", ShareJson(protection.verified)},
                 {"vouched", ShareJson(protection.vouched)},
                 {"unlisted", ShareJson(protection.unlisted)},
                 {"signature", ShareJson(protection.signature)}});
}

std::string LinkJson(const Link& link) {
  return Object({{"link", EncodeText(link.name)},
                 {"state", EncodeText(CodeOf(link.state))},
                 {"text", EncodeText(link.text)}});
}

}  // namespace

const char* CodeOf(Verdict verdict) {
  switch (verdict) {
    case Verdict::kSigned:
      return "signed";
    case Verdict::kPartlySigned:
      return "partly-signed";
    case Verdict::kRefused:
      return "refused";
    case Verdict::kTrustedJar:
      return "trusted-jar";
    case Verdict::kNotTrustedJar:
      return "not-trusted-jar";
    case Verdict::kNotLookedAt:
      return "not-looked-at";
    case Verdict::kNotSimulated:
      return "not-simulated";
  }
  return "";
}

std::string VerdictEvent(const Report& report) {
  Event event("verdict");
  event.Text("file", report.file).Text("path", report.path);
  event.Text("verdict", CodeOf(report.verdict)).Number("status", StatusOf(report.verdict));
  event.Text("package", report.package_name);
  event.Json("items", List(report.items, ItemJson));
  event.Json("warnings", List(report.warnings, [](const Reason& warning) {
               return Object(ReasonMembers(warning));
             }));
  event.Json("signers", SignersJson(report));
  event.Json("protection", ProtectionJson(report.protection));
  event.Json("chain", List(report.chain, LinkJson));
  return event.Line();
}

}  // namespace simulator
