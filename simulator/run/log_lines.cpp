#include "simulator/run/log_lines.h"

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstdlib>
#include <regex>

#include "util/log.h"

namespace simulator {

namespace {

constexpr size_t kNothing = SIZE_MAX;

// The format texts of the tool's log that have a meaning for the simulator. `captured` is the
// index, counted from 0, of the conversion whose text is stored in LogLine::text. If `captured` is
// kNothing, LogLine::text stays empty.
constexpr struct LogText {
  LogMeaning meaning;
  const char* format;
  size_t captured;
} kLogTexts[] = {
    {LogMeaning::kLibrariesBegin, "VeltSignJni starts: %d.\n", kNothing},
    {LogMeaning::kFileBegins, "VeltSign starts: zip_fd = %d, fd = %d.\n", kNothing},
    {LogMeaning::kFileEnds, "VeltSign finished: %u.\n", kNothing},
    {LogMeaning::kPackageTakenUp, "VeltSignOat: Apk case.\n", kNothing},
    {LogMeaning::kJarTakenUp, "VeltSignOat: non-Apk (Jar) case\n", kNothing},
    {LogMeaning::kNotSigned, "VELT can't sign a file (result=%x, errno %d: %s).\n", kNothing},
    {LogMeaning::kNotSigned, "VELT can't sign a non-APK file (result=%x, errno %d: %s).\n",
     kNothing},
    {LogMeaning::kNoArchive, "OpenArchiveFd(%d) [file: %s] returned: %d: %s\n", 2},
    {LogMeaning::kNoArchiveToSign, "Zip archive is not valid for fd=%d\n", kNothing},
    {LogMeaning::kNoAndroidManifest, "Can't extract Android Manifest: %s\n", 0},
    {LogMeaning::kNoBlock, "Can't extract RSA certificate: %s\n", 0},
    {LogMeaning::kBlockMalformed, "Unknown certificate type", kNothing},
    {LogMeaning::kKeyRefused, "RSA could not set key: %X\n", 0},
    {LogMeaning::kCertificateRefused, "RSA could not verify certificate: %X\n", 0},
    {LogMeaning::kSignatureRefused, "RSA could not verify data: %X\n", 0},
    {LogMeaning::kOtherDigest, "SHA256 hash does not match", kNothing},
    {LogMeaning::kOtherDigest, "SHA hash check unsuccessfull", kNothing},
    {LogMeaning::kOtherDigest, "MD5 hash does not match", kNothing},
    {LogMeaning::kManifestRefused, "Can't validate manifest.\n", kNothing},
    {LogMeaning::kManifestMalformed, "Can't load manifest: size=%zu\n", kNothing},
    {LogMeaning::kTextMalformed,
     "Parse manifest: Error: P_KEY: unexpected end of file after key '%s'\n", kNothing},
    {LogMeaning::kTextMalformed,
     "Parse manifest: Error: P_COLON: unexpected 0x%02x after colon: %c\n", kNothing},
    {LogMeaning::kAndroidManifestMalformed, "Can't process Android Manifest.\n", kNothing},
    {LogMeaning::kNoGoodPackage, "VeltSignJni: malformed apk: %s\n", kNothing},
    {LogMeaning::kDetail, "file not verified: %s\n", kNothing},
    {LogMeaning::kDetail, "Invalid padding in RSA", kNothing},
    {LogMeaning::kDetail, "%s failed to init xml parser, error=0x%08x\n", kNothing},
    {LogMeaning::kFileNotOpened, "Can't open file: %s\n", kNothing},
    {LogMeaning::kFileNotRead, "Can't read file: %s (streamoff=%zd)\n", kNothing},
    {LogMeaning::kNotListed, "Can't find file in %s: %s\n", kNothing},
    {LogMeaning::kDigestUnknown, "verifyData: Unsupported digest type: %s\n", kNothing},
    {LogMeaning::kDexRefused, "Integrity not confirmed: classes.dex\n", kNothing},
    {LogMeaning::kLibraryRefused, "VeltSignJni: File not verified: %s\n", 0},
    {LogMeaning::kLibraryVanished, "File %s is not opened", 0},
    {LogMeaning::kErrorNumber, "Error %d: %s.\n", 0},
    {LogMeaning::kKeyOfRefusedPackage, "Apk archive is not valid for fd=%d, path=%s\n", kNothing},
    {LogMeaning::kNoPathOfJar, "Can't get jar location from fd=%d\n", kNothing},
    {LogMeaning::kRegistrationFailed, "ZuAddCertificate: ZuNewCertificate failed %d.\n", kNothing},
};

// A row of kLogTexts, prepared for comparisons.
struct Pattern {
  const LogText* row;
  std::string start;  // the text before the first conversion
  std::regex whole;
  char conversion;  // the letter of the captured conversion; 's' if nothing is captured
};

const std::vector<Pattern>& Patterns();
Pattern MakePattern(const LogText& row);

}  // namespace

LogLine ReadLogLine(const std::string& text) {
  LogLine line;
  line.whole = text.substr(0, text.size() - (!text.empty() && text.back() == '\n' ? 1 : 0));
  // The log cuts texts to kLogTextSize - 1 bytes. A text of this length may have lost its end. Only
  // the text before the format's first conversion is then compared.
  const bool is_cut = text.size() + 1 >= kLogTextSize;
  for (const Pattern& pattern : Patterns()) {
    const std::string& start = pattern.start;
    if (text.compare(0, start.size(), start) != 0) continue;
    std::smatch match;
    if (is_cut ? start.empty() : !std::regex_match(text, match, pattern.whole)) continue;
    line.meaning = pattern.row->meaning;
    if (pattern.row->captured == kNothing) break;
    // Only the first conversion of a cut text begins at a known place.
    if (is_cut && pattern.row->captured != 0) break;
    line.text = is_cut ? line.whole.substr(start.size()) : match.str(pattern.row->captured + 1);
    const int base = pattern.conversion == 'X' ? 16 : 10;
    if (!is_cut && pattern.conversion != 's') {
      line.number = strtoll(line.text.c_str(), nullptr, base);
    }
    break;
  }
  return line;
}

const LogLine* FindLine(const std::vector<LogLine>& lines, LogMeaning meaning) {
  const auto found = std::find_if(lines.begin(), lines.end(), [meaning](const LogLine& line) {
    return line.meaning == meaning;
  });
  return found == lines.end() ? nullptr : &*found;
}

namespace {

const std::vector<Pattern>& Patterns() {
  static const std::vector<Pattern> patterns = [] {
    std::vector<Pattern> made;
    for (const LogText& row : kLogTexts) made.push_back(MakePattern(row));
    return made;
  }();
  return patterns;
}

Pattern MakePattern(const LogText& row) {
  const std::string format = row.format;
  Pattern pattern = {&row, format.substr(0, format.find('%')), {}, 's'};
  std::string whole;
  size_t count = 0;
  for (size_t i = 0; i < format.size(); ++i) {
    if (format[i] != '%') {
      if (ispunct(static_cast<unsigned char>(format[i])) != 0) whole += '\\';
      whole += format[i];
      continue;
    }
    i = format.find_first_of("sdxXuc", i);
    if (count++ == row.captured) pattern.conversion = format[i];
    const bool is_text = format[i] == 's' || format[i] == 'c';
    whole += is_text ? "([\\s\\S]*)" : "(-?[0-9a-fA-F]+)";
  }
  pattern.whole = std::regex(whole);
  return pattern;
}

}  // namespace

}  // namespace simulator
