#include "bench/job.h"

#include <androidfw/ResourceTypes.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utils/String8.h>
#include <ziparchive/zip_archive.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "sign/libzu.h"
#include "util/log.h"

namespace {

std::string AttributeText(const android::ResXMLParser& parser, const char* name);
void ReadWhole(const std::string& path, Buffer& out);
void LogUnsigned();

}  // namespace

void Buffer::Resize(size_t size) {
  if (size > room_) {
    data_.reset();
    data_.reset(new uint8_t[size]);
    room_ = size;
  }
  size_ = size;
}

void GiveUp(const char* why) {
  fprintf(stderr, "gave up: %s\n", why);
  exit(1);
}

GivenPackage OpenGiven(int argc, char** argv) {
  if (argc != 2) GiveUp("expected the path of a package");
  GivenPackage package = {open(argv[1], O_RDONLY), argv[1], nullptr};
  if (OpenArchiveFd(package.fd, argv[1], &package.zip, false) != 0) GiveUp("no zip archive");
  return package;
}

void Extract(const GivenPackage& package, const std::string& name, Buffer& out) {
  ZipEntry entry;
  if (FindEntry(package.zip, name, &entry) != 0) GiveUp("entry not found");
  out.Resize(entry.uncompressed_length);
  if (ExtractToMemory(package.zip, &entry, out.data(), entry.uncompressed_length) != 0) {
    GiveUp("entry not extracted");
  }
}

std::string SignatureFileName(const GivenPackage& package) {
  void* cookie;
  ZipEntry entry;
  std::string name;
  if (StartIteration(package.zip, &cookie, "META-INF/", ".SF") != 0 ||
      Next(cookie, &entry, &name) != 0) {
    GiveUp("no signature file");
  }
  EndIteration(cookie);
  return name;
}

std::string WalkManifest(const Buffer& compiled_manifest) {
  using android::ResXMLParser;
  android::ResXMLTree parser;
  parser.setTo(compiled_manifest.data(), compiled_manifest.size(), false);
  std::string package_name, permission;
  for (auto event = parser.next(); event > ResXMLParser::END_DOCUMENT; event = parser.next()) {
    if (event != ResXMLParser::START_TAG) continue;
    size_t length = 0;
    const char16_t* text = parser.getElementName(&length);
    const android::String8 element(text, length);
    if (element == "manifest") package_name = AttributeText(parser, "package");
    if (element == "uses-permission") permission = AttributeText(parser, "name");
  }
  return package_name;
}

void SignLibraries(const GivenPackage& package, const CheckLibrary& check) {
  LogInfo("VeltSignJni starts: %d.\n", package.fd);
  constexpr std::string_view kInPackage = "lib/arm64-v8a";
  const std::string beside = package.path.substr(0, package.path.rfind('/') + 1) + "lib/arm64";
  void* cookie;
  if (StartIteration(package.zip, &cookie, "lib/", ".so") != 0) GiveUp("no iteration");
  ZipEntry entry;
  std::string name;
  Buffer content;
  while (Next(cookie, &entry, &name) == 0) {
    const std::string path = beside + name.substr(kInPackage.size());
    ReadWhole(path, content);
    check(name, content);
    const int fd = open(path.c_str(), O_RDONLY);
    LogUnsigned();
    close(fd);
  }
  EndIteration(cookie);
  LogInfo("VeltSignJni finished: %u.\n", 0U);
}

void SignGiven(const GivenPackage& package) {
  LogInfo("VeltSign starts: zip_fd = %d, fd = %d.\n", package.fd, package.fd);
  LogUnsigned();
  LogInfo("VeltSign finished: %u.\n", 0x10000U);
}

void Register(const GivenPackage& package, const std::string& name, const uint8_t* key,
              size_t length) {
  const int result = ZuNewCertificate(package.fd, name.c_str(), key, length);
  LogError("ZuAddCertificate: ZuNewCertificate failed %d.\n", result);
}

namespace {

std::string AttributeText(const android::ResXMLParser& parser, const char* name) {
  for (size_t i = 0; i < parser.getAttributeCount(); ++i) {
    size_t length = 0;
    const char16_t* text = parser.getAttributeName(i, &length);
    if (!(android::String8(text, length) == name)) continue;
    text = parser.getAttributeStringValue(i, &length);
    if (text != nullptr) return android::String8(text, length).c_str();
  }
  return {};
}

void ReadWhole(const std::string& path, Buffer& out) {
  const int fd = open(path.c_str(), O_RDONLY);
  struct stat status;
  if (fstat(fd, &status) != 0) GiveUp("no library");
  out.Resize(static_cast<size_t>(status.st_size));
  if (read(fd, out.data(), out.size()) != status.st_size) GiveUp("library not read");
  close(fd);
}

// Logs the lines that the tool logs on a workstation. The kernel there has no integrity file, so
// the tool sends no request.
void LogUnsigned() {
  LogInfo("VeltSignOat: Apk case.\n");
  FILE* const integrity = fopen("/proc/self/integrity/value", "r");
  if (integrity != nullptr) GiveUp("this kernel has the integrity feature");
  const int error = errno;
  LogError("VELT can't sign a file (result=%x, errno %d: %s).\n", 0x10000U, error, strerror(error));
}

}  // namespace
