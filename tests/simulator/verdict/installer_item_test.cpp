#include <gtest/gtest.h>

#include "simulator/verdict/parts.h"
#include "simulator/verdict/wording.h"

using namespace simulator;

namespace {

RangeJudgement Taken(int first, int last) {
  RangeJudgement range;
  range.levels = {first, last};
  range.is_verified = true;
  range.schemes = {"v1", "v2"};
  return range;
}

RangeJudgement Refused(int first, int last, const InstallerIssue& issue) {
  RangeJudgement range;
  range.levels = {first, last};
  range.errors = {issue};
  return range;
}

const InstallerIssue kFault = {"A_FAULT", {"x"}, "a fault of x"};

Judgement Judged(const std::vector<RangeJudgement>& ranges) {
  return {Judgement::State::kJudged, "", ranges};
}

// The code and text of the item that AddInstallerItem adds; empty if it adds no item.
std::string Told(const Judgement& judgement) {
  std::vector<Item> items;
  AddInstallerItem(judgement, {}, &items);
  if (items.empty()) return {};
  EXPECT_EQ(items.size(), 1U);
  EXPECT_EQ(items[0].kind, ItemKind::kInstaller);
  EXPECT_EQ(items[0].state, ItemState::kRefused);
  return std::string(items[0].reason.cause->code) + ": " + items[0].reason.Text();
}

std::string Why(const InstallerIssue& issue) {
  return Told(Judged({Refused(27, kNewestLevel, issue)}));
}

CertificateFacts WithKey(const std::string& key) {
  CertificateFacts certificate;
  certificate.key = {"RSA", 2048, key, key};
  return certificate;
}

}  // namespace

TEST(InstallerItem, IsAddedOnlyForARefusal) {
  EXPECT_EQ(Told({}), "");
  EXPECT_EQ(Told({Judgement::State::kMissing, "why", {}}), "");
  EXPECT_EQ(Told(Judged({Taken(27, kNewestLevel)})), "");
  EXPECT_EQ(TakersText(Judged({Taken(27, 33)})),
            "phones of API 27 to 33 install it, verified by v1, v2");
}

TEST(InstallerItem, SaysWhyNoPhoneInstallsThePackage) {
  const Judgement judgement = Judged({Refused(27, kNewestLevel, kFault)});
  EXPECT_EQ(Told(judgement), "not-installable: phones do not install it: a fault of x (A_FAULT)");
  EXPECT_EQ(TakersText(judgement), "");
}

TEST(InstallerItem, SaysWhichPhonesInstallThePackage) {
  const Judgement judgement = Judged({Taken(27, 29), Refused(30, kNewestLevel, kFault)});
  EXPECT_EQ(Told(judgement),
            "not-installable-on-some: not all phones install it: those of API 27 to 29 do, but "
            "those of API 30 and later refuse it: a fault of x (A_FAULT)");
  EXPECT_EQ(TakersText(judgement), "");
  EXPECT_EQ(Told(Judged({Refused(27, 27, kFault), Taken(28, 29), Refused(30, 32, kFault),
                         Refused(33, 33, kFault)})),
            "not-installable-on-some: not all phones install it: those of API 28 to 29 do, but "
            "those of API 27 and those of API 30 to 33 refuse it: a fault of x (A_FAULT)");
}

TEST(InstallerItem, NamesTheEntry) {
  const std::string start = "not-installable: phones do not install it: ";
  EXPECT_EQ(Why({"JAR_SIG_ZIP_ENTRY_DIGEST_DID_NOT_VERIFY", {"a/b"}, ""}),
            start + "a/b was changed after it was signed");
  EXPECT_EQ(Why({"JAR_SIG_NO_ZIP_ENTRY_DIGEST_IN_MANIFEST", {"a/b"}, ""}),
            start + "a/b was added after signing: the manifest does not list it");
  EXPECT_EQ(Why({"JAR_SIG_DUPLICATE_ZIP_ENTRY", {"a/b"}, ""}),
            start + "a/b is in it more than once");
  // Without the entry's name, the item shows the verifier's own text and the name of the issue.
  EXPECT_EQ(Why({"JAR_SIG_DUPLICATE_ZIP_ENTRY", {}, "twice"}),
            start + "twice (JAR_SIG_DUPLICATE_ZIP_ENTRY)");
}

TEST(InstallerItem, VerifierThatGaveUpIsARefusal) {
  EXPECT_EQ(Told({Judgement::State::kGaveUp, "it ended", {}}),
            "installer-gave-up: the installer's verifier gave up: it ended");
}

// A phone verifies only the newest of the package's schemes that the phone knows. OtherSigner
// looks at all signers of that scheme.
TEST(OtherSigner, IsOneOfTheNewestScheme) {
  Report report;
  report.signer = WithKey("own");
  report.key = {"own", 2048, true};
  const auto is_other = [&](const std::vector<std::pair<std::string, std::string>>& signers) {
    RangeJudgement range = Taken(27, kNewestLevel);
    for (const auto& [scheme, key] : signers) range.signers.push_back({scheme, WithKey(key)});
    return OtherSigner(Judged({range}), report) != nullptr;
  };
  EXPECT_FALSE(is_other({}));
  EXPECT_FALSE(is_other({{"v1", "own"}}));
  EXPECT_TRUE(is_other({{"v2", "own"}, {"v3", "other"}}));
  EXPECT_FALSE(is_other({{"v2", "other"}, {"v3", "own"}}));
  EXPECT_TRUE(is_other({{"v2", "own"}, {"v2", "other"}}));
  EXPECT_TRUE(is_other({{"v2", "other"}, {"v2", "own"}}));
}

// OtherSigner looks only at the newest phones that install the package.
TEST(OtherSigner, IsTheSignerForTheNewestPhonesThatInstall) {
  Report report;
  report.signer = WithKey("own");
  RangeJudgement old = Taken(27, 27), other = Taken(28, 32);
  old.signers = {{"v2", WithKey("own")}};
  other.signers = {{"v3", WithKey("other")}};
  EXPECT_NE(OtherSigner(Judged({old, other, Refused(33, 40, kFault)}), report), nullptr);
  std::swap(old.signers, other.signers);
  EXPECT_EQ(OtherSigner(Judged({old, other}), report), nullptr);
}
