#include "library/verification.h"

#include <android/log.h>

#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <string_view>
#include <utility>

#include "apk/zip_library.h"
#include "util/log.h"

namespace ApkTools {

namespace {

// The start of each line that the tool's code logs for a refusal, and the reason that the line
// gives. If the manifest does not parse, two of these lines are logged. First the parser logs
// "Parse manifest: ", as for a signature file. Then its caller logs "Can't load manifest: ". For
// any other refusal, the log has at most one kind of line from this table, once or twice. The line
// that was logged last therefore gives the reason.
constexpr struct LoggedReason {
  const char* start;
  Reason reason;
} kLoggedReasons[] = {
    {"Can't initialize Apk: need valid file descriptor or filename\n", Reason::kNoDescriptor},
    {"OpenArchiveFd(", Reason::kNoArchive},
    {"Can't extract Android Manifest: ", Reason::kAndroidManifestUnreadable},
    {"Parse manifest: ", Reason::kSignatureFileMalformed},
    {"Can't extract RSA certificate: ", Reason::kNoRsaBlock},
    {"Unknown certificate type", Reason::kBlockMalformed},
    {"RSA could not set key: ", Reason::kKeyRefused},
    {"RSA could not verify certificate: ", Reason::kCertificateRefused},
    {"RSA could not verify data: ", Reason::kSignatureRefused},
    {"Can't validate manifest.\n", Reason::kManifestRefused},
    {"Can't load manifest: ", Reason::kManifestMalformed},
    {"Can't process Android Manifest.\n", Reason::kAndroidManifestMalformed},
    {"Integrity not confirmed: classes.dex\n", Reason::kDexRefused},
};

// Where the verification in this thread stores its reason; null if no verification runs.
thread_local Reason* heard = nullptr;

Reason ReasonOf(Apk& apk, Reason logged);
bool HasEntry(Apk& apk, const std::string& prefix, const std::string& suffix);
int HearAndLog(int priority, const char* tag, const char* format, va_list arguments);
void Hear(std::string_view text);

}  // namespace

Verification::Verification(int fd) {
  Reason* const outer = std::exchange(heard, &reason_);
  apk_.emplace(fd);
  const bool is_good = apk_->IsGoodApk();
  heard = outer;
  reason_ = is_good ? Reason::kGood : ReasonOf(*apk_, reason_);
}

Verification::~Verification() { apk_->Release(); }

const char* TextOf(Reason reason) {
  switch (reason) {
    case Reason::kGood:
      return "it is good";
    case Reason::kNoDescriptor:
      return "there is no file";
    case Reason::kNoArchive:
      return "it is not a zip archive, or it is damaged";
    case Reason::kNoPackage:
      return "it is not a package: it has no AndroidManifest.xml";
    case Reason::kAndroidManifestUnreadable:
      return "AndroidManifest.xml cannot be extracted";
    case Reason::kUnsigned:
      return "it has no JAR signature";
    case Reason::kSignatureUnreadable:
      return "its manifest or signature file cannot be extracted";
    case Reason::kSignatureFileMalformed:
      return "its signature file is malformed";
    case Reason::kNoRsaBlock:
      return "there is no RSA block for its signature file";
    case Reason::kBlockMalformed:
      return "its signature block is malformed, or its key is not an RSA key";
    case Reason::kKeyRefused:
      return "its key is not whole in the signature block, or has the public exponent 1 or -1";
    case Reason::kCertificateRefused:
      return "its certificate is not signed with its own key";
    case Reason::kSignatureRefused:
      return "its signature file does not match the signature";
    case Reason::kManifestRefused:
      return "its manifest does not match the signature file";
    case Reason::kManifestMalformed:
      return "its manifest is malformed";
    case Reason::kAndroidManifestMalformed:
      return "its AndroidManifest.xml is not compiled XML";
    case Reason::kDexRefused:
      return "classes.dex does not match the manifest";
    case Reason::kUnknown:
      break;
  }
  return "the reason is only in the log";
}

namespace {

// Returns the reason of a refusal. `logged` is the reason that the log gave, or kUnknown. The log
// does not distinguish all cases, so the archive's entries are checked. A missing
// "AndroidManifest.xml" is logged with the same line as one that cannot be extracted. No line is
// logged if "META-INF/MANIFEST.MF" or the signature file is missing or cannot be extracted.
Reason ReasonOf(Apk& apk, Reason logged) {
  if (logged == Reason::kAndroidManifestUnreadable) {
    return HasEntry(apk, "AndroidManifest.xml", "") ? logged : Reason::kNoPackage;
  }
  if (logged != Reason::kUnknown || !apk.IsApk()) return logged;
  const bool is_signed = HasEntry(apk, Apk::kMANIFEST_MF, "") && HasEntry(apk, "META-INF/", ".SF");
  return is_signed ? Reason::kSignatureUnreadable : Reason::kUnsigned;
}

// If `suffix` is empty, true if there is an entry with the name `prefix`. Otherwise, true if the
// name of an entry begins with `prefix` and ends with `suffix`.
bool HasEntry(Apk& apk, const std::string& prefix, const std::string& suffix) {
  void* cookie;
  if (apk.StartIteration(&cookie, prefix, suffix) != 0) return false;
  ZipEntry entry;
  std::string name;
  bool has = false;
  while (!has && apk.Next(cookie, &entry, name) == 0) has = !suffix.empty() || name == prefix;
  apk.EndIteration(cookie);
  return has;
}

__attribute__((format(printf, 3, 0))) int HearAndLog(int priority, const char* tag,
                                                     const char* format, va_list arguments) {
  char text[kLogTextSize];
  // The analyzer does not see that each caller calls va_start.
  // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized)
  vsnprintf(text, sizeof(text), format, arguments);
  if (tag != nullptr && strcmp(tag, kLogTag) == 0) Hear(text);
  return __android_log_write(priority, tag, text);
}

// If `text` gives a reason, stores this reason for the verification that runs in this thread.
void Hear(std::string_view text) {
  if (heard == nullptr) return;
  for (const auto& [start, reason] : kLoggedReasons) {
    if (text.compare(0, strlen(start), start) == 0) *heard = reason;
  }
}

}  // namespace

}  // namespace ApkTools

// This definition replaces the platform's function in the whole program, also for calls from the
// platform's libraries. As in the platform's function, a text is cut to at most kLogTextSize bytes,
// including the closing NUL.
extern "C" int __android_log_print(int priority, const char* tag, const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  const int result = ApkTools::HearAndLog(priority, tag, format, arguments);
  va_end(arguments);
  return result;
}
