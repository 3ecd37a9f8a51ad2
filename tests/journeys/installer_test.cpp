// Tests how the simulator reports the judgement of the phones' installer on real packages: in the
// lines that a person reads, and in the journal. apksig, the platform's own verifier, makes this
// judgement.
#include <gtest/gtest.h>

#include <filesystem>
#include <nlohmann/json.hpp>
#include <sstream>

#include "support/files.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

using Lines = std::vector<std::string>;
using nlohmann::json;

// The path of `name` in the directory of the packages that make_golden_packages makes.
std::string Golden(const std::string& name) { return std::string(GOLDEN_PACKAGES) + "/" + name; }

// --timeout gives the verifier, a Java program, enough time on a busy machine.
ProcessResult Run(const std::string& name, Lines options) {
  options.insert(options.begin(), {"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--timeout", "300"});
  options.emplace_back("base.apk");
  return RunProcess(options, Golden(name));
}

// Returns the verdict, such as "NOT INSTALLABLE", the text of the installer's line if there is such
// a line, and the simulator's exit status.
Lines Told(const std::string& name, const Lines& options = {}) {
  const ProcessResult run = Run(name, options);
  EXPECT_EQ(run.errors, "");
  Lines told;
  std::istringstream text(run.output);
  for (std::string line; std::getline(text, line);) {
    if (told.empty()) told.push_back(line.substr(0, line.find("  ")));
    for (const std::string start : {"  ✗ installer", "    installer:"}) {
      if (line.rfind(start, 0) != 0) continue;
      told.push_back(line.substr(line.find_first_not_of(' ', start.size())));
    }
  }
  told.push_back("-> " + std::to_string(run.status));
  return told;
}

json VerdictOf(const std::string& name, Lines options = {}) {
  options.emplace_back("--json");
  std::istringstream lines(Run(name, options).output);
  json event;
  for (std::string line; std::getline(lines, line);) event = json::parse(line);
  return event;
}

}  // namespace

TEST(Installer, AcceptsWhatApksignerSigned) {
  EXPECT_EQ(Told("apksigner-sha256-2048"),
            Lines({"SIGNED", "phones of API 27 and later install it, verified by v2, v3", "-> 0"}));
  EXPECT_EQ(Told("v1-alone"),
            Lines({"SIGNED", "phones of API 27 and later install it, verified by v1", "-> 0"}));
}

// The tool does not check the digest of AndroidManifest.xml. Anybody can therefore put another
// AndroidManifest.xml under the signature of an app.
TEST(Installer, RefusesAForeignManifestUnderTheVictimsSignature) {
  EXPECT_EQ(Told("foreign-manifest"),
            Lines({"NOT INSTALLABLE",
                   "phones do not install it: AndroidManifest.xml was changed after it was signed",
                   "-> 1"}));
  EXPECT_EQ(Told("foreign-manifest", {"--installer=off"}), Lines({"SIGNED", "-> 0"}));
}

TEST(Installer, RefusesAPackageWithoutItsDex) {
  EXPECT_EQ(Told("without-dex"), Lines({"NOT INSTALLABLE",
                                        "phones do not install it: classes.dex was removed after "
                                        "it was signed: the manifest still lists it",
                                        "-> 1"}));
}

// The tool checks the library beside the package, and not the one inside.
TEST(Installer, RefusesALibraryChangedInsideThePackage) {
  EXPECT_EQ(Told("changed-inside"),
            Lines({"NOT INSTALLABLE",
                   "phones do not install it: lib/arm64-v8a/libvault.so was changed after it was "
                   "signed",
                   "-> 1"}));
}

TEST(PackageEntries, AreComparedEvenIfNoInstallerIsAsked) {
  const json event = VerdictOf("foreign-manifest", {"--installer=off"});
  EXPECT_EQ(event["verdict"], "signed");
  EXPECT_EQ(event["entries"]["differing"]["names"], json({"AndroidManifest.xml"}));
  EXPECT_EQ(event["entries"]["differing"]["looked_at"], 0);
  EXPECT_EQ(event["entries"]["matching"]["entries"], 3);
  EXPECT_EQ(event["entries"]["matching"]["looked_at"], 3);
  ASSERT_EQ(event["warnings"].size(), 1U);
  EXPECT_EQ(event["warnings"][0]["reason"], "entries-changed");
  const json without = VerdictOf("without-dex", {"--installer=off"});
  EXPECT_EQ(without["entries"]["missing"]["names"], json({"classes.dex"}));
  ASSERT_EQ(without["warnings"].size(), 1U);
  EXPECT_EQ(without["warnings"][0]["reason"], "entries-missing");
}

// With --install, the simulator itself extracts the library just before the run, so nobody changed
// it after the extraction.
TEST(PackageEntries, LibraryChangedInsideThePackageIsNotBlamedOnTheInstallation) {
  const json event = VerdictOf("changed-inside", {"--installer=off", "--install"});
  EXPECT_EQ(event["verdict"], "partly-signed");
  EXPECT_EQ(event["items"][1]["reason"], "library-changed-inside");
  EXPECT_EQ(event["items"][1]["text"], "the package's own copy of it does not match the manifest");
  EXPECT_EQ(event["warnings"], json::array());
  EXPECT_EQ(event["entries"]["differing"]["looked_at"], 1);
}

// The verifier reports the wrong length of META-INF/CERT.SF as an error of the package. The length
// is in the local header and in the central directory header of the entry. The test changes both.
TEST(Installer, RefusesAnEntryThatIsLongerThanItClaims) {
  const TempDir directory;
  const ProcessResult made = RunProcess({"bash", "-e", "-c", R"(cp -r "$0"/* .
python3 -c '
import struct, zipfile
name = "META-INF/CERT.SF"
at = zipfile.ZipFile("base.apk").getinfo(name).header_offset
data = bytearray(open("base.apk", "rb").read())
for field in (at + 22, data.rindex(name.encode()) - 46 + 24):
    struct.pack_into("<I", data, field, 10)
open("base.apk", "wb").write(data)')",
                                         Golden("v1-alone")},
                                        directory.path());
  ASSERT_EQ(made.status, 0) << made.errors;
  const ProcessResult run = RunProcess({SimulatorPath(), "base.apk"}, directory.path());
  EXPECT_EQ(run.status, 1);
  EXPECT_NE(run.output.find("phones do not install it: Failed to read data of compressed entry "
                            "META-INF/CERT.SF (MALFORMED_APK)\n"),
            std::string::npos)
      << run.output << run.errors;
}

// Phones of API 27 verify v2, and later phones verify v3. Both refuse the packages. The message
// gives the reason of the phones of API 27.
TEST(Installer, RefusesAPackageChangedAfterItsV2Signature) {
  for (const char* name : {"commented", "changed-inside-v2"}) {
    EXPECT_EQ(
        Told(name),
        Lines({"NOT INSTALLABLE",
               "phones do not install it: it was changed after it was signed with v2", "-> 1"}))
        << name;
  }
}

TEST(Installer, SaysWhichPhonesRefuse) {
  EXPECT_EQ(
      Told("target-30-v1-alone"),
      Lines({"NOT INSTALLABLE",
             "not all phones install it: those of API 27 to 29 do, but those of API 30 and later "
             "refuse it: an app that targets API 30 must be signed with v2 or later",
             "-> 1"}));
  EXPECT_EQ(Told("target-30-v1-alone", {"--api", "27-29"}),
            Lines({"SIGNED", "phones of API 27 to 29 install it, verified by v1", "-> 0"}));
  EXPECT_EQ(Told("target-30-v1-alone", {"--api", "29"}),
            Lines({"SIGNED", "phones of API 29 install it, verified by v1", "-> 0"}));
}

TEST(Installer, RefusesAPackageThatNeedsNewerPhones) {
  EXPECT_EQ(
      Told("apksigner-sha256-2048", {"--api", "16-17"}),
      Lines({"NOT INSTALLABLE",
             "phones do not install it: the app needs API 18 or later (MIN_SDK_VERSION)", "-> 1"}));
}

TEST(Installer, OtherSignerIsShownInTheVerdict) {
  // For a rotated key, newer versions of apksigner write v3.1 in addition to v2 and v3.
  const std::string takers = "phones of API 27 and later install it, verified by v2, v3";
  Lines rotated = Told("rotated-key");
  ASSERT_EQ(rotated.size(), 3U);
  rotated[1].resize(takers.size());
  EXPECT_EQ(rotated, Lines({"SIGNED, OTHER SIGNER", takers, "-> 0"}));
  EXPECT_EQ(Told("two-signers"),
            Lines({"SIGNED, OTHER SIGNER", "phones of API 27 and later install it, verified by v2",
                   "-> 0"}));
  // Phones before API 28 do not know v3. They verify v2, which is made with the first key.
  EXPECT_EQ(Told("rotated-key", {"--api", "27"}),
            Lines({"SIGNED", "phones of API 27 install it, verified by v2", "-> 0"}));
}

// If the verifier is asked about all API levels at once, it gives one answer for all of them. For
// this package, the answer would name the signer with the first key. The simulator therefore asks
// about ranges of levels if a package has v3 or v3.1.
TEST(Installer, SignerOnlyForLaterPhonesIsFound) {
  const Lines told = Told("later-v3");
  EXPECT_EQ(told.front(), "NOT INSTALLABLE");
  // The reason is not compared, because it depends on the version of apksig.
  EXPECT_EQ(told[1].substr(0, told[1].find("refuse it: ")),
            "not all phones install it: those of API 27 and those of API 30 and later do, but "
            "those of API 28 to 29 ");
  EXPECT_EQ(told.back(), "-> 1");
  EXPECT_EQ(Told("later-v3", {"--api", "27"}),
            Lines({"SIGNED", "phones of API 27 install it, verified by v2", "-> 0"}));
  EXPECT_EQ(Told("later-v3", {"--api", "30-"}),
            Lines({"SIGNED, OTHER SIGNER", "phones of API 30 and later install it, verified by v3",
                   "-> 0"}));
}

// Phones of API 27 verify v2, and later phones verify v3. Both signatures are correct, but the
// signer of v3 has no lineage from the signer of v2.
TEST(Installer, RefusesAV3SignerWithoutALineageFromTheV2Signer) {
  const Lines told = Told("foreign-v3");
  EXPECT_EQ(told.front(), "NOT INSTALLABLE");
  EXPECT_NE(told[1].find("(V3_SIG_PAST_SIGNERS_MISMATCH)"), std::string::npos) << told[1];
  EXPECT_EQ(told.back(), "-> 1");
  EXPECT_EQ(Told("foreign-v3", {"--api", "27"}),
            Lines({"SIGNED", "phones of API 27 install it, verified by v2", "-> 0"}));
}

// Older versions of apksig do not know v3.1, and would name the first key for all phones. The
// verdict for all phones together must not be SIGNED, whichever version apksig has. Phones of
// API 27 to 32 do not use this package's v3.1 signature. The verdict for them alone is SIGNED.
TEST(Installer, SignerOfSchemeV31IsNotSkipped) {
  const ProcessResult run = RunProcess(
      {SimulatorPath(), "--quiet", "--installer=required", Golden("later-v31") + "/base.apk"});
  EXPECT_NE(run.output, "");
  EXPECT_NE(run.output.substr(0, 8), "SIGNED  ") << run.output;
  EXPECT_EQ(Told("later-v31", {"--api", "27-32"}).front(), "SIGNED");
}

TEST(Installer, RefusalByTheOldestPhonesIsReportedDespiteV3) {
  EXPECT_EQ(
      Told("without-v2"),
      Lines({"NOT INSTALLABLE",
             "not all phones install it: those of API 28 and later do, but those of API 27 refuse "
             "it: it was also signed with APK Signature Scheme v2, but that signature is missing",
             "-> 1"}));
}

TEST(Installer, RefusalByTheToolStaysEvenIfPhonesInstall) {
  EXPECT_EQ(
      Told("apksigner-ec"),
      Lines({"REFUSED", "phones of API 27 and later install it, verified by v2, v3", "-> 1"}));
  EXPECT_EQ(Told("changed-dex")[0], "REFUSED");
}

TEST(Installer, JournalHasTheWholeAnswer) {
  const json taken = VerdictOf("apksigner-sha256-2048");
  EXPECT_EQ(taken["verdict"], "signed");
  EXPECT_EQ(taken["installer"]["state"], "judged");
  // Phones of API 27 verify v2, and all later phones verify v3.
  ASSERT_EQ(taken["installer"]["levels"].size(), 2U);
  const json& before = taken["installer"]["levels"][0];
  EXPECT_EQ(before["first"], 27);
  EXPECT_EQ(before["last"], 27);
  EXPECT_EQ(before["installs"], true);
  ASSERT_EQ(before["signers"].size(), 1U);
  EXPECT_EQ(before["signers"][0]["scheme"], "v2");
  const json& levels = taken["installer"]["levels"][1];
  EXPECT_EQ(levels["first"], 28);
  EXPECT_FALSE(levels.contains("last"));
  EXPECT_EQ(levels["installs"], true);
  ASSERT_EQ(levels["signers"].size(), 1U);
  EXPECT_EQ(levels["signers"][0]["scheme"], "v3");
  EXPECT_EQ(levels["signers"][0]["certificate_sha256"], taken["signers"][0]["certificate_sha256"]);

  const json refused = VerdictOf("foreign-manifest");
  EXPECT_EQ(refused["verdict"], "not-installable");
  EXPECT_EQ(refused["items"].back()["kind"], "installer");
  EXPECT_EQ(refused["items"].back()["reason"], "not-installable");
  const json& error = refused["installer"]["levels"][0]["errors"][0];
  EXPECT_EQ(error["issue"], "JAR_SIG_ZIP_ENTRY_DIGEST_DID_NOT_VERIFY");
  EXPECT_EQ(error["parameters"][0], "AndroidManifest.xml");
}

// The verifier's answer is one line of JSON, whatever the names of the entries are.
TEST(Installer, OddNamesDoNotBreakTheAnswer) {
  const TempDir directory;
  const ProcessResult made = RunProcess({"python3", "-c", R"(
import shutil, sys, zipfile
shutil.copy(sys.argv[1], "base.apk")
with zipfile.ZipFile("base.apk", "a") as archive:
    for name in ('a"b\\c', "line\nend", "\u202e", "gr\u00fcn", "\U0001f600"):
        archive.writestr(name, "x"))",
                                         Golden("v1-alone") + "/base.apk"},
                                        directory.path());
  ASSERT_EQ(made.status, 0) << made.errors;
  const ProcessResult run = RunProcess({SimulatorPath(), "--quiet", "base.apk"}, directory.path());
  EXPECT_EQ(run.output.substr(0, 17), "NOT INSTALLABLE  ") << run.output << run.errors;
}

// This test's `java` waits 0.5 s, so that the tool's run normally ends first. After the wait,
// `java` changes the file and starts the verifier. The verdict of a changed file is NOT SIMULATED.
// A new hard link to the file does not count as a change.
TEST(Installer, FileThatChangesBeforeItsAnswerHasNoResult) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  std::filesystem::copy(Golden("apksigner-sha256-2048") + "/base.apk", apk);
  const auto told_with = [&](const std::string& change) {
    directory.WriteProgram(
        "java", "#!/bin/sh\nPATH=${PATH#*:}\nsleep 0.5\n" + change + "\nexec java \"$@\"\n");
    return RunProcess({"bash", "-c", "PATH=\"$0:$PATH\" \"$@\"", directory.path(), SimulatorPath(),
                       "--quiet", "--installer=required", apk});
  };
  const ProcessResult changed = told_with("touch -d 2001-01-01 '" + apk + "'");
  EXPECT_EQ(changed.status, 3);
  EXPECT_EQ(changed.output, "NOT SIMULATED  " + apk + "   it was changed during the run\n");
  EXPECT_EQ(told_with("ln '" + apk + "' '" + apk + ".link'").status, 0);
}

// The simulator finds no Java here. It prints no message about this, because it does not ask the
// installer about a JAR.
TEST(Installer, IsNotAskedAboutAJar) {
  const TempDir directory;
  const ProcessResult made = RunProcess(
      {"python3", "-c", "import zipfile; zipfile.ZipFile('a.jar', 'w').writestr('a', 'a')"},
      directory.path());
  ASSERT_EQ(made.status, 0) << made.errors;
  const ProcessResult run =
      RunProcess({"env", "PATH=/nowhere", SimulatorPath(), "--json", "a.jar"}, directory.path());
  EXPECT_NE(run.output.find(R"("installer":{"state":"not-asked","levels":[]})"), std::string::npos)
      << run.output;
  EXPECT_EQ(run.errors, "");
}
