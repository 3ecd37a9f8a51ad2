#include "simulator/show/verdict_event.h"

#include <functional>
#include <utility>

#include "simulator/phone/journal.h"
#include "simulator/phone/text.h"
#include "simulator/show/words.h"

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

const char* StateCode(const Item& item) {
  constexpr const char* kCodes[] = {"signed", "refused", "absent", "nothing-to-sign"};
  const bool is_registered = item.state == ItemState::kDone && item.kind == ItemKind::kKey;
  return is_registered ? "registered" : kCodes[static_cast<size_t>(item.state)];
}

Members ReasonMembers(const Reason& reason) {
  return {{"reason", EncodeText(reason.cause->code)}, {"text", EncodeText(reason.Text())}};
}

std::string ItemJson(const Item& item) {
  constexpr const char* kKinds[] = {"package", "jar", "file", "entries", "library", "key", "tool"};
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
                     {"key_algorithm", EncodeText(signer.key.algorithm)},
                     {"key_bits", std::to_string(signer.key.bits)},
                     {"key_sha256", EncodeText(signer.key.sha256)}};
  if (!modulus_sha256.empty()) members.emplace_back("modulus_sha256", EncodeText(modulus_sha256));
  return Object(members);
}

// Of the JAR signature the key is the kernel's, whatever the certificate shows.
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

std::string ProtectionJson(const Protection& protection) {
  return Object({{"verified", ShareJson(protection.verified)},
                 {"vouched", ShareJson(protection.vouched)},
                 {"unlisted", ShareJson(protection.unlisted)},
                 {"signature", ShareJson(protection.signature)}});
}

std::string LinkJson(const Link& link) {
  constexpr const char* kStates[] = {"holds", "broken", "not-reached"};
  return Object({{"link", EncodeText(link.name)},
                 {"state", EncodeText(kStates[static_cast<size_t>(link.state)])},
                 {"text", EncodeText(link.text)}});
}

}  // namespace

std::string VerdictEvent(const Report& report) {
  Event event("verdict");
  event.Text("file", report.file).Text("path", report.path);
  event.Text("verdict", WordsOf(report.verdict).code).Number("status", StatusOf(report.verdict));
  event.Text("package", report.package_name).Text("payload", report.payload);
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
