// The steps that bench_floor and bench_peer share: all steps of the tool except digests and
// verification. Both programs are only for the packages that bench_packages makes.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

// A buffer that can be used for one file after another. After Resize(), the values of all bytes are
// undefined. A smaller size does not free memory.
class Buffer {
 public:
  void Resize(size_t size);
  uint8_t* data() const { return data_.get(); }
  size_t size() const { return size_; }
  std::string_view text() const { return {reinterpret_cast<const char*>(data()), size_}; }

 private:
  std::unique_ptr<uint8_t[]> data_;
  size_t size_ = 0;
  size_t room_ = 0;
};

// Prints `why` to standard error, and ends the program with status 1.
[[noreturn]] void GiveUp(const char* why);

// The package that a program was started with.
struct GivenPackage {
  int fd;
  std::string path;
  struct ZipArchive* zip;  // of the platform's zip library
};

GivenPackage OpenGiven(int argc, char** argv);
void Extract(const GivenPackage& package, const std::string& name, Buffer& out);
std::string SignatureFileName(const GivenPackage& package);
// Returns the package's name from the compiled manifest.
std::string WalkManifest(const Buffer& compiled_manifest);

// Does three things for each library beside the package: reads the whole file, calls `check` with
// the entry's name and the file's bytes, and logs that the kernel did not sign the file. The tool
// writes the same log lines on a workstation, because the kernel there cannot sign files.
using CheckLibrary = std::function<void(const std::string& name, const Buffer& content)>;
void SignLibraries(const GivenPackage& package, const CheckLibrary& check);
void SignGiven(const GivenPackage& package);
void Register(const GivenPackage& package, const std::string& name, const uint8_t* key,
              size_t length);
