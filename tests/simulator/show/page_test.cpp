#include "simulator/show/page.h"

#include <gtest/gtest.h>

#include <ctime>
#include <optional>
#include <regex>

#include "simulator/phone/text.h"
#include "simulator/show/hostile_report.h"

using namespace simulator;

namespace {

// 2026-11-22 09:08:07 UTC. `date -u -d @1795338487` prints this time.
constexpr std::time_t kBegun = 1795338487;

std::string PageOf(const std::vector<Report>& reports) {
  Page page({kBegun, ""});
  for (const Report& report : reports) page.Add(report);
  return page.Html();
}

std::string PageOf(const Report& report) { return PageOf(std::vector<Report>{report}); }

bool Has(const std::string& page, const std::string& part) {
  return page.find(part) != std::string::npos;
}

size_t Count(const std::string& page, const std::string& part) {
  size_t count = 0;
  for (size_t at = 0; (at = page.find(part, at)) != std::string::npos; at += part.size()) ++count;
  return count;
}

// The tags of the page: each "<", and the text up to the next ">".
std::vector<std::string> TagsOf(const std::string& page) {
  static const std::regex kTag("<[^>]*>");
  return {std::sregex_token_iterator(page.begin(), page.end(), kTag), {}};
}

Report Example(Verdict verdict) {
  Report report;
  report.file = "base.apk";
  report.path = "/data/app/base.apk";
  report.verdict = verdict;
  return report;
}

Item Library(const std::string& name, const Cause* why) {
  const ItemState state = why == nullptr ? ItemState::kDone : ItemState::kRefused;
  return {ItemKind::kLibrary, name, "", state, {why, ""}};
}

}  // namespace

TEST(Page, ShowsVerdictItemsWarningsAndSigner) {
  Report report = Example(Verdict::kPartlySigned);
  report.package_name = "com.example.vault";
  report.items = {Library("lib/arm/a.so", nullptr),
                  Library("lib/arm/b.so", &cause::kLibraryChanged),
                  Library("lib/arm/c.so", &cause::kLibraryChanged)};
  report.warnings = {{&cause::kSchemesStripped, "v2"}};
  report.signer.emplace();
  report.signer->subject = "CN=Vault";
  report.signer->sha256 = std::string(64, 'c');
  report.signer->key = {"RSA", 2048, std::string(64, 'a'), std::string(64, 'b')};
  report.key = {std::string(64, 'b'), 2048, true};
  const std::string page = PageOf(report);
  for (const char* part :
       {"<p>1 file: 1 partly signed</p>", "<p class=\"verdict mixed\">PARTLY SIGNED</p>",
        "<bdi>base.apk</bdi>", "<p class=\"fact\">com.example.vault</p>",
        "<p class=\"fact\">signer CN=Vault, RSA-2048, key bbbbbbbb…bbbbbb</p>",
        ">✓</span> <span class=\"name\">lib/arm/a.so</span> <span class=\"outcome\">signed</span>",
        ">✗</span> <span class=\"name\">lib/arm/b.so</span> <span class=\"outcome\">not signed: "
        "its bytes are not those that the manifest lists</span>",
        "</span> the signature file says that the package is also signed with v2, but it is not: "
        "phones do not install the package</p>",
        "<p class=\"cure\">Sign the package again, as the last step that changes it.</p>",
        "<dt>key size (bits)</dt><dd>2048</dd>"}) {
    EXPECT_TRUE(Has(page, part)) << part << "\n" << page;
  }
  EXPECT_EQ(Count(page, cause::kLibraryChanged.cure), 1U)
      << "neighbours with the same cure show it once";
}

TEST(Page, BeginsAsEveryPageDoes) {
  EXPECT_EQ(PageOf(Example(Verdict::kSigned)).substr(0, kPageStart.size()), kPageStart);
}

TEST(Page, HasNoScriptAndNothingFromElsewhere) {
  const std::string page = PageOf(HostileReport("x"));
  EXPECT_TRUE(Has(page, "content=\"default-src 'none'; style-src 'unsafe-inline'; "));
  for (const std::string& tag : TagsOf(page)) {
    EXPECT_FALSE(std::regex_search(tag, std::regex("^<(script|link|img|iframe|object|embed|base)|"
                                                   " (src|on[a-z]+|srcset|action|data)=")))
        << tag;
    EXPECT_EQ(Has(tag, "href="), Has(tag, "href=\"#file-")) << tag;
  }
  EXPECT_FALSE(std::regex_search(page, std::regex("@import|https?:|url\\((?!#)")));
}

// Markup in the texts of a report, such as the file name, does not change the page's tags.
TEST(Page, HasTheSameMarkupForAllTexts) {
  // Both names contain "/", so both pages have the element for the common directory of the files.
  const std::string plain = PageOf({HostileReport("x/x"), HostileReport("x/x")});
  const std::string hostile = PageOf({HostileReport(kHostileText), HostileReport(kHostileText)});
  EXPECT_EQ(TagsOf(hostile), TagsOf(plain));
  EXPECT_GT(Count(hostile, "&lt;script&gt;"), 70U);
  EXPECT_TRUE(Has(hostile,
                  "&quot;&apos;&gt;&lt;a href=&apos;javascript:alert(1)&apos;&gt;"
                  "&amp;lt;&amp;{{verdict}}{{{verdict}}}{{&amp;verdict}}--&gt;"));
}

TEST(Page, ShowsInvalidAndHiddenCharactersAsBytes) {
  std::string page = PageOf(HostileReport(kHostileText));
  EXPECT_TRUE(
      Has(page, "\\x1b]0;x\\x07\\x09\\x0a\\x0d\\x7f\\xff\\xc3\\xc2\\x9b\\xd8\\x9c\\xe2\\x80"));
  for (const char* turned : {"\u009b", "\u061c", "\u200b", "\u202e", "\u2066", "\ufeff"}) {
    EXPECT_FALSE(Has(page, turned));
  }
  for (size_t at = 0; at < page.size();) {
    const size_t length = Utf8Length(std::string_view(page).substr(at));
    ASSERT_NE(length, 0U) << "no UTF-8 at " << at;
    EXPECT_TRUE(length > 1 || page[at] == '\n' || (page[at] >= 0x20 && page[at] < 0x7f)) << at;
    at += length;
  }
}

// {{{name}}} and {{&name}} would let markup through.
TEST(Page, TemplateEscapesEverything) {
  EXPECT_FALSE(Has(kPageTemplate, "{{{"));
  EXPECT_FALSE(std::regex_search(kPageTemplate, std::regex("\\{\\{\\s*[&=>]")));
  EXPECT_TRUE(Has(kPageTemplate, "{{file}}"));
}

TEST(Page, FillsInTheWholeTemplate) {
  const std::string page = PageOf(HostileReport("x"));
  EXPECT_FALSE(Has(page, "{{"));
  EXPECT_TRUE(Has(page, "</html>\n"));
}

TEST(Page, StaysBelow2MebibytesForALargeReport) {
  constexpr size_t kMany = 60'000;
  const std::string name(1000, '"');
  Report report = Example(Verdict::kPartlySigned);
  report.items.assign(kMany, {ItemKind::kLibrary, name, "", ItemState::kDone, {}});
  report.items.back().state = ItemState::kRefused;
  report.items.back().reason = {&cause::kToolError, name};
  report.protection.unlisted = {kMany, 1};
  report.protection.unlisted_names.assign(kMany, name);
  std::string journal;
  for (size_t i = 0; i < kMany; ++i) {
    journal += Event("verify").Text("path", i % 2 == 0 ? "a" : "b").Number("result", 0).Line();
  }
  report.events = ParseEvents(journal);
  const std::string page = PageOf(report);
  EXPECT_LT(page.size(), 2U << 20);
  EXPECT_TRUE(Has(page, "<p class=\"more\">59,800 more; 1 item of the whole list is refused</p>"));
  EXPECT_EQ(Count(page, "<p class=\"more\">59,800 more</p>"), 1U);
  EXPECT_TRUE(Has(page, "<p class=\"more\">59,800 more; the journal has them all</p>"));
  EXPECT_EQ(Count(page, "<li class=\"bad\"><span class=\"mark bad\""), 1U)
      << "a refusal is not left out";
}

TEST(Page, ShowsEverythingUpToTheLimits) {
  Report report = Example(Verdict::kSigned);
  report.items.assign(kMostPageLines, Library("a", nullptr));
  report.items.back() = Library(std::string(kMostPageText, 'b'), &cause::kLibraryChanged);
  const std::string page = PageOf(report);
  EXPECT_EQ(Count(page, "<span class=\"name\">"), kMostPageLines);
  EXPECT_TRUE(Has(page, ">" + std::string(kMostPageText, 'b') + "<"));
  EXPECT_FALSE(Has(page, " more"));
  EXPECT_LT(page.find(">a<"), page.find(">bbb")) << "in the order of the terminal's report";
}

// The euro sign has three bytes in UTF-8. The page shows all three bytes of a euro sign, or none.
TEST(Page, CutsNoCharacterInTwo) {
  Report report = Example(Verdict::kSigned);
  for (size_t i = 0; i < 3; ++i) {
    report.file = std::string(kMostPageText - i, 'a') + "€€";
    const std::string page = PageOf(report);
    EXPECT_TRUE(Has(page, ">" + std::string(kMostPageText - i, 'a') + "…<")) << page;
  }
  report.file = std::string(kMostPageText - 3, 'a') + "€€";
  EXPECT_TRUE(Has(PageOf(report), "a€…<"));
}

TEST(Page, HasATableOfFilesWhereThereAreSeveral) {
  EXPECT_FALSE(Has(PageOf(Example(Verdict::kSigned)), "<nav"));
  const std::string page = PageOf({Example(Verdict::kRefused), Example(Verdict::kTrustedJar)});
  EXPECT_TRUE(Has(page, "<p>2 files: 1 trusted JAR, 1 refused</p>"));
  EXPECT_TRUE(Has(page,
                  "<tr role=\"row\" class=\"is-trusted-jar\"><td role=\"cell\">"
                  "<span class=\"verdict good\">TRUSTED JAR</span></td><th role=\"rowheader\" "
                  "scope=\"row\"><a class=\"name\" href=\"#file-2\">base.apk</a></th>"))
      << page;
  EXPECT_TRUE(Has(page, "<article id=\"file-2\" class=\"is-trusted-jar\""));
}

TEST(Page, LeavesOutEmptySections) {
  const std::string page = PageOf(Example(Verdict::kNotLookedAt));
  EXPECT_TRUE(Has(page, "NOT LOOKED AT"));
  EXPECT_EQ(Count(page, "<h3>"), 1U) << "only the section on the file and the run";
  for (const char* part : {"<svg class=\"bar\"", "<ol", "<table", "SHA-256", "size (bytes)"}) {
    EXPECT_FALSE(Has(page, part)) << part;
  }
}

TEST(Page, DrawsEachPartOfThePackage) {
  const std::string page = PageOf(HostileReport("x"));
  EXPECT_TRUE(Has(page,
                  "verified 30.0 %, listed and not verified 20.0 %, not listed 10.0 %, the "
                  "signature itself 5.0 %, between the entries 35.0 %</desc>"));
  EXPECT_EQ(Count(page, "<rect fill=\"url(#unlisted)\" x="), 1U);
  EXPECT_TRUE(Has(page,
                  "<td class=\"number\">3</td><td class=\"number\">300</td>"
                  "<td class=\"number\">30.0</td>"));
}

TEST(Page, GroupsTheDigitsOfNumbers) {
  Report report = Example(Verdict::kSigned);
  for (const auto& [bytes, shown] :
       {std::pair(999U, "999"), std::pair(1234U, "1,234"), std::pair(12345U, "12,345"),
        std::pair(1234567U, "1,234,567")}) {
    report.protection.verified = {1, bytes};
    EXPECT_TRUE(Has(PageOf(report), std::string("<td class=\"number\">") + shown + "</td>"))
        << bytes;
  }
}

TEST(Page, ShowsWhereTheChainBreaks) {
  const std::string page = PageOf(HostileReport("x"));
  EXPECT_TRUE(Has(page, "<span class=\"link\">key</span> <span class=\"at\">x</span>"));
  EXPECT_TRUE(Has(page, "<span class=\"link\">certificate, where it breaks</span>"));
  EXPECT_TRUE(
      Has(page, "<span class=\"link\">manifest</span> <span class=\"at\">not reached</span>"));
}

TEST(Page, ShowsSchemesOfOneCertificateTogether) {
  Report report = Example(Verdict::kSigned);
  CertificateFacts one;
  one.sha256 = "1";
  CertificateFacts other;
  other.sha256 = "2";
  report.signer = one;
  report.newer = {{"v2", one}, {"v2", one}, {"v3", other}, {"v3", one}};
  const std::string page = PageOf(report);
  EXPECT_EQ(Count(page, "<h4>"), 2U);
  EXPECT_TRUE(Has(page, "<h4>Signed with v1, v2, v3</h4>"));
  EXPECT_TRUE(Has(page, "<h4>Signed with v3</h4>"));
}

TEST(Page, ShowsTheKernelsKeyOnlyForTheJarSigner) {
  Report report = Example(Verdict::kSigned);
  CertificateFacts certificate;
  certificate.key.modulus_sha256 = std::string(64, '0');
  report.newer = {{"v2", certificate}};
  EXPECT_TRUE(Has(PageOf(report), "0 (of the modulus alone)</dd>"));
  report.signer = certificate;
  report.key = {std::string(64, '1'), 2048, true};
  const std::string page = PageOf(report);
  EXPECT_TRUE(Has(page, "1 (of the modulus alone; the kernel got this digest)</dd>"));
  EXPECT_FALSE(Has(page, "0 (of the modulus alone"));
}

TEST(Page, HasTheAlarmsBelowTheFile) {
  Report report = Example(Verdict::kSigned);
  report.warnings = {{&cause::kOtherPackageName, "\"com.evil\""}};
  EXPECT_TRUE(Has(PageOf(report), "<p class=\"fact\">! phones install it as &quot;com.evil&quot;"));
}

// A name that is too long is cut, and the key after it is shown.
TEST(Page, ShowsTheKeyAfterALongName) {
  Report report = Example(Verdict::kSigned);
  report.signer.emplace();
  report.signer->subject = std::string(1000, 'n');
  report.key = {std::string(64, '1'), 2048, true};
  EXPECT_TRUE(Has(PageOf(report), "n…, RSA-2048, key 11111111…111111</p>"));
}

TEST(Page, ShowsTheFileTheTimeAndTheVersions) {
  Report report = Example(Verdict::kSigned);
  report.file_size = 1234567;
  report.file_sha256 = std::string(64, 'd');
  const std::string page = PageOf({report, report});
  EXPECT_TRUE(Has(page, "<time datetime=\"2026-11-22T09:08:07Z\">2026-11-22 09:08:07 UTC</time>"));
  for (const std::string& row :
       {std::string("<dt>path</dt><dd>/data/app/base.apk</dd>"),
        std::string("<dt>size (bytes)</dt><dd>1,234,567</dd>"),
        "<dt>SHA-256 digest</dt><dd>" + report.file_sha256 + "</dd>",
        std::string("<dt>time of the run</dt><dd>2026-11-22 09:08:07 UTC</dd>"),
        std::string("<dt>tool</dt><dd>apktoolkit " APKTOOLKIT_VERSION "</dd>"),
        std::string("<dt>simulator</dt><dd>apktoolkit-sim " APKTOOLKIT_VERSION "</dd>")}) {
    EXPECT_EQ(Count(page, row), 2U) << row;
  }
}

TEST(Page, ClaimsNoVersionOfAToolThatWasNamed) {
  Page page({kBegun, "/opt/<tool>"});
  page.Add(Example(Verdict::kSigned));
  EXPECT_EQ(Count(page.Html(), "/opt/&lt;tool&gt; (--tool; its version is not known)"), 2U);
  EXPECT_FALSE(Has(page.Html(), "apktoolkit " APKTOOLKIT_VERSION));
}

TEST(Page, SaysThatTheRunWasInterrupted) {
  const auto page_of = [](std::optional<size_t> unseen) {
    Page page({kBegun, ""});
    page.Add(Example(Verdict::kSigned));
    page.Add(Example(Verdict::kNotSimulated));
    return page.Html(unseen);
  };
  const std::string page = page_of(7);
  EXPECT_TRUE(
      Has(page, "<p>2 files: 1 signed, 1 not simulated; interrupted before 7 more files</p>"));
  EXPECT_TRUE(Has(page,
                  "The run was interrupted. 7 files of 9 were not looked at and are not on this "
                  "page.</p>"));
  EXPECT_TRUE(Has(page_of(0), "1 not simulated; interrupted</p>"));
  EXPECT_TRUE(Has(page_of(0), "The run was interrupted.</p>"));
  EXPECT_FALSE(Has(page_of({}), "interrupted"));
}

TEST(Page, PutsTheToolAndTheInstallerSideBySide) {
  Report report = Example(Verdict::kNotInstallable);
  report.chain = {{"key", LinkState::kHolds, "RSA-2048"}};
  report.items = {Library("lib/arm/a.so", nullptr)};
  report.signer.emplace();
  report.signer->subject = "CN=Vault";
  report.key = {std::string(64, 'b'), 2048, true};
  CertificateFacts other;
  other.subject = "CN=Other";
  other.key = {"EC", 256, std::string(64, 'a'), ""};
  report.installer.state = Judgement::State::kJudged;
  report.installer.ranges = {
      {{27, 29}, true, {"v1", "v2"}, {{"v2", other}, {"v2", other}}, {}, {{"W", {}, "a warning"}}},
      {{30, kNewestLevel}, false, {}, {}, {{"E", {}, "an error"}}, {}}};
  const std::string page = PageOf(report);
  const auto row = [](const char* who, const char* mark, const std::string& rest) {
    return "<tr role=\"row\"><th role=\"rowheader\" scope=\"row\">" + std::string(who) +
           "</th><td role=\"cell\" class=\"" + mark + rest + "</td></tr>";
  };
  const std::string schemes = "</td><td role=\"cell\" class=\"cell-schemes\">";
  const std::string cell = "</td><td role=\"cell\">";
  for (const std::string& part :
       {row("apktoolkit", "good\"><span class=\"mark\" aria-hidden=\"true\">✓</span> signs it",
            schemes + "v1" + cell + "<p>CN=Vault, RSA-2048, key bbbbbbbb…bbbbbb</p>" + cell),
        row("phones of API 27 to 29",
            "good\"><span class=\"mark\" aria-hidden=\"true\">✓</span> install it",
            schemes + "v1, v2" + cell + "<p>CN=Other, EC-256</p>" + cell +
                "<p>warning: a warning</p>"),
        row("phones of API 30 and later",
            "bad\"><span class=\"mark\" aria-hidden=\"true\">✗</span> refuse it",
            schemes + cell + cell + "<p>an error</p>")}) {
    EXPECT_TRUE(Has(page, part)) << part << "\n" << page;
  }
}

TEST(Page, SaysWhereTheInstallerWasNotAskedOrGaveUp) {
  Report report = Example(Verdict::kRefused);
  EXPECT_FALSE(Has(PageOf(report), "\"judgements\"")) << "the file is not a package";
  report.chain = {{"key", LinkState::kBroken, ""}};
  report.items = {Library("lib/arm/a.so", &cause::kLibraryChanged)};
  EXPECT_TRUE(Has(PageOf(report), "</span> were not asked</td>"));
  EXPECT_TRUE(Has(PageOf(report),
                  "</span> signs nothing</td><td role=\"cell\" class=\"cell-schemes\"></td><td "
                  "role=\"cell\"></td><td role=\"cell\"><p>lib/arm/a.so: its bytes are not those "
                  "that the manifest lists</p></td>"));
  report.installer.state = Judgement::State::kGaveUp;
  report.installer.why = "it took too long";
  report.items.push_back(Library("lib/arm/b.so", nullptr));
  const std::string page = PageOf(report);
  EXPECT_TRUE(Has(page, "</span> the verifier gave up</td>"));
  EXPECT_TRUE(Has(page, "<p>it took too long</p>"));
  EXPECT_TRUE(Has(page, "</span> signs only a part of it</td>"));
}

// The gate (verdict/gate.h) enforces --signer and --werror. It does not change what the tool does.
TEST(Page, ToolSignsAPackageThatTheGateRefuses) {
  Report report = Example(Verdict::kNotAccepted);
  report.chain = {{"key", LinkState::kHolds, ""}};
  report.items = {Library("lib/arm/a.so", nullptr),
                  {ItemKind::kSigner,
                   "signer",
                   "",
                   ItemState::kRefused,
                   {&cause::kSignerUnexpected, "another"}},
                  {ItemKind::kWarnings,
                   "warnings",
                   "",
                   ItemState::kRefused,
                   {&cause::kWarningsRefused, "one"}}};
  EXPECT_TRUE(Has(PageOf(report), "</span> signs it</td>"));
}

// The tool can register the key of a good package although nothing was signed.
TEST(Page, ToolThatOnlyRegistersTheKeySignsNothing) {
  Report report = Example(Verdict::kRefused);
  report.chain = {{"key", LinkState::kHolds, ""}};
  report.items = {Library("lib/arm/a.so", &cause::kLibraryChanged),
                  {ItemKind::kKey, "com.example.app", "", ItemState::kDone, {}}};
  EXPECT_TRUE(Has(PageOf(report), "</span> signs nothing</td>"));
}

// The name and the value of an option stay on one line, and no text is lost.
TEST(Page, KeepsOptionsOnOneLine) {
  Report report = Example(Verdict::kSigned);
  report.items = {Library("a", &cause::kLibraryNotInstalled)};
  report.items[0].state = ItemState::kAbsent;
  EXPECT_TRUE(
      Has(PageOf(report),
          "<p class=\"cure\">If the phone does not use this ABI, there is nothing to do. To "
          "extract libraries for 32-bit and 64-bit Arm, use <span "
          "class=\"option\">--install=all</span>.</p>"));
  EXPECT_TRUE(Has(PageOf(report), ".option { white-space: nowrap; }"));
  report.items = {Library("a", &cause::kUnsigned)};
  EXPECT_TRUE(Has(PageOf(report),
                  "apksigner sign <span class=\"option\">--v1-signing-enabled</span> true."));
}
