#include "simulator/run/signed_bytes.h"

#include <fcntl.h>
#include <openssl/sha.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>

#include "simulator/phone/text.h"
#include "util/file.h"
#include "util/scoped_fd.h"

namespace simulator {

namespace {

namespace fs = std::filesystem;

bool IsRegular(const std::string& path, struct stat* state) {
  return stat(path.c_str(), state) == 0 && S_ISREG(state->st_mode);
}

// Returns the file's SHA-256 digest in lower-case hexadecimal. Returns an empty text if the file is
// not regular, or cannot be read to its end before the deadline.
std::string DigestOf(const std::string& path, const Deadline& deadline) {
  struct stat state = {};
  if (!IsRegular(path, &state)) return {};
  const ScopedFd file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  if (file.get() < 0) return {};
  SHA256_CTX context;
  SHA256_Init(&context);
  std::vector<char> buffer(1 << 18);
  ssize_t length = -1;
  while (!deadline.HasPassed() && (length = read(file.get(), buffer.data(), buffer.size())) > 0) {
    SHA256_Update(&context, buffer.data(), static_cast<size_t>(length));
  }
  if (length != 0) return {};
  unsigned char digest[SHA256_DIGEST_LENGTH];
  SHA256_Final(digest, &context);
  return HexText({reinterpret_cast<const char*>(digest), sizeof(digest)});
}

}  // namespace

bool SignedBytes::Load() {
  if (directory_.empty()) return true;
  std::error_code error;
  fs::create_directories(directory_, error);
  for (fs::directory_iterator entry(directory_, error), end; entry != end; entry.increment(error)) {
    digests_.insert(entry->path().filename().string());
  }
  return !error && access(directory_.c_str(), W_OK) == 0;
}

bool SignedBytes::Holds(const std::string& path, const Deadline& deadline) {
  struct stat state = {};
  if (!IsRegular(path, &state)) return false;
  if (!digests_.empty()) return digests_.count(DigestOf(path, deadline)) > 0;
  return std::any_of(seen_.begin(), seen_.end(),
                     [&](Seen& seen) { return IsSame(&seen, path, state, deadline); });
}

bool SignedBytes::Add(const std::string& path, const Deadline& deadline) {
  struct stat state = {};
  if (!IsRegular(path, &state)) return true;  // no regular file is left to trust
  if (directory_.empty()) {
    if (shares_) seen_.push_back({path, state, ""});
    return true;
  }
  const std::string digest = DigestOf(path, deadline);
  if (digest.empty()) return !deadline.HasPassed();
  if (shares_) digests_.insert(digest);
  std::ofstream file(directory_ + "/" + digest);
  file << path << '\n';
  return static_cast<bool>(file.flush());
}

bool SignedBytes::IsSame(Seen* seen, const std::string& path, const struct stat& state,
                         const Deadline& deadline) {
  if (IsSameFile(seen->state, state)) return true;
  if (seen->state.st_size != state.st_size) return false;
  struct stat now = {};
  const bool is_as_it_was = IsRegular(seen->path, &now) && IsSameFile(seen->state, now);
  if (seen->digest.empty() && is_as_it_was) seen->digest = DigestOf(seen->path, deadline);
  return !seen->digest.empty() && seen->digest == DigestOf(path, deadline);
}

}  // namespace simulator
