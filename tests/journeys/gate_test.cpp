// Tests the simulator as a gate, which stops bad packages in a build pipeline: expected signers,
// warnings that count as refusals, and the journal that a program reads. openssl and coreutils
// compute the expected digests.
#include <gtest/gtest.h>

#include <filesystem>
#include <nlohmann/json.hpp>
#include <sstream>

#include "support/files.h"
#include "support/package.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

using Lines = std::vector<std::string>;
using nlohmann::json;

// The path of `name` in the directory of the packages that make_golden_packages makes.
std::string Golden(const std::string& name) { return std::string(GOLDEN_PACKAGES) + "/" + name; }

std::string Apk(const std::string& name) { return Golden(name) + "/base.apk"; }

// The output of a shell command, without its line end. In the command, $0 is the certificate file
// of the test key `key`.
std::string OfCertificate(const std::string& key, const std::string& command) {
  const ProcessResult run =
      RunProcess({"bash", "-o", "pipefail", "-c", command, Golden(key + ".pem")});
  EXPECT_EQ(run.status, 0) << run.errors;
  std::string text = run.output;
  while (!text.empty() && text.back() == '\n') text.pop_back();
  return text;
}

// The SHA-256 digest of the certificate: hexadecimal digits in capitals, with colons.
std::string CertificateDigest(const std::string& key) {
  return OfCertificate(key, "openssl x509 -in \"$0\" -noout -fingerprint -sha256 | sed s/.*=//");
}

std::string PublicKeyDigest(const std::string& key) {
  return OfCertificate(key,
                       "openssl x509 -in \"$0\" -noout -pubkey | openssl pkey -pubin "
                       "-outform DER | sha256sum | cut -d' ' -f1");
}

std::string ModulusDigest(const std::string& key) {
  return OfCertificate(key,
                       "openssl x509 -in \"$0\" -noout -modulus | sed s/.*=// | "
                       "basenc --base16 -d | sha256sum | cut -d' ' -f1");
}

ProcessResult Simulated(const Lines& words) {
  Lines command = {"env", "LC_ALL=C.UTF-8", SimulatorPath()};
  command.insert(command.end(), words.begin(), words.end());
  return RunProcess(command);
}

// The verdict of each file, then the simulator's exit status as "-> STATUS". Runs the simulator
// with --installer=off. If `words` has another option --installer, that option counts.
Lines Verdicts(Lines words) {
  words.insert(words.begin(), {"--installer=off", "--quiet"});
  const ProcessResult run = Simulated(words);
  Lines verdicts;
  std::istringstream text(run.output);
  for (std::string line; std::getline(text, line);) {
    verdicts.push_back(line.substr(0, line.find("  ")));
  }
  verdicts.push_back("-> " + std::to_string(run.status));
  return verdicts;
}

// The verdict events of a run.
std::vector<json> Events(Lines words) {
  words.insert(words.begin(), {"--installer=off", "--json"});
  std::istringstream lines(Simulated(words).output);
  std::vector<json> events;
  for (std::string line; std::getline(lines, line);) {
    const json event = json::parse(line, nullptr, false);
    if (event.value("event", "") == "verdict") events.push_back(event);
  }
  return events;
}

// The codes of the warnings about a package.
Lines WarningsOf(const Package& package, const Lines& options = {}) {
  const TempDir directory;
  package.WriteTo(directory / "base.apk");
  Lines words = options;
  words.push_back(directory / "base.apk");
  const json warnings = Events(words).at(0)["warnings"];
  Lines codes;
  for (const json& warning : warnings) {
    codes.push_back(warning["reason"]);
  }
  return codes;
}

}  // namespace

TEST(Signer, MatchesEachDigestThatToolsPrint) {
  for (const std::string& digest :
       {CertificateDigest("rsa-2048"), PublicKeyDigest("rsa-2048"), ModulusDigest("rsa-2048")}) {
    EXPECT_EQ(Verdicts({"--signer", digest, Apk("apksigner-sha256-2048")}),
              Lines({"SIGNED", "-> 0"}));
    EXPECT_EQ(Verdicts({"--signer", digest, Apk("apksigner-sha256-4096")}),
              Lines({"NOT ACCEPTED", "-> 1"}));
  }
  EXPECT_EQ(Verdicts({"--signer", ModulusDigest("rsa-2048"), "--signer", ModulusDigest("rsa-4096"),
                      Apk("apksigner-sha256-2048"), Apk("keytool-sha256")}),
            Lines({"SIGNED", "NOT ACCEPTED", "-> 1"}));
}

TEST(Signer, UnexpectedSignerIsShownInTextAndJournal) {
  const std::string expected = ModulusDigest("rsa-4096"), actual = ModulusDigest("rsa-2048");
  const Lines words = {"--installer=off", "--signer", expected, Apk("apksigner-sha256-2048")};
  const std::string text = Simulated(words).output;
  const std::string first = text.substr(0, text.find('\n'));
  EXPECT_NE(first.find("its signer is not one that --signer names: expected " + expected),
            std::string::npos)
      << first;
  EXPECT_NE(first.find("of the modulus " + actual), std::string::npos) << first;
  EXPECT_NE(text.find("\n  ✗ signer                 its signer is not one that"), std::string::npos)
      << text;
  const json item = Events(words).at(0)["items"].back();
  EXPECT_EQ(item["kind"], "signer");
  EXPECT_EQ(item["state"], "refused");
  EXPECT_EQ(item["reason"], "signer-unexpected");
  EXPECT_NE(item["text"].get<std::string>().find(PublicKeyDigest("rsa-2048")), std::string::npos);
}

// In the package rotated-key, the tool verifies the JAR signature. The key rsa-2048 made this
// signature. The newest phones verify a signature of a newer scheme. The key rsa-2048-other made
// that signature.
TEST(Signer, KeyOfANewerSchemeMustBeExpectedToo) {
  const Lines first = {"--signer", ModulusDigest("rsa-2048")};
  const auto verdicts = [&](const Lines& more) {
    Lines words = first;
    words.insert(words.end(), more.begin(), more.end());
    words.push_back(Apk("rotated-key"));
    return Verdicts(words);
  };
  EXPECT_EQ(verdicts({"--installer=required"}), Lines({"NOT ACCEPTED", "-> 1"}));
  EXPECT_EQ(verdicts({"--installer=required", "--signer", ModulusDigest("rsa-2048-other")}),
            Lines({"SIGNED, OTHER SIGNER", "-> 0"}));
  EXPECT_EQ(verdicts({"--installer=required", "--api", "27"}), Lines({"SIGNED", "-> 0"}));
  // If no installer is asked, --signer must also name each signer of the schemes v2 and later.
  EXPECT_EQ(verdicts({}), Lines({"NOT ACCEPTED", "-> 1"}));
  EXPECT_EQ(verdicts({"--signer", ModulusDigest("rsa-2048-other")}), Lines({"SIGNED", "-> 0"}));
}

TEST(Signer, IsNotVerifiedInARefusedPackage) {
  const Lines words = {"--signer", ModulusDigest("rsa-2048"), Apk("changed-dex")};
  EXPECT_EQ(Verdicts(words), Lines({"REFUSED", "-> 1"}));
  EXPECT_EQ(Events(words).at(0)["items"].back()["reason"], "signer-not-verified");
}

TEST(Signer, TrustedJarMatchesNoExpectedSigner) {
  const TempDir directory;
  const std::string jar = directory / "a.jar";
  MakePackage(PlainJar()).WriteTo(jar);
  EXPECT_EQ(Verdicts({"--trust", jar, jar}), Lines({"TRUSTED JAR", "-> 0"}));
  EXPECT_EQ(Verdicts({"--signer", ModulusDigest("rsa-2048"), "--trust", jar, jar}),
            Lines({"NOT ACCEPTED", "-> 1"}));
}

TEST(FilesOfOnePackage, MustHaveOneSigner) {
  EXPECT_EQ(Verdicts({Apk("apksigner-sha256-2048"), Apk("apksigner-sha1-2048")}),
            Lines({"SIGNED", "SIGNED", "-> 0"}));
  // The files are compared in the order of the command line, even if several are processed at the
  // same time.
  for (const char* jobs : {"--jobs=1", "--jobs=4"}) {
    EXPECT_EQ(Verdicts({jobs, Apk("apksigner-sha256-4096"), Apk("apksigner-sha256-2048"),
                        Apk("apksigner-sha1-4096")}),
              Lines({"SIGNED", "NOT ACCEPTED", "SIGNED", "-> 1"}));
  }
  const json item =
      Events({Apk("apksigner-sha256-4096"), Apk("apksigner-sha256-2048")}).at(1)["items"].back();
  EXPECT_EQ(item["reason"], "signer-differs");
  EXPECT_NE(item["text"].get<std::string>().find(Apk("apksigner-sha256-4096") +
                                                 " of com.example.vault is by CN=rsa-4096"),
            std::string::npos)
      << item;
}

TEST(Werror, WarningsCountAsRefusals) {
  EXPECT_EQ(Verdicts({"--werror", Apk("apksigner-sha256-2048")}), Lines({"SIGNED", "-> 0"}));
  EXPECT_EQ(Verdicts({"--werror", Apk("apksigner-sha1-2048")}), Lines({"NOT ACCEPTED", "-> 1"}));
  EXPECT_EQ(Verdicts({Apk("apksigner-sha1-2048")}), Lines({"SIGNED", "-> 0"}));
  EXPECT_EQ(Verdicts({"--werror", "--installer=required", Apk("rotated-key")}),
            Lines({"NOT ACCEPTED", "-> 1"}));
}

TEST(Warning, NamesEachUseOfAWeakDigest) {
  const auto text = [](const std::string& name) {
    const json warnings = Events({Apk(name)}).at(0)["warnings"];
    for (const json& warning : warnings) {
      if (warning["reason"] == "weak-digest") return warning["text"].get<std::string>();
    }
    return std::string();
  };
  EXPECT_EQ(text("openssl-cms-md5"),
            "SHA-1 or MD5 is in use: the signature block is made with MD5");
  EXPECT_EQ(text("openssl-cms-sha1"),
            "SHA-1 or MD5 is in use: the signature block is made with SHA1");
  EXPECT_EQ(text("jarsigner-sha1"),
            "SHA-1 or MD5 is in use: the signature block is made with SHA1, the signature file has "
            "the manifest's SHA-1 digest, the manifest has SHA-1 digests of 4 entries");
  EXPECT_EQ(Events({Apk("jarsigner-sha256")}).at(0)["warnings"], json::array());
}

TEST(Warning, AppearsForAnExpiredCertificate) {
  const auto warnings = [](const std::string& end) {
    PackageOptions options;
    Certificate certificate = options.block.SignerCertificate();
    certificate.validity = der::Sequence(
        {der::Element(der::kUtcTime, "100102030405Z"), der::Element(der::kUtcTime, end)});
    options.block.certificates = certificate.Build();
    return WarningsOf(MakePackage(options));
  };
  EXPECT_EQ(warnings("200102030405Z"), Lines({"certificate-expired"}));
  EXPECT_EQ(warnings("490102030405Z"), Lines());
}

TEST(Warning, AppearsForShortKeyOrDebugCertificate) {
  PackageOptions options;
  EXPECT_EQ(WarningsOf(MakePackage(options)), Lines());
  options.block.key = "rsa-1024";
  EXPECT_EQ(WarningsOf(MakePackage(options)), Lines({"weak-key"}));
  options.block.key = "rsa-2048";
  Certificate certificate = options.block.SignerCertificate();
  certificate.subject = Name({{"2.5.4.3", "Android Debug"}});
  options.block.certificates = certificate.Build();
  EXPECT_EQ(WarningsOf(MakePackage(options)), Lines({"debug-key"}));
}

TEST(Verdict, DescribesFileToolSignerAndCure) {
  const auto sha256 = [](const std::string& file) {
    return RunProcess({"sha256sum", file}).output.substr(0, 64);
  };
  // Under an emulator, ToolPath() is a script. The tool itself is in the directory bin, which is
  // beside the script's directory.
  std::filesystem::path tool = ToolPath();
  if (AreProgramsEmulated()) tool = tool.parent_path() / "../bin/apktoolkit";
  const std::string apk = Apk("changed-dex");
  const json event = Events({apk}).at(0);
  EXPECT_EQ(event["sha256"], sha256(apk));
  EXPECT_EQ(std::to_string(event["size"].get<int64_t>()) + "\n",
            RunProcess({"stat", "-c", "%s", apk}).output);
  EXPECT_EQ("apktoolkit-sim " + event["version"].get<std::string>() + "\n",
            RunProcess({SimulatorPath(), "--version"}).output);
  EXPECT_EQ(event["tool"], json({{"sha256", sha256(tool)}, {"version", event["version"]}}));
  EXPECT_EQ(event["items"][0]["cure"],
            "Sign the package again, as the last step that changes it. If you did not change "
            "it yourself, do not trust it.");
  EXPECT_EQ(
      event["signers"][0]["certificate_sha1"],
      OfCertificate("rsa-2048", "openssl x509 -in \"$0\" -outform DER | sha1sum | cut -d' ' -f1"));
  const json other = Events({"--tool", tool, apk}).at(0);
  EXPECT_EQ(other["tool"].size(), 1U);
  EXPECT_EQ(other["tool"]["sha256"], sha256(tool));
}

TEST(Journal, IsAloneOnStandardOutput) {
  const std::string apk = Apk("apksigner-sha256-2048");
  const ProcessResult run = Simulated({"--installer=off", "--journal", "-", apk});
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.errors, "");
  std::istringstream lines(run.output);
  size_t count = 0;
  for (std::string line; std::getline(lines, line); ++count) {
    EXPECT_TRUE(json::parse(line, nullptr, false).is_object()) << line;
  }
  EXPECT_GT(count, 10U);
  const auto last = [](const std::string& text) {
    return text.substr(text.rfind("{\"event\":\"v"));
  };
  EXPECT_EQ(last(run.output),
            last(Simulated({"--installer=off", "--json", "--journal=-", apk}).output));
}
