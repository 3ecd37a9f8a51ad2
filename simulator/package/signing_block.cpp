#include "simulator/package/signing_block.h"

#include <set>

#include "simulator/package/cbs.h"

namespace simulator {

namespace {

constexpr std::string_view kMagic = "APK Sig Block 42";
constexpr size_t kSizeField = 8;
constexpr size_t kFooter = kSizeField + kMagic.size();

// The highest number of signers, of all schemes together. A block with more signers counts as
// damaged here. A phone accepts at most ten v2 signers. Of all v3 and v3.1 signers, it uses one.
constexpr size_t kMostSigners = 16;

// The known schemes. `id` is the ID of the scheme's ID-value pair in the block.
constexpr struct {
  uint32_t id;
  const char* name;
} kSchemes[] = {{0x7109871a, "v2"}, {0xf05368c0, "v3"}, {0x1b93ad61, "v3.1"}};

const char* SchemeOf(uint32_t id);
bool ReadSigners(const char* scheme, CBS value, std::vector<NewerSigner>* signers);
bool ReadCertificate(CBS signer, CBS* certificate);
bool TakePrefixed(CBS* bytes, CBS* part);

}  // namespace

// A block consists of its size, ID-value pairs, the size again, and the magic. The block's size is
// the number of all bytes after the first size field. If the two size fields differ, the platform
// finds no block.
std::string ReadSigningBlock(int fd, const ArchiveEnd& end, bool* is_too_large) {
  *is_too_large = false;
  if (end.directory_offset < kSizeField + kFooter) return {};
  const std::string footer = ReadAt(fd, end.directory_offset - kFooter, kFooter);
  uint64_t size = 0, first_size = 0;
  CBS fields = ToCbs(footer);
  if (!CBS_get_u64le(&fields, &size) || ToView(fields) != kMagic) return {};
  if (size < kFooter || size > end.directory_offset - kSizeField) return {};
  const uint64_t start = end.directory_offset - size - kSizeField;
  const std::string head = ReadAt(fd, start, kSizeField);
  fields = ToCbs(head);
  if (!CBS_get_u64le(&fields, &first_size) || first_size != size) return {};
  *is_too_large = size > kMostBlockBytes;
  if (*is_too_large) return {};
  return ReadAt(fd, start, static_cast<size_t>(size) + kSizeField);
}

SigningBlock ParseSigningBlock(std::string_view block) {
  SigningBlock result;
  if (block.empty()) return result;
  result.is_damaged = true;
  if (block.size() < kSizeField + kFooter) return result;
  CBS pairs = ToCbs(block.substr(kSizeField, block.size() - kSizeField - kFooter));
  std::set<std::string_view> schemes;
  while (CBS_len(&pairs) > 0) {
    uint64_t size = 0;
    uint32_t id = 0;
    CBS value;
    if (!CBS_get_u64le(&pairs, &size) || !CBS_get_bytes(&pairs, &value, size) ||
        !CBS_get_u32le(&value, &id)) {
      return result;
    }
    const char* const scheme = SchemeOf(id);
    if (scheme == nullptr || !schemes.insert(scheme).second) continue;
    if (!ReadSigners(scheme, value, &result.signers)) return result;
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

// Reads the signers of one scheme. The platform requires at least one signer.
bool ReadSigners(const char* scheme, CBS value, std::vector<NewerSigner>* signers) {
  CBS sequence, signer, certificate;
  if (!TakePrefixed(&value, &sequence) || CBS_len(&sequence) == 0) return false;
  while (CBS_len(&sequence) > 0) {
    if (signers->size() == kMostSigners || !TakePrefixed(&sequence, &signer)) return false;
    if (!ReadCertificate(signer, &certificate)) return false;
    signers->push_back({scheme, ToView(certificate)});
  }
  return true;
}

// A signer begins with its signed data in every scheme. The signed data begins with the digests and
// the certificates. Takes the first certificate.
bool ReadCertificate(CBS signer, CBS* certificate) {
  CBS signed_data, digests, certificates;
  return TakePrefixed(&signer, &signed_data) && TakePrefixed(&signed_data, &digests) &&
         TakePrefixed(&signed_data, &certificates) && TakePrefixed(&certificates, certificate);
}

// Takes a length field and the part after it from `bytes`. The field has 4 bytes, little-endian,
// and states the part's length in bytes.
bool TakePrefixed(CBS* bytes, CBS* part) {
  uint32_t size = 0;
  return CBS_get_u32le(bytes, &size) && CBS_get_bytes(bytes, part, size);
}

}  // namespace

}  // namespace simulator
