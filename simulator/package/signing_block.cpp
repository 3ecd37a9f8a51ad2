#include "simulator/package/signing_block.h"

#include "simulator/package/archive_end.h"
#include "simulator/package/byte_reader.h"

namespace simulator {

namespace {

constexpr char kMagic[] = "APK Sig Block 42";
constexpr size_t kMagicSize = sizeof(kMagic) - 1;
constexpr size_t kSizeField = 8;
constexpr size_t kFooter = kSizeField + kMagicSize;

// More signers than this in one block are not looked at; phones take ten.
constexpr size_t kMostSigners = 16;

// The schemes that are known here, by the number of their pair in the block.
constexpr struct {
  uint32_t id;
  const char* name;
} kSchemes[] = {{0x7109871a, "v2"}, {0xf05368c0, "v3"}, {0x1b93ad61, "v3.1"}};

const char* SchemeOf(uint32_t id);
bool ReadSigners(const char* scheme, std::string_view value, std::vector<NewerSigner>* signers);
bool ReadCertificate(std::string_view signer, std::string_view* certificate);

}  // namespace

// size, pairs, size again, magic; each size counts all but the first size field.
std::string ReadSigningBlock(int fd) {
  const auto end = FindArchiveEnd(fd);
  if (!end || end->directory_offset < kSizeField + kFooter) return {};
  const std::string footer = ReadAt(fd, end->directory_offset - kFooter, kFooter);
  ByteReader reader(footer);
  uint64_t size = 0;
  std::string_view magic;
  if (!reader.U64(&size) || !reader.Bytes(kMagicSize, &magic) || magic != kMagic) return {};
  if (size < kFooter || size > kMostBlockBytes) return {};
  if (size > end->directory_offset - kSizeField) return {};
  return ReadAt(fd, end->directory_offset - size - kSizeField,
                static_cast<size_t>(size) + kSizeField);
}

SigningBlock ParseSigningBlock(std::string_view block) {
  SigningBlock result;
  if (block.empty()) return result;
  result.is_damaged = true;
  if (block.size() < kSizeField + kFooter) return result;
  ByteReader pairs(block.substr(kSizeField, block.size() - kSizeField - kFooter));
  while (!pairs.empty()) {
    uint64_t size = 0;
    uint32_t id = 0;
    std::string_view pair;
    if (!pairs.U64(&size) || !pairs.Bytes(size, &pair)) return result;
    ByteReader value(pair);
    if (!value.U32(&id)) return result;
    const char* const scheme = SchemeOf(id);
    if (scheme == nullptr) continue;
    if (!ReadSigners(scheme, pair.substr(sizeof(id)), &result.signers)) return result;
  }
  result.is_damaged = false;
  return result;
}

namespace {

const char* SchemeOf(uint32_t id) {
  for (const auto& scheme : kSchemes) {
    if (scheme.id == id) return scheme.name;
  }
  return nullptr;
}

// The signers of one scheme: a length, then each with its own.
bool ReadSigners(const char* scheme, std::string_view value, std::vector<NewerSigner>* signers) {
  std::string_view sequence;
  if (!ByteReader(value).Prefixed(&sequence)) return false;
  ByteReader reader(sequence);
  while (!reader.empty()) {
    std::string_view signer;
    std::string_view certificate;
    if (signers->size() == kMostSigners || !reader.Prefixed(&signer)) return false;
    if (!ReadCertificate(signer, &certificate)) return false;
    signers->push_back({scheme, certificate});
  }
  return true;
}

// All schemes begin alike: the signed data, which begins with digests and certificates.
bool ReadCertificate(std::string_view signer, std::string_view* certificate) {
  std::string_view signed_data;
  std::string_view digests;
  std::string_view certificates;
  if (!ByteReader(signer).Prefixed(&signed_data)) return false;
  ByteReader reader(signed_data);
  return reader.Prefixed(&digests) && reader.Prefixed(&certificates) &&
         ByteReader(certificates).Prefixed(certificate);
}

}  // namespace

}  // namespace simulator
