#include "simulator/run/log_lines.h"

#include <gtest/gtest.h>

using namespace simulator;

namespace {

struct Row {
  const char* text;
  LogMeaning meaning;
  const char* captured;
  int64_t number;
};

}  // namespace

TEST(ToolLogLine, EachTextHasItsMeaningAndWhatIsCaptured) {
  const Row rows[] = {
      {"VeltSignJni starts: 3.\n", LogMeaning::kLibrariesBegin, "", 0},
      {"VeltSign starts: zip_fd = 3, fd = 3.\n", LogMeaning::kFileBegins, "", 0},
      {"VeltSign finished: 65536.\n", LogMeaning::kFileEnds, "", 0},
      {"VeltSignOat: Apk case.\n", LogMeaning::kPackageTakenUp, "", 0},
      {"VeltSignOat: non-Apk (Jar) case\n", LogMeaning::kJarTakenUp, "", 0},
      {"VELT can't sign a file (result=10000, errno 1: Operation not permitted).\n",
       LogMeaning::kNotSigned, "", 0},
      {"VELT can't sign a non-APK file (result=10000, errno 1: x).\n", LogMeaning::kNotSigned, "",
       0},
      {"OpenArchiveFd(3) [file: /a] returned: -6: Empty archive\n", LogMeaning::kNoArchive, "-6",
       -6},
      {"Zip archive is not valid for fd=3\n", LogMeaning::kNoArchiveToSign, "", 0},
      {"Can't extract Android Manifest: Entry not found\n", LogMeaning::kNoAndroidManifest,
       "Entry not found", 0},
      {"Can't extract RSA certificate: META-INF/A.RSA\n", LogMeaning::kNoBlock, "META-INF/A.RSA",
       0},
      {"Unknown certificate type", LogMeaning::kBlockMalformed, "", 0},
      {"RSA could not set key: 5\n", LogMeaning::kKeyRefused, "5", 5},
      // The codes after "RSA could not" are hexadecimal: 14 means 20, and 1C means 28.
      {"RSA could not verify certificate: 14\n", LogMeaning::kCertificateRefused, "14", 20},
      {"RSA could not verify data: 1C\n", LogMeaning::kSignatureRefused, "1C", 28},
      {"SHA256 hash does not match", LogMeaning::kOtherDigest, "", 0},
      {"SHA hash check unsuccessfull", LogMeaning::kOtherDigest, "", 0},
      {"MD5 hash does not match", LogMeaning::kOtherDigest, "", 0},
      {"Can't validate manifest.\n", LogMeaning::kManifestRefused, "", 0},
      {"Can't load manifest: size=3\n", LogMeaning::kManifestMalformed, "", 0},
      {"Parse manifest: Error: P_KEY: unexpected end of file after key 'x'\n",
       LogMeaning::kTextMalformed, "", 0},
      {"Parse manifest: Error: P_COLON: unexpected 0x78 after colon: x\n",
       LogMeaning::kTextMalformed, "", 0},
      {"Can't process Android Manifest.\n", LogMeaning::kAndroidManifestMalformed, "", 0},
      {"VeltSignJni: malformed apk: /a\n", LogMeaning::kNoGoodPackage, "", 0},
      {"file not verified: META-INF/A.SF\n", LogMeaning::kDetail, "", 0},
      {"Invalid padding in RSA", LogMeaning::kDetail, "", 0},
      {"ParseAndroidManifest failed to init xml parser, error=0x80000000\n", LogMeaning::kDetail,
       "", 0},
      {"Can't open file: /a\n", LogMeaning::kFileNotOpened, "", 0},
      {"Can't read file: /a (streamoff=-1)\n", LogMeaning::kFileNotRead, "", 0},
      {"Can't find file in META-INF/MANIFEST.MF: a: b\n", LogMeaning::kNotListed, "", 0},
      {"verifyData: Unsupported digest type: MD5-Digest\n", LogMeaning::kDigestUnknown, "", 0},
      {"Integrity not confirmed: classes.dex\n", LogMeaning::kDexRefused, "", 0},
      {"VeltSignJni: File not verified: /a\nb\n", LogMeaning::kLibraryRefused, "/a\nb", 0},
      {"File /a is not opened", LogMeaning::kLibraryVanished, "/a", 0},
      {"Error 2: No such file or directory.\n", LogMeaning::kErrorNumber, "2", 2},
      {"Apk archive is not valid for fd=3, path=/a\n", LogMeaning::kKeyOfRefusedPackage, "", 0},
      {"Can't get jar location from fd=3\n", LogMeaning::kNoPathOfJar, "", 0},
      {"ZuAddCertificate: ZuNewCertificate failed -7.\n", LogMeaning::kRegistrationFailed, "", 0},
  };
  for (const Row& row : rows) {
    const LogLine line = ReadLogLine(row.text);
    EXPECT_EQ(line.meaning, row.meaning) << row.text;
    EXPECT_EQ(line.text, row.captured) << row.text;
    EXPECT_EQ(line.number, row.number) << row.text;
  }
}

TEST(ToolLogLine, OtherTextsAreUnknown) {
  for (const char* text :
       {"", "\n", "something new", "VeltSignJni starts: x.\n", "VeltSignJni starts: 3. And more.\n",
        " VeltSignOat: Apk case.\n", "VeltSignOat: Apk case.", "RSA could not set key: G\n",
        "Can't validate manifest. Bad SF file.\n"}) {
    EXPECT_EQ(ReadLogLine(text).meaning, LogMeaning::kUnknown) << text;
  }
}

// The author of a file chooses the names in it, so a name can contain the text of a log line.
TEST(ToolLogLine, NameWithLogTextDoesNotChangeTheMeaning) {
  const LogLine path =
      ReadLogLine("OpenArchiveFd(3) [file: /a] returned: -6: x\n] returned: -3: Invalid file\n");
  EXPECT_EQ(path.number, -3);
  const LogLine library = ReadLogLine("VeltSignJni: File not verified: VeltSign starts: 3.\n\n");
  EXPECT_EQ(library.meaning, LogMeaning::kLibraryRefused);
  EXPECT_EQ(library.text, "VeltSign starts: 3.\n");
  EXPECT_EQ(ReadLogLine(std::string("File a\0b is not opened", 22)).text, std::string("a\0b", 3));
}

// The log keeps 1023 bytes of a text.
TEST(ToolLogLine, TextThatWasCutIsKnownByItsStart) {
  const std::string start = "VeltSignJni: File not verified: ";
  const std::string cut = start + std::string(1023 - start.size(), 'x');
  EXPECT_EQ(ReadLogLine(cut).meaning, LogMeaning::kLibraryRefused);
  EXPECT_EQ(ReadLogLine(cut).text, cut.substr(start.size()));
  EXPECT_EQ(ReadLogLine(cut.substr(0, 1022)).meaning, LogMeaning::kUnknown);
  EXPECT_EQ(ReadLogLine(std::string(1023, 'x')).meaning, LogMeaning::kUnknown);
}

// In this log text, the captured number comes after the file's name. The log cuts the text inside
// the name, so the number is lost.
TEST(ToolLogLine, LaterConversionOfACutTextIsNotCaptured) {
  const std::string start = "OpenArchiveFd(12) [file: ";
  const LogLine line = ReadLogLine(start + std::string(1023 - start.size(), 'x'));
  EXPECT_EQ(line.meaning, LogMeaning::kNoArchive);
  EXPECT_EQ(line.text, "");
  EXPECT_EQ(line.number, 0);
}

TEST(ToolLogLine, WholeTextLosesItsLastLineEnd) {
  EXPECT_EQ(ReadLogLine("a\n\n").whole, "a\n");
  EXPECT_EQ(ReadLogLine("a").whole, "a");
  EXPECT_EQ(ReadLogLine("").whole, "");
}

TEST(FindLogLine, ReturnsTheFirstLineWithTheMeaning) {
  const std::vector<LogLine> lines = {ReadLogLine("RSA could not set key: 5\n"),
                                      ReadLogLine("RSA could not set key: 9\n")};
  EXPECT_EQ(FindLine(lines, LogMeaning::kKeyRefused), lines.data());
  EXPECT_EQ(FindLine(lines, LogMeaning::kNoBlock), nullptr);
}
