#include "simulator/show/junit.h"

#include <gtest/gtest.h>

#include "simulator/show/good_report.h"
#include "simulator/show/hostile_report.h"
#include "support/files.h"
#include "support/process.h"

using namespace simulator;

namespace {

Report Refused(const std::string& file, Verdict verdict, const Cause* cause) {
  Report report = GoodReport(file);
  report.verdict = verdict;
  report.items = {{ItemKind::kPackage, "package", "", ItemState::kRefused, {cause, "why"}}};
  return report;
}

std::string XmlOf(const std::vector<Report>& reports) {
  Junit junit;
  for (const Report& report : reports) junit.Add(report);
  return junit.Xml();
}

// The elements that Python's XML parser finds: the name, the attributes and the text of each.
std::string ReadByPython(const std::string& xml) {
  const DiskFile file({xml.begin(), xml.end()});
  const ProcessResult run = RunProcess({"python3", "-c", R"(
import sys, xml.etree.ElementTree as tree
for element in tree.parse(sys.argv[1]).iter():
    print(element.tag, sorted(element.attrib.items()), repr((element.text or "").strip())))",
                                        file.path()});
  EXPECT_EQ(run.errors, "") << xml;
  return run.output;
}

}  // namespace

TEST(Junit, BeginsAsALaterRunExpects) {
  EXPECT_EQ(XmlOf({}).substr(0, kJunitStart.size()), kJunitStart);
}

TEST(Junit, HasACaseForEachFileAndCountsThem) {
  Report doubtful = GoodReport("d.apk");
  doubtful.warnings = {{&cause::kWeakKey, "1024"}};
  const std::string read = ReadByPython(
      XmlOf({GoodReport("a.apk"), Refused("b.apk", Verdict::kRefused, &cause::kToolError),
             Refused("c.apk", Verdict::kNotSimulated, &cause::kToolNotStarted), doubtful}));
  const std::string counts = "('errors', '1'), ('failures', '1'), ('name', 'apktoolkit-sim'), ";
  EXPECT_EQ(
      read,
      "testsuites [" + counts +
          "('tests', '4')] ''\n"
          "testsuite [" +
          counts +
          "('skipped', '0'), ('tests', '4')] ''\n"
          "properties [] ''\n"
          "property [('name', 'version'), ('value', '" APKTOOLKIT_VERSION
          "')] ''\n"
          "testcase [('classname', 'apktoolkit-sim'), ('name', 'a.apk')] ''\n"
          "testcase [('classname', 'apktoolkit-sim'), ('name', 'b.apk')] ''\n"
          "failure [('message', 'REFUSED: it logged an error: why'), ('type', 'tool-error')] "
          "'package: not signed: it logged an error: why\\n    docs/messages.md has every "
          "message.'\n"
          "testcase [('classname', 'apktoolkit-sim'), ('name', 'c.apk')] ''\n"
          "error [('message', 'NOT SIMULATED: why'), ('type', 'tool-not-started')] "
          "'package: not signed: why\\n    Check --tool and --runner.'\n"
          "testcase [('classname', 'apktoolkit-sim'), ('name', 'd.apk')] ''\n"
          "system-out [] 'warning: its RSA key has 1024 bits; fewer than 2048 bits are not safe\\n"
          "    Sign a new app with a key of 2048 bits or more. For a published "
          "app, a new key changes the signer.'\n");
}

TEST(Junit, SaysThatTheInstallerWasNotAsked) {
  Report unasked = GoodReport("a.apk");
  unasked.installer = {Judgement::State::kMissing, "java is missing", {}};
  EXPECT_NE(ReadByPython(XmlOf({unasked}))
                .find("system-out [] \"warning: no phone's installer was asked: java is missing"),
            std::string::npos)
      << XmlOf({unasked});
}

TEST(Junit, FilePassesOnlyIfItsStatusIsZero) {
  constexpr struct {
    Verdict verdict;
    const char* element;
  } kExpected[] = {
      {Verdict::kSigned, ""},
      {Verdict::kOtherSigner, ""},
      {Verdict::kTrustedJar, ""},
      {Verdict::kPartlySigned, "<failure "},
      {Verdict::kNotInstallable, "<failure "},
      {Verdict::kNotAccepted, "<failure "},
      {Verdict::kRefused, "<failure "},
      {Verdict::kNotTrustedJar, "<failure "},
      {Verdict::kNotLookedAt, "<error "},
      {Verdict::kNotSimulated, "<error "},
  };
  for (const auto& [verdict, element] : kExpected) {
    // The element is the same with and without an item that states the reason.
    Report bare = GoodReport("a");
    bare.verdict = verdict;
    for (const Report& report : {Refused("a", verdict, &cause::kToolError), bare}) {
      const std::string xml = XmlOf({report});
      const bool is_good = *element == '\0';
      EXPECT_EQ(
          xml.find("<failure") == std::string::npos && xml.find("<error") == std::string::npos,
          is_good);
      if (!is_good) {
        EXPECT_NE(xml.find(element), std::string::npos) << xml;
      }
    }
  }
}

TEST(Junit, HostileTextDoesNotBecomeMarkup) {
  const std::string read = ReadByPython(XmlOf({HostileReport(kHostileText)}));
  EXPECT_NE(read.find("</title></style><script>"), std::string::npos) << read;
  EXPECT_EQ(read.find("\nscript "), std::string::npos);
  EXPECT_EQ(read.find("\nimg "), std::string::npos);
}

// The text has all bytes except 0, all code points from U+0080 to U+FFFF, even the surrogates, and
// a few code points above U+FFFF. XML does not allow some of these code points (XML 1.0 §2.2).
TEST(Junit, EveryCharacterGivesAWellFormedDocument) {
  std::string text;
  for (int byte = 1; byte < 256; ++byte) text += static_cast<char>(byte);
  const auto add = [&text](uint32_t code) {
    const auto tail = [code](int shift) {
      return static_cast<char>(0x80U | ((code >> shift) & 0x3fU));
    };
    if (code < 0x800) {
      text += {static_cast<char>(0xc0U | code >> 6), tail(0)};
    } else if (code < 0x10000) {
      text += {static_cast<char>(0xe0U | code >> 12), tail(6), tail(0)};
    } else {
      text += {static_cast<char>(0xf0U | code >> 18), tail(12), tail(6), tail(0)};
    }
  };
  for (uint32_t code = 0x80; code < 0x10000; ++code) add(code);
  for (const uint32_t code : {0x10000U, 0x1f600U, 0x1fffeU, 0x10fffdU, 0x10ffffU}) add(code);
  const std::string read = ReadByPython(XmlOf({HostileReport(text)}));
  EXPECT_NE(read.find("testcase "), std::string::npos);
  EXPECT_NE(read.find(R"(\\xef\\xbf\\xbf)"), std::string::npos);
}
