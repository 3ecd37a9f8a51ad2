#include "fuzz/package_model.h"

#include <androidfw/ResourceTypes.h>
#include <ziparchive/zip_archive.h>

#include <filesystem>
#include <optional>

#include "apk/native_libraries.h"
#include "fuzz/models.h"
#include "fuzz/signature_model.h"
#include "support/certificate.h"

namespace {

constexpr size_t kLongestEntry = 128 << 20;

bool EndsIn(const std::string& text, const std::string& end) {
  return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

}  // namespace

struct PackageModel::Archive {
  explicit Archive(const Bytes& bytes) {
    if (OpenArchiveFromMemory(bytes.data(), bytes.size(), "model", &handle) != 0) handle = nullptr;
  }
  ~Archive() {
    if (handle != nullptr) CloseArchive(handle);
  }
  Archive(const Archive&) = delete;
  Archive& operator=(const Archive&) = delete;

  // Returns 1 if the archive has the entry. Returns 0 if the entry is missing or the archive is not
  // open, and -1 if the zip library returns another error. The zip library's code for an entry that
  // is not found is -7.
  int Find(const std::string& name, ZipEntry* entry) const {
    const int result = handle == nullptr ? -7 : FindEntry(handle, std::string_view(name), entry);
    return result == -7 ? 0 : result == 0 ? 1 : -1;
  }

  // A stored entry cannot be extracted if its compressed and uncompressed lengths differ.
  std::optional<Bytes> Extract(ZipEntry entry) const {
    if (entry.method == kCompressStored && entry.compressed_length != entry.uncompressed_length) {
      return std::nullopt;
    }
    Bytes content;
    const auto append = [](const uint8_t* data, size_t size, void* out) {
      auto& bytes = *static_cast<Bytes*>(out);
      bytes.insert(bytes.end(), data, data + size);
      return bytes.size() <= kLongestEntry;
    };
    if (ProcessZipEntryContents(handle, &entry, append, &content) != 0) return std::nullopt;
    if (content.size() != entry.uncompressed_length) return std::nullopt;
    return content;
  }

  std::optional<Bytes> Extract(const std::string& name) const {
    ZipEntry entry;
    if (Find(name, &entry) != 1) return std::nullopt;
    return Extract(entry);
  }

  std::vector<std::string> Names(const std::string& prefix, const std::string& suffix) const {
    std::vector<std::string> names;
    void* cookie = nullptr;
    if (handle == nullptr || StartIteration(handle, &cookie, prefix, suffix) != 0) return names;
    ZipEntry entry;
    std::string name;
    while (Next(cookie, &entry, &name) == 0) names.push_back(name);
    EndIteration(cookie);
    return names;
  }

  ZipArchiveHandle handle = nullptr;
};

PackageModel::PackageModel(const Bytes& bytes) {
  const Archive archive(bytes);
  is_package_ = archive.Extract("AndroidManifest.xml").has_value();
  libraries_ = archive.Names("lib/", ".so");
  is_good_ = is_package_ && Judge(archive);
}

bool PackageModel::Judge(const Archive& archive) {
  const std::vector<std::string> signature_files = archive.Names("META-INF/", ".SF");
  if (signature_files.empty()) return false;
  const std::string& name = signature_files.front();
  Bytes block = archive.Extract(name.substr(0, name.size() - 2) + "RSA").value_or(Bytes());
  const Bytes signature_file = archive.Extract(name).value_or(Bytes());
  const std::optional<Bytes> manifest = archive.Extract("META-INF/MANIFEST.MF");
  if (!manifest || block.empty()) return false;

  pkcs7 record = {};
  if (processCert(block.data(), static_cast<uint32_t>(block.size()), &record) != 0) return false;
  key_ = VerifiedKey(record, block, signature_file);
  if (key_.empty()) return false;

  const ManifestModel signed_text =
      ReadManifest(std::string(signature_file.begin(), signature_file.end()));
  if (!signed_text.valid || !StatesDigestOf(*manifest, signed_text)) return false;

  const ManifestModel text = ReadManifest(std::string(manifest->begin(), manifest->end()));
  if (!text.valid) return false;
  for (const auto& section : text.sections) {
    for (const auto& [attribute, value] : section) {
      if (!EndsIn(attribute, "-Digest") || section.count("Name") == 0) continue;
      listed_[section.at("Name")] = {attribute.substr(0, attribute.size() - 7),
                                     ReadBase64(value).value_or(Bytes())};
    }
  }
  const Bytes android_manifest = *archive.Extract("AndroidManifest.xml");
  android::ResXMLTree tree;
  if (tree.setTo(android_manifest.data(), android_manifest.size()) != 0) return false;

  ZipEntry dex;
  const int found = archive.Find("classes.dex", &dex);
  if (found == 0) return true;
  const std::optional<Bytes> content = archive.Extract("classes.dex");
  return content && IsListed("classes.dex", *content);
}

bool PackageModel::StatesDigestOf(const Bytes& manifest, const ManifestModel& signature_file) {
  const std::string suffix = "-Digest-Manifest";
  std::optional<bool> is_good;
  for (const auto& section : signature_file.sections) {
    if (is_good) break;
    for (const auto& [attribute, value] : section) {
      if (!EndsIn(attribute, suffix)) continue;
      is_good = IsDigest(attribute.substr(0, attribute.size() - suffix.size()),
                         ReadBase64(value).value_or(Bytes()), manifest);
    }
  }
  return is_good.value_or(false);
}

bool PackageModel::AllowsLibrary(const std::string& directory, const std::string& path,
                                 const Bytes& content) const {
  for (const std::string& entry : libraries_) {
    const std::string installed = ApkTools::InstalledLibraryPath("", entry);
    if (installed.empty() || !IsListed(entry, content)) continue;
    // The tool passes the path to the system as a C string, which ends at the first NUL.
    const std::string target = (directory + installed).c_str();
    if (std::filesystem::weakly_canonical(target) == path) return true;
  }
  return false;
}

bool PackageModel::IsListed(const std::string& name, const Bytes& content) const {
  const auto found = listed_.find(name);
  return found != listed_.end() && IsDigest(found->second.attribute, found->second.digest, content);
}

bool PackageModel::IsDigest(const std::string& attribute, const Bytes& digest,
                            const Bytes& content) {
  if (attribute == "SHA1") return digest == DigestOf(Digest::kSha1, content);
  if (attribute == "SHA-256") return digest == DigestOf(Digest::kSha256, content);
  return false;
}

size_t DeclaredBytes(const Bytes& bytes) {
  ZipArchiveHandle handle = nullptr;
  void* cookie = nullptr;
  size_t sum = 0;
  if (OpenArchiveFromMemory(bytes.data(), bytes.size(), "sum", &handle) == 0 &&
      StartIteration(handle, &cookie) == 0) {
    ZipEntry entry;
    std::string name;
    while (Next(cookie, &entry, &name) == 0) {
      // Deflate makes at most 1032 bytes from one byte. The tool does not extract an entry that
      // declares more than 1032 times its compressed length.
      if (entry.uncompressed_length > uint64_t{1032} * entry.compressed_length) continue;
      // The platform's XML parser keeps up to 64 KiB of memory for 40 bytes of a compiled manifest.
      // This is up to 1639 bytes of memory for each byte. package_fuzz.cpp permits kBytesPerByte
      // (16) bytes of memory for each byte counted here. A weight of 128 therefore permits 2048
      // bytes of memory for each byte of the compiled manifest.
      const size_t weight = name == "AndroidManifest.xml" ? 128 : 1;
      sum += weight * entry.uncompressed_length;
    }
    EndIteration(cookie);
  }
  if (handle != nullptr) CloseArchive(handle);
  return sum;
}
