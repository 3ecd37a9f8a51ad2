// What the floor and the peer have in common: everything of the tool's job but the verification,
// each step done once and nothing kept that is not needed. They only ever see the good packages of
// bench_packages, and give up where something fails.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

// Bytes that are not cleared before they are filled. Never shrinks.
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

[[noreturn]] void GiveUp(const char* why);

// The package that a program was started with.
struct GivenPackage {
  int fd;
  std::string path;
  struct ZipArchive* zip;  // the platform library's
};

GivenPackage OpenGiven(int argc, char** argv);
void Extract(const GivenPackage& package, const std::string& name, Buffer& out);
std::string SignatureFileName(const GivenPackage& package);
// The package's name, from the compiled manifest.
std::string WalkManifest(const Buffer& compiled_manifest);

// Reads each library beside the package whole, has `check` look at its entry's name and its bytes,
// and then has the kernel asked to sign it, as the tool would.
using CheckLibrary = std::function<void(const std::string& name, const Buffer& content)>;
void SignLibraries(const GivenPackage& package, const CheckLibrary& check);
void SignGiven(const GivenPackage& package);
void Register(const GivenPackage& package, const std::string& name, const uint8_t* key,
              size_t length);
