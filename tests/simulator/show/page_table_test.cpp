// The page's table of files: the order of its rows, its cells, the choice of the files to show, and
// the directory that all files have in common.
#include "simulator/show/page_table.h"

#include <gtest/gtest.h>

#include <regex>

#include "simulator/show/page.h"

using namespace simulator;

namespace {

Report Example(const std::string& file, Verdict verdict, size_t warnings = 0) {
  Report report;
  report.file = file;
  report.verdict = verdict;
  report.warnings.assign(warnings, {&cause::kSchemesStripped, "v2"});
  return report;
}

// The part of the page from the start of `from` to the end of `to`.
std::string PartOf(const std::vector<Report>& reports, const std::string& from,
                   const std::string& to) {
  Page page({0, ""});
  for (const Report& report : reports) page.Add(report);
  const std::string html = page.Html();
  const size_t start = html.find(from);
  if (start == std::string::npos) return {};
  return html.substr(start, html.find(to, start) + to.size() - start);
}

// The rows of the table without markup, with a bar after each cell.
std::vector<std::string> RowsOf(const std::vector<Report>& reports) {
  const std::string body = PartOf(reports, "<tbody", "</tbody>");
  const std::regex row("<tr [^\n]*");
  std::vector<std::string> rows;
  for (std::sregex_iterator at(body.begin(), body.end(), row), end; at != end; ++at) {
    const std::string cells = std::regex_replace(at->str(), std::regex("</t[dh]>"), "|");
    rows.push_back(std::regex_replace(cells, std::regex("<[^>]*>"), ""));
  }
  return rows;
}

using Lines = std::vector<std::string>;

}  // namespace

TEST(PageTable, HasTheWorstFirst) {
  Lines verdicts;
  for (const std::string& row :
       RowsOf({Example("a", Verdict::kTrustedJar), Example("b", Verdict::kSigned),
               Example("c", Verdict::kOtherSigner), Example("d", Verdict::kPartlySigned),
               Example("e", Verdict::kNotInstallable), Example("f", Verdict::kRefused),
               Example("g", Verdict::kNotTrustedJar), Example("h", Verdict::kNotLookedAt),
               Example("i", Verdict::kNotSimulated), Example("j", Verdict::kNotAccepted)})) {
    verdicts.push_back(row.substr(0, row.find("||")));
  }
  EXPECT_EQ(verdicts, (Lines{"NOT SIMULATED|i", "NOT LOOKED AT|h", "REFUSED|f", "NOT TRUSTED JAR|g",
                             "NOT INSTALLABLE|e", "NOT ACCEPTED|j", "PARTLY SIGNED|d",
                             "SIGNED, OTHER SIGNER|c", "SIGNED|b", "TRUSTED JAR|a"}));
}

TEST(PageTable, SortsByWarningsAndThenByTheCommandLine) {
  EXPECT_EQ(RowsOf({Example("a", Verdict::kSigned), Example("b", Verdict::kSigned, 1),
                    Example("c", Verdict::kSigned, 2), Example("d", Verdict::kSigned)}),
            (Lines{"SIGNED|c||2|||", "SIGNED|b||1|||", "SIGNED|a|||||", "SIGNED|d|||||"}));
}

TEST(PageTable, ShowsTheReasonAndTheSigner) {
  Report refused = Example("a", Verdict::kPartlySigned, 1);
  refused.package_name = "com.app";
  refused.items = {
      {ItemKind::kLibrary, "lib/arm/a.so", "", ItemState::kRefused, {&cause::kLibraryMissing, ""}}};
  Report good = Example("b", Verdict::kSigned);
  good.package_name = "com.good";
  good.signer.emplace();
  good.signer->subject = "CN=Vault";
  good.key = {std::string(64, 'b'), 2048, true};
  good.warnings = {{&cause::kOtherPackageName, "\"com.evil\""}};
  EXPECT_EQ(RowsOf({refused, good}),
            (Lines{"PARTLY SIGNED|a|lib/arm/a.so: it is not beside the package, but other "
                   "libraries are|1|com.app||",
                   "SIGNED|b|! phones install it as &quot;com.evil&quot;, but the tool reads "
                   "another package name|1|com.good|CN=Vault, RSA-2048, key bbbbbbbb…bbbbbb|"}));
}

TEST(PageTable, ShowsForWhichOtherSignerPhonesInstallIt) {
  Report report = Example("a", Verdict::kOtherSigner);
  report.key = {std::string(64, 'b'), 2048, true};
  CertificateFacts other;
  other.subject = "CN=Other";
  other.key = {"RSA", 2048, "", std::string(64, 'c')};
  report.installer.state = Judgement::State::kJudged;
  report.installer.ranges = {{{27, kNewestLevel}, true, {"v2"}, {{"v2", other}}, {}, {}}};
  EXPECT_EQ(
      RowsOf({report, Example("b", Verdict::kSigned)})[0],
      "SIGNED, OTHER SIGNER|a|phones install it as signed by CN=Other|||unknown, RSA-2048, key "
      "bbbbbbbb…bbbbbb|");
}

TEST(PageTable, ShowsTheKeyAfterALongName) {
  Report report = Example("a", Verdict::kSigned);
  report.signer.emplace();
  report.signer->subject = std::string(1000, 'n');
  report.key = {std::string(64, '1'), 2048, true};
  EXPECT_EQ(RowsOf({report, report})[0],
            "SIGNED|a||||" + std::string(kMostCellText, 'n') + "…, RSA-2048, key 11111111…111111|");
}

TEST(PageTable, HasAChoiceForEachVerdictThatThereIs) {
  const std::vector<Report> reports = {Example("a", Verdict::kSigned, 1),
                                       Example("b", Verdict::kRefused),
                                       Example("c", Verdict::kSigned)};
  const std::string choices = PartOf(reports, "<fieldset", "</fieldset>");
  const std::regex label("id=\"show-([^\"]*)\"[^>]*>([^<]*)<");
  Lines shown;
  for (std::sregex_iterator at(choices.begin(), choices.end(), label), end; at != end; ++at) {
    shown.push_back(at->str(1) + at->str(2));
  }
  EXPECT_EQ(shown, (Lines{"all all (3)", "refused refused (1)", "signed signed (2)",
                          "warned with warnings (1)"}));
  for (const char* code : {"refused", "signed", "warned"}) {
    const std::string rule = "body:has(#show-" + std::string(code) +
                             ":checked) :is(.files tbody tr, article):not(.is-" + code +
                             ") { display: none; }";
    EXPECT_NE(PartOf(reports, "<style>", "</style>").find(rule), std::string::npos) << rule;
  }
  EXPECT_NE(PartOf(reports, "<tbody", "</tbody>").find("class=\"is-signed is-warned\""),
            std::string::npos);
}

TEST(PageTable, HasNoChoiceWhereAllFilesAreAlike) {
  const std::vector<Report> alike(2, Example("a", Verdict::kSigned));
  EXPECT_EQ(PartOf(alike, "<fieldset", "</fieldset>"), "");
}

TEST(PageTable, ShowsTheCommonDirectoryOnce) {
  const std::vector<Report> reports = {Example("/store/one/base.apk", Verdict::kSigned),
                                       Example("/store/two/base.apk", Verdict::kSigned)};
  EXPECT_EQ(PartOf(reports, "<caption>", "</caption>"),
            "<caption>All files are below <span class=\"name\">/store/</span></caption>");
  EXPECT_EQ(RowsOf(reports), (Lines{"SIGNED|one/base.apk|||||", "SIGNED|two/base.apk|||||"}));
  EXPECT_EQ(PartOf({Example("a", Verdict::kSigned), Example("b", Verdict::kSigned)}, "<caption>",
                   "</caption>"),
            "<caption>The files, the worst first</caption>");
}

TEST(CommonDirectory, EndsAtASlashThatAllHave) {
  EXPECT_EQ(CommonDirectory({}), "");
  EXPECT_EQ(CommonDirectory({"a/b/c", "a/b/d"}), "a/b/");
  EXPECT_EQ(CommonDirectory({"a/bc", "a/bd"}), "a/");
  EXPECT_EQ(CommonDirectory({"a/b", "a/b/c"}), "a/");
  EXPECT_EQ(CommonDirectory({"a/b/c", "a/b/d", "x"}), "");
  EXPECT_EQ(CommonDirectory({"/a", "/b"}), "")
      << "the root directory is not shown as the common directory";
  EXPECT_EQ(CommonDirectory({"a/b", "a/b"}), "a/");
  EXPECT_EQ(CommonDirectory({"a/", "a/"}), "") << "each path keeps a part after the directory";
  EXPECT_EQ(CommonDirectory({"", "a/b"}), "");
}
