// Invents a package and a run of the tool on it. Compares the simulator's report with the answers
// of the kernel and of libzu in this run. If the report says that the kernel got a key, the kernel
// must have got this key. The report must not have more signed items than the kernel signed. The
// verdict must not be a success if a signing, a registration or the tool failed. The shown text
// must agree with the report.
#include <algorithm>
#include <sstream>
#include <string>
#include <vector>

#include "fuzz/fuzz.h"
#include "simulator/phone/journal.h"
#include "simulator/run/run_record.h"
#include "simulator/show/report_text.h"
#include "simulator/show/verdict_event.h"
#include "simulator/show/words.h"
#include "simulator/verdict/make_report.h"
#include "util/log.h"

using namespace simulator;
using nlohmann::json;

namespace {

const std::string kDigests[] = {std::string(64, 'a'), std::string(64, 'b'), std::string(64, 'c')};
const std::string kPayloads[] = {"2000" + kDigests[0], "2000" + kDigests[1], "0000", ""};
const std::string kPaths[] = {"/app/base.apk", "/app/lib/arm64/liba.so", "/app/lib/arm/liba.so",
                              "/b", ""};

// Numbers from the front of the input; zeros after its end.
class Input {
 public:
  Input(const uint8_t* data, size_t size) : at_(data), end_(data + size) {}

  bool IsAtEnd() const { return at_ == end_; }
  // A number below `count`.
  size_t Number(size_t count) { return IsAtEnd() ? 0 : *at_++ % count; }
  bool Flag() { return Number(2) == 1; }
  template <typename Value, size_t count>
  const Value& OneOf(const Value (&values)[count]) {
    return values[Number(count)];
  }

 private:
  const uint8_t* at_;
  const uint8_t* const end_;
};

// The journal of a run, and the outcomes with which the functions below compare the report.
struct Run {
  std::string journal = Event("start").Text("file", "base.apk").Text("path", kPaths[0]).Line();
  std::vector<std::string> granted;  // the payload of each successful signing
  std::vector<std::string> registered;
  bool has_failure = false;  // of a signing, of a registration, or of the tool itself
};

void AddLog(Input& input, Run* run) {
  static const std::string kLines[] = {"VeltSignJni starts: 3.\n",
                                       "VeltSign starts: zip_fd = 3, fd = 3.\n",
                                       "VeltSign finished: 0.\n",
                                       "VeltSignOat: Apk case.\n",
                                       "VeltSignOat: non-Apk (Jar) case\n",
                                       "VELT can't sign a file (result=0, errno 1: x).\n",
                                       "OpenArchiveFd(3) [file: /a] returned: -6: Empty archive\n",
                                       "Can't extract Android Manifest: Entry not found\n",
                                       "Can't extract RSA certificate: META-INF/A.RSA\n",
                                       "RSA could not verify data: 1C\n",
                                       "VeltSignJni: malformed apk: /a\n",
                                       "Can't find file in META-INF/MANIFEST.MF: a\n",
                                       "Integrity not confirmed: classes.dex\n",
                                       "VeltSignJni: File not verified: /app/lib/arm/liba.so\n",
                                       "File /app/lib/arm/liba.so is not opened",
                                       "Error 2: No such file or directory.\n",
                                       "Apk archive is not valid for fd=3, path=/a\n",
                                       "ZuAddCertificate: ZuNewCertificate failed -7.\n",
                                       "something else\n"};
  Event event("log");
  event.Number("priority", input.Flag() ? ANDROID_LOG_INFO : ANDROID_LOG_ERROR);
  run->journal += event.Text("tag", kLogTag).Text("text", input.OneOf(kLines)).Line();
}

void AddSign(Input& input, Run* run) {
  const std::string payload = input.OneOf(kPayloads);
  const bool is_granted = input.Flag();
  Event event("sign");
  event.Text("path", input.OneOf(kPaths)).Text("payload", payload);
  run->journal += event.Number("result", is_granted ? 0 : -1).Number("errno", 1).Line();
  if (is_granted) run->granted.push_back(payload);
  if (!is_granted) run->has_failure = true;
}

void AddVerify(Input& input, Run* run) {
  Event event("verify");
  event.Text("path", input.OneOf(kPaths)).Number("result", input.Flag() ? 0 : -1);
  run->journal += event.Number("errno", static_cast<int64_t>(input.Number(200))).Line();
}

void AddRegister(Input& input, Run* run) {
  const std::string name = input.OneOf(kPaths);
  const int64_t result = input.Flag() ? 0 : -7;
  run->journal += Event("register").Text("name", name).Number("result", result).Line();
  if (result == 0) run->registered.push_back(name);
  if (result != 0) run->has_failure = true;
}

void AddOther(Input& input, Run* run) {
  Event integrity("integrity");
  integrity.Number("pid", 0);
  run->journal += (input.Flag() ? integrity.Text("text", "0") : integrity.Null("text")).Line();
}

Run MakeRun(Input& input) {
  constexpr void (*kKinds[])(Input&, Run*) = {AddLog, AddSign, AddRegister, AddVerify, AddOther};
  Run run;
  Event exit("exit");
  const size_t end = input.Number(4);
  run.has_failure = end > 1;
  exit.Number(end == 3 ? "signal" : "status", end > 1 ? 9 : 0);
  while (!input.IsAtEnd()) kKinds[input.Number(5)](input, &run);
  run.journal += exit.Line();
  return run;
}

CertificateFacts MakeCertificate(Input& input) {
  CertificateFacts certificate;
  certificate.subject = certificate.issuer = "CN=signer";
  certificate.key.modulus_sha256 = input.OneOf(kDigests);
  certificate.key.sha256 = "of " + certificate.key.modulus_sha256;
  return certificate;
}

PackageFacts MakeFacts(Input& input) {
  PackageFacts facts;
  facts.kind = input.Flag() ? FileKind::kArchive : FileKind::kText;
  facts.archive_result = 0;
  facts.was_changed = input.Flag();
  facts.manifest.package_name = "com.app";
  facts.manifest.installer_name = input.Flag() ? "com.app" : "com.other";
  if (input.Flag()) facts.jar.key = ToolKey{input.OneOf(kDigests), 256, 2048, 65537, false};
  if (input.Flag()) facts.jar.certificate = MakeCertificate(input);
  facts.jar.block.is_whole = input.Flag();
  facts.jar.manifest = Archive::ReadResult::kRead;
  facts.jar.signature_files = {"META-INF/A.SF"};
  for (size_t i = input.Number(3); i > 0; --i) {
    facts.newer.push_back({"v2", MakeCertificate(input)});
  }
  facts.entries.push_back({{"classes.dex", 1, input.Flag()}, input.Flag(), false});
  for (size_t i = input.Number(3); i > 0; --i) {
    facts.libraries.push_back({"lib/arm64-v8a/liba.so", "lib/arm64/liba.so", input.Flag(),
                               input.Flag() ? 2 : 0, input.Flag()});
  }
  return facts;
}

bool IsGranted(const Run& run, const std::string& payload) {
  return std::find(run.granted.begin(), run.granted.end(), payload) != run.granted.end();
}

bool HasWarning(const Report& report, const Cause& cause) {
  return std::any_of(report.warnings.begin(), report.warnings.end(),
                     [&](const Reason& warning) { return warning.cause == &cause; });
}

void JudgeKey(const Run& run, const PackageFacts& facts, const Report& report) {
  Require(report.payload.empty() || IsGranted(run, report.payload),
          "the kernel got the reported payload");
  if (!report.key) return;
  const std::string& key = report.key->sha256;
  if (report.key->was_got) {
    Require(IsGranted(run, "2000" + key), "the kernel got the reported key");
  } else {
    Require(facts.jar.key && facts.jar.key->modulus_sha256 == key,
            "the reported key is the key that the tool reads");
  }
  const auto& shown = facts.jar.certificate;
  const bool is_other = shown && shown->key.modulus_sha256 != key;
  Require(HasWarning(report, cause::kCertificateOtherKey) == is_other,
          "the report warns if and only if the certificate has another key than the report");
  const auto is_foreign = [&](const NewerSignerFacts& signer) {
    return signer.certificate.key.modulus_sha256 != key;
  };
  const bool has_foreign = std::any_of(facts.newer.begin(), facts.newer.end(), is_foreign);
  Require(!has_foreign || HasWarning(report, cause::kOtherKey),
          "the report warns if a newer signer has another key than the report");
}

void JudgeItems(const Run& run, const Report& report) {
  size_t done = 0;
  for (const Item& item : report.items) {
    Require((item.reason.cause == nullptr) == (item.state == ItemState::kDone),
            "an item has no cause if and only if it is done");
    if (item.state != ItemState::kDone) continue;
    if (item.kind != ItemKind::kKey) ++done;
    const auto& names = run.registered;
    const bool is_registered = std::find(names.begin(), names.end(), item.name) != names.end();
    Require(item.kind != ItemKind::kKey || is_registered,
            "if a key item is done, libzu registered the key");
  }
  Require(done <= run.granted.size(), "the report has no more signed items than the kernel signed");
}

void JudgeVerdict(const Run& run, const PackageFacts& facts, const Report& report) {
  const bool is_good = StatusOf(report.verdict) == kAllSigned;
  Require(!is_good || !run.granted.empty(), "the kernel signed something if the verdict is good");
  Require(!is_good || !run.has_failure, "after a failure, the verdict is not good");
  const bool is_refused =
      std::any_of(report.items.begin(), report.items.end(),
                  [](const Item& item) { return item.state == ItemState::kRefused; });
  Require(!is_good || !is_refused, "with a refused item, the verdict is not good");
  Require(!is_good || report.items[0].state == ItemState::kDone,
          "the file itself was signed if the verdict is good");
  Require(report.verdict == Verdict::kNotSimulated || !facts.was_changed,
          "if the file became shorter, the verdict is NOT SIMULATED");
}

// The printed text and the verdict event must agree with the report.
void JudgeShown(const Report& report) {
  std::ostringstream line, all;
  PrintReport(report, Detail::kVerdict, Look(), line);
  PrintReport(report, Detail::kAll, Look(), all);
  const std::string head = line.str();
  Require(all.str().rfind(head, 0) == 0, "the verdict comes first");
  const std::string why = DecisiveReason(report);
  const size_t key = head.find(", key ");
  const std::string digest = report.key && why.empty() ? report.key->sha256 : "";
  Require(head.find(Printable(why, Look())) != std::string::npos, "the decisive reason is shown");
  Require(!why.empty() || (key != std::string::npos) == !digest.empty(),
          "a line without a reason shows a key if and only if the report has a key");
  Require(digest.empty() || head.compare(key + 6, 8, digest, 0, 8) == 0,
          "the shown key is the reported key");
  const bool is_got = all.str().find("the kernel got this digest") != std::string::npos;
  Require(is_got == (report.key && report.key->was_got),
          "the text says whether the kernel got the key");
  const bool is_alarmed = HasWarning(report, cause::kCertificateOtherKey);
  Require(!is_alarmed || head.find("   ! ") != std::string::npos,
          "if the certificate has another key, a warning is printed with the verdict");

  const json event = json::parse(VerdictEvent(report));
  Require(event["payload"] == report.payload, "the event has the payload");
  Require(event["status"] == static_cast<int>(StatusOf(report.verdict)),
          "the event has the status");
  Require(event["items"].size() == report.items.size(),
          "the event has as many items as the report");
  for (size_t i = 0; i < report.items.size(); ++i) {
    const Cause* const cause = report.items[i].reason.cause;
    Require(event["items"][i].value("reason", "") == (cause == nullptr ? "" : cause->code),
            "each item of the event has its reason");
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  const JudgeOptions options = {input.Flag()};
  const PackageFacts facts = MakeFacts(input);
  const Run run = MakeRun(input);
  const Report report = MakeReport(TakeApart(ParseEvents(run.journal)), facts, options);
  JudgeKey(run, facts, report);
  JudgeItems(run, report);
  JudgeVerdict(run, facts, report);
  JudgeShown(report);
  return 0;
}
