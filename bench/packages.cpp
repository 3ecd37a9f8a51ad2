// bench_packages DIRECTORY: makes the packages that scripts/bench measures. Each package is
// DIRECTORY/<name>/base.apk. Its libraries are extracted beside it, as an installer leaves them.
// Does not make a package again if its base.apk exists.
//
// classes.dex and the packages' libraries have bytes of the machine's own libraries. The entries
// below res/ and assets/ have bytes of files of /usr/share. Of all these entries, only classes.dex
// is deflated. Zeros or random bytes would not inflate at the same speed as real code.
#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/jar.h"
#include "support/package.h"

namespace {

struct Plan {
  const char* name;
  size_t entries;  // all entries outside META-INF
  size_t libraries;
  size_t library_size;
  size_t dex_size;
  size_t entry_size;  // of each entry below res/ or assets/
  const char* key = "rsa-2048";
  // True: the sections of MANIFEST.MF are sorted by name, as apksigner writes them. False: they are
  // not sorted, as jarsigner writes them.
  bool in_order = true;
};

constexpr size_t kKilo = 1000, kMega = 1000 * kKilo;

constexpr Plan kPlans[] = {
    {"small", 150, 3, 150 * kKilo, 300 * kKilo, 2 * kKilo},
    {"small-rsa4096", 150, 3, 150 * kKilo, 300 * kKilo, 2 * kKilo, "rsa-4096"},
    {"medium", 900, 8, 3 * kMega, 8 * kMega, 11 * kKilo},
    {"large", 3000, 40, 7 * kMega, 8 * kMega, 4 * kKilo},
    {"entries-1k", 1000, 0, 0, 20 * kKilo, 40},
    {"entries-10k", 10000, 0, 0, 20 * kKilo, 40},
    {"entries-60k", 60000, 0, 0, 20 * kKilo, 40},
    {"entries-10k-unordered", 10000, 0, 0, 20 * kKilo, 40, "rsa-2048", false},
    {"entries-60k-unordered", 60000, 0, 0, 20 * kKilo, 40, "rsa-2048", false},
};

// The bytes of all files of at least `least_size` bytes below a directory, one file after the
// other. Each call of Next() returns the following `size` bytes. After the last file, Next()
// continues with the first file.
class CircleOfFiles {
 public:
  CircleOfFiles(const std::string& directory, size_t least_size);
  Bytes Next(size_t size);

 private:
  std::vector<std::string> files_;
  size_t next_ = 0;
  std::ifstream file_;
};

void MakePlanned(const Plan& plan, const std::string& directory);
std::vector<ZipItem> Entries(const Plan& plan, const std::string& directory);
std::string EntryName(size_t index);
void DescribeEntries(PackageOptions& options, std::string& manifest);
std::string EntrySections(const std::string& manifest);

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    fprintf(stderr, "usage: bench_packages DIRECTORY\n");
    return 1;
  }
  for (const Plan& plan : kPlans) {
    const std::string directory = std::string(argv[1]) + "/" + plan.name;
    if (std::filesystem::exists(directory + "/base.apk")) continue;
    printf("making %s\n", directory.c_str());
    MakePlanned(plan, directory);
  }
  return 0;
}

namespace {

void MakePlanned(const Plan& plan, const std::string& directory) {
  std::filesystem::create_directories(directory + "/lib/arm64");
  PackageOptions options;
  options.secure_storage = true;
  options.entries = Entries(plan, directory);
  options.block.key = plan.key;
  std::string manifest;
  DescribeEntries(options, manifest);

  Package package = MakePackage(options);
  for (const char* name : {kAndroidManifestName, kManifestName, "META-INF/CERT.SF"}) {
    package.Item(name).deflated = true;
  }
  const std::string unfinished = directory + "/base.apk.part";
  package.WriteTo(unfinished);
  std::filesystem::rename(unfinished, directory + "/base.apk");
}

std::vector<ZipItem> Entries(const Plan& plan, const std::string& directory) {
  CircleOfFiles machine_code("/usr/lib/" MULTIARCH_DIR, kMega);
  CircleOfFiles shared_files("/usr/share", 1);
  std::vector<ZipItem> entries = {
      {"classes.dex", machine_code.Next(plan.dex_size), /*deflated=*/true}};
  for (size_t i = 0; i < plan.libraries; ++i) {
    const std::string file = "/lib" + std::to_string(i) + ".so";
    entries.push_back({"lib/arm64-v8a" + file, machine_code.Next(plan.library_size)});
    WriteFile(directory + "/lib/arm64" + file, entries.back().data);
  }
  while (entries.size() < plan.entries - 1) {
    entries.push_back({EntryName(entries.size()), shared_files.Next(plan.entry_size)});
  }
  if (!plan.in_order) return entries;
  std::sort(entries.begin(), entries.end(),
            [](const ZipItem& a, const ZipItem& b) { return a.name < b.name; });
  return entries;
}

CircleOfFiles::CircleOfFiles(const std::string& directory, size_t least_size) {
  for (const auto& entry : std::filesystem::recursive_directory_iterator(directory)) {
    if (entry.is_regular_file() && entry.file_size() >= least_size) files_.push_back(entry.path());
  }
  std::sort(files_.begin(), files_.end());
}

Bytes CircleOfFiles::Next(size_t size) {
  Bytes bytes(size);
  for (size_t done = 0; done < size;) {
    file_.read(reinterpret_cast<char*>(&bytes[done]), static_cast<std::streamsize>(size - done));
    done += static_cast<size_t>(file_.gcount());
    if (done < size) file_ = std::ifstream(files_.at(next_++ % files_.size()), std::ios::binary);
  }
  return bytes;
}

std::string EntryName(size_t index) {
  constexpr const char* kDirectories[] = {"res/drawable-xhdpi-v4/", "res/layout/", "assets/",
                                          "res/drawable-nodpi-v4/", "res/xml/"};
  return kDirectories[index % 5] + std::string("entry_") + std::to_string(index) + ".bin";
}

// Makes MakePackage add the digests of the manifest's sections to the signature file, as signing
// tools do. Before that, MakePackage writes the text of MANIFEST.MF to `manifest`. `manifest` must
// therefore exist until MakePackage returns.
void DescribeEntries(PackageOptions& options, std::string& manifest) {
  options.edit_manifest = [&](const std::string& text) { return manifest = text; };
  options.edit_signature_file = [&](const std::string& text) {
    return text + EntrySections(manifest);
  };
}

std::string EntrySections(const std::string& manifest) {
  const std::string end = "\r\n\r\n";
  std::string sections;
  size_t start = manifest.find(end) + end.size();
  while (start < manifest.size()) {
    const size_t next = manifest.find(end, start) + end.size();
    const size_t digest = manifest.find("\r\nSHA-256-Digest: ", start) + 2;
    sections += manifest.substr(start, digest - start);
    JarText text;
    text.Digests({"SHA-256-Digest"}, ToBytes(manifest.substr(start, next - start))).EndSection();
    sections += text.text();
    start = next;
  }
  return sections;
}

}  // namespace
