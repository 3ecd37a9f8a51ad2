// Runs the whole tool, from main() on, with any bytes as the package file. The phone is simulated
// inside this program (support/phone.h). The first byte of the input sets the phone's answers, and
// whether an attacker replaces libraries. The other bytes are the package file. A model
// (package_model.h) reads the same file, and must allow each signature and each registration that
// the tool requests. The peak memory has a limit, and no descriptor may stay open.
#include <dirent.h>
#include <fcntl.h>
#include <sanitizer/allocator_interface.h>
#include <sys/stat.h>
#include <unistd.h>
#include <ziparchive/zip_archive.h>

#include <algorithm>
#include <atomic>
#include <filesystem>
#include <fstream>
#include <map>
#include <memory>
#include <optional>
#include <sstream>
#include <vector>

#include "fuzz/fuzz.h"
#include "fuzz/package_model.h"
#include "fuzz/package_mutator.h"
#include "support/certificate.h"
#include "support/files.h"
#include "support/package.h"
#include "support/phone.h"

// The tool's main(). For this program, sign/main.cpp is compiled with the name ToolMain for main.
int ToolMain(int argc, char* argv[]);

namespace {

// The limit of a run's peak memory: kBytesBesides, plus kBytesPerByte for each byte of the input
// and for each byte that DeclaredBytes (package_model.h) counts.
constexpr size_t kBytesPerByte = 16;
constexpr size_t kBytesBesides = 1 << 20;

std::vector<ZipArchiveHandle> open_archives;

// The package's directory on a file system in memory. The libraries are in lib/arm and lib/arm64,
// as after an installation. The file outside.so is outside the directory.
class Installation {
 public:
  Installation() {
    char root[] = "/dev/shm/apktoolkit-fuzz.XXXXXX";
    Require(mkdtemp(root) != nullptr, "a directory in memory is made");
    root_ = root;
    directory_ = root_ + "/app/";
    for (const char* const abi : {"arm", "arm64"}) {
      const std::string libraries = directory_ + "lib/" + abi + "/";
      std::filesystem::create_directories(libraries);
      files_[libraries + "libfoo.so"] = ToBytes("\177ELF foo");
      files_[libraries + "libbar.so"] = ToBytes("\177ELF bar");
    }
    files_[root_ + "/outside.so"] = ToBytes("\177ELF foo");
    for (const auto& [path, content] : files_) WriteFile(path, content);
  }
  ~Installation() { std::filesystem::remove_all(root_); }
  Installation(const Installation&) = delete;
  Installation& operator=(const Installation&) = delete;

  const std::string& directory() const { return directory_; }
  std::string package() const { return directory_ + "base.apk"; }

  // If `path` is a library or outside.so, replaces that file by a file with other bytes. PutBack()
  // restores all replaced files.
  void Exchange(const std::string& path) {
    const auto file = files_.find(std::filesystem::weakly_canonical(path).string());
    if (file == files_.end()) return;
    WriteFile(root_ + "/other", ToBytes("\177ELF other"));
    std::filesystem::rename(root_ + "/other", file->first);
    exchanged_.push_back(file->first);
  }
  void PutBack() {
    for (const std::string& path : exchanged_) WriteFile(path, files_.at(path));
    exchanged_.clear();
  }

 private:
  std::string root_, directory_;
  std::map<std::string, Bytes> files_;
  std::vector<std::string> exchanged_;
};

Installation& TheInstallation() {
  static Installation installation;
  return installation;
}

// `held` is the number of bytes that the run has allocated and not freed. `most_held` is the peak
// of `held`. Calls of malloc and free count only while is_measured is true.
std::atomic<bool> is_measured;
std::atomic<size_t> held, most_held;

void Allocated(const volatile void*, size_t size) {
  if (!is_measured) return;
  held += size;
  if (held > most_held) most_held = held.load();
}

void Freed(const volatile void* block) {
  if (!is_measured || block == nullptr) return;
  const size_t size = __sanitizer_get_allocated_size(block);
  held -= std::min(size, held.load());
}

void Install() {
  static const bool installed = __sanitizer_install_malloc_and_free_hooks(Allocated, Freed) != 0;
  Require(installed, "the memory hooks are installed");
}

size_t LowestFreeDescriptor() {
  const int fd = dup(STDERR_FILENO);
  close(fd);
  return static_cast<size_t>(fd);
}

std::string PathOf(int fd) {
  return std::filesystem::read_symlink("/proc/self/fd/" + std::to_string(fd)).string();
}

// Checks with the model each request that the tool sends to the phone: verify, sign, register.
class Judge {
 public:
  Judge(const Bytes& archive, const Phone& phone) : archive_(archive), phone_(phone) {}

  void Witness(int fd, const std::string& event) {
    is_measured = false;
    if (!model_) model_.emplace(archive_);
    std::istringstream words(event);
    std::string what, number, last;
    words >> what >> number;
    while (words >> last) {
    }
    const bool is_package_file = PathOf(fd) == TheInstallation().package();
    if (what == "verify") Require(is_package_file, "the kernel is asked only about the input file");
    if (what == "sign") JudgeSigning(fd, last, is_package_file);
    if (what == "register") JudgeRegistration(last, is_package_file);
    is_measured = true;
  }

 private:
  void JudgeSigning(int fd, const std::string& payload, bool is_package_file) {
    if (payload == "0000") {
      Require(!model_->is_package(), "the empty payload is for files that are not packages");
      Require(is_package_file && phone_.verify_errno == 0,
              "the empty payload is only for a trusted input file");
      return;
    }
    Require(payload == "2000" + Hex(DigestOf(Digest::kSha256, model_->key())),
            "a payload that is not empty is the digest of the signer's key");
    Require(model_->is_good(), "a key's digest is only for a good package and its libraries");
    if (is_package_file) return;
    const Bytes content = ContentOf(fd);
    Require(model_->AllowsLibrary(TheInstallation().directory(), PathOf(fd), content),
            "only a library whose bytes match the manifest is signed");
  }

  void JudgeRegistration(const std::string& data, bool is_package_file) {
    Require(is_package_file, "only the input file is registered");
    if (model_->is_package()) {
      Require(model_->is_good(), "a package is registered only if it is good");
      Require(data == Hex(model_->key()), "a package registers its signer's key");
    } else {
      Require(phone_.zu_attribute_size > 0,
              "a JAR is registered only if it has the attribute user.zu");
      Require(data.size() == 256, "a JAR is registered with 128 bytes");
    }
  }

  static Bytes ContentOf(int fd) {
    Bytes content(1 << 16);
    const ssize_t size = pread(fd, content.data(), content.size(), 0);
    Require(size >= 0, "a signed file can be read");
    content.resize(static_cast<size_t>(size));
    return content;
  }

  const Bytes& archive_;
  const Phone& phone_;
  std::optional<PackageModel> model_;
};

// Replaces each library just before the tool opens the library's path for the second time. If the
// library passed its check, the tool opens the path for the second time to sign the library.
class Attacker {
 public:
  void BeforeOpen(const std::string& path) {
    is_measured = false;
    if (++opens_[path] == 2) TheInstallation().Exchange(path);
    is_measured = true;
  }

 private:
  std::map<std::string, int> opens_;
};

void SetUp(Phone& phone, uint8_t choices) {
  if ((choices & 1) != 0) phone.verify_errno = ENOKEY;
  if ((choices & 2) != 0) phone.zu_attribute_size = 1;
  if ((choices & 4) != 0) phone.sign_errno = EPERM;
  if ((choices & 8) != 0) phone.integrity = {"ffffffff\n", "0\n"};
  if ((choices & 16) != 0) phone.integrity = {"ffffffff\n", "1f\n"};
  if ((choices & 32) != 0) phone.zu_result = 0x10004;
  if ((choices & 64) != 0) phone.integrity = {Phone::kNoFile};
}

void RunTool(const std::string& path) {
  std::string name = "apktoolkit", argument = path;
  char* arguments[] = {name.data(), argument.data(), nullptr};
  const size_t descriptors = LowestFreeDescriptor();
  held = most_held = 0;
  is_measured = true;
  const int status = ToolMain(2, arguments);
  is_measured = false;
  Require(status == 0, "the exit status is 0");
  Require(LowestFreeDescriptor() == descriptors, "no descriptor is left open");
}

}  // namespace

// The tool never closes its archive, because the end of its process frees the archive. The process
// of a fuzz target runs the tool many times. This target therefore closes the archive after each
// run.
extern "C" {
int32_t __real__Z13OpenArchiveFdiPKcPP10ZipArchiveb(int, const char*, ZipArchiveHandle*, bool);
int32_t __wrap__Z13OpenArchiveFdiPKcPP10ZipArchiveb(int fd, const char* name,
                                                    ZipArchiveHandle* handle, bool own_fd) {
  const int32_t result = __real__Z13OpenArchiveFdiPKcPP10ZipArchiveb(fd, name, handle, own_fd);
  open_archives.push_back(*handle);
  return result;
}
}

extern "C" size_t LLVMFuzzerCustomMutator(uint8_t* data, size_t size, size_t max_size,
                                          unsigned seed) {
  return MutatePackage(data, size, max_size, seed);
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size == 0) return 0;
  Install();
  const Bytes archive(data + 1, data + size);
  const std::string path = TheInstallation().package();
  WriteFile(path, archive);

  Phone phone;
  SetUp(phone, data[0]);
  Judge judge(archive, phone);
  phone.witness = [&](int fd, const std::string& event) { judge.Witness(fd, event); };
  Attacker attacker;
  if ((data[0] & 128) != 0) {
    phone.before_open = [&](const char* opened, int) { attacker.BeforeOpen(opened); };
  }
  RunTool(path);
  TheInstallation().PutBack();
  if (most_held > kBytesBesides) {
    Require(most_held <= kBytesBesides + kBytesPerByte * (size + DeclaredBytes(archive)),
            "the peak memory is within its limit");
  }
  for (ZipArchiveHandle handle : open_archives) CloseArchive(handle);
  open_archives.clear();
  return 0;
}
