#include "fuzz/package_mutator.h"

#include <ziparchive/zip_archive.h>

#include <algorithm>
#include <cstring>
#include <map>
#include <random>
#include <string>
#include <vector>

#include "fuzz/signer.h"
#include "support/zip.h"

extern "C" size_t LLVMFuzzerMutate(uint8_t* data, size_t size, size_t max_size);

namespace {

using Random = std::minstd_rand;
using Items = std::vector<ZipItem>;

constexpr size_t kMostItems = 64;
constexpr size_t kLongestItem = 1 << 16;

// Returns at most kMostItems entries, sorted by the offset of their data in the archive. Leaves out
// entries that cannot be extracted or have more than kLongestItem bytes. Returns no entries if the
// archive cannot be read.
Items ReadItems(const Bytes& bytes) {
  ZipArchiveHandle archive = nullptr;
  void* cookie = nullptr;
  std::map<off64_t, ZipItem> items;
  if (OpenArchiveFromMemory(bytes.data(), bytes.size(), "mutator", &archive) == 0 &&
      StartIteration(archive, &cookie) == 0) {
    ZipEntry entry;
    std::string name;
    while (items.size() < kMostItems && Next(cookie, &entry, &name) == 0) {
      if (entry.uncompressed_length > kLongestItem) continue;
      Bytes data(entry.uncompressed_length);
      if (ExtractToMemory(archive, &entry, data.data(), entry.uncompressed_length) != 0) continue;
      ZipItem item{name, data};
      item.deflated = entry.method == kCompressDeflated;
      items[entry.offset] = item;
    }
    EndIteration(cookie);
  }
  if (archive != nullptr) CloseArchive(archive);
  Items list;
  for (const auto& [offset, item] : items) list.push_back(item);
  return list;
}

template <class Content>
void MutateBytes(Content& content) {
  const size_t size = content.size();
  content.resize(size + 64);
  content.resize(LLVMFuzzerMutate(reinterpret_cast<uint8_t*>(&content[0]), size, content.size()));
}

void Lie(ZipItem& item, Random& random) {
  constexpr uint32_t kLengths[] = {0, 1, 0x7fffffff, 0xffffffff, 64 << 20, 1032};
  const auto place = random() % 4;
  const uint32_t length = kLengths[random() % 6];
  if (place == 0) item = ClaimingLength(item, length);
  if (place == 1) item.central.length = length;
  if (place == 2) item.local.length = length;
  if (place == 3) item.method = static_cast<uint16_t>(random() % 16);
}

void Change(Items& items, Random& random) {
  const size_t at = random() % items.size();
  switch (random() % 16) {
    case 0:
      return MutateBytes(items[at].name);
    case 1:
      items.erase(items.begin() + static_cast<Items::difference_type>(at));
      return;
    case 2:
      items.push_back(items[at]);
      return MutateBytes(items.back().name);
    case 3:
      return std::swap(items[at], items[random() % items.size()]);
    case 4:
      items[at].deflated = !items[at].deflated;
      return;
    case 5:
      items[at].data_descriptor = true;
      return;
    case 6:
      return Lie(items[at], random);
    default:
      return MutateBytes(items[at].data);
  }
}

bool EndsIn(const std::string& name, const std::string& end) {
  return name.size() > end.size() && name.compare(name.size() - end.size(), end.size(), end) == 0;
}

void EditText(ZipItem& item, const std::string& name, const std::string& suffix,
              const Bytes& data) {
  std::string text(item.data.begin(), item.data.end());
  DigestAgain(text, name, suffix, data);
  item.data = ToBytes(text);
}

// At depth 0, repairs nothing. At depth 1, repairs the signatures. At depth 2, also repairs the
// manifest's digest. From depth 3 on, also repairs the entries' digests. The entries' digests are
// repaired first, because the manifest's digest covers them. The signatures are repaired last,
// because the signature of the signer covers the manifest's digest.
void Repair(Items& items, unsigned depth) {
  const auto find = [&](const std::string& end) {
    return std::find_if(items.begin(), items.end(),
                        [&](const ZipItem& item) { return EndsIn(item.name, end); });
  };
  const auto manifest = find("/MANIFEST.MF"), signature_file = find(".SF"), block = find(".RSA");
  if (depth >= 3 && manifest != items.end()) {
    for (const ZipItem& item : items) EditText(*manifest, item.name, "", item.data);
  }
  if (depth >= 2 && manifest != items.end() && signature_file != items.end()) {
    EditText(*signature_file, "", "-Manifest", manifest->data);
  }
  if (depth >= 1 && signature_file != items.end() && block != items.end()) {
    SignAgain(block->data, signature_file->data);
  }
}

}  // namespace

size_t MutatePackage(uint8_t* data, size_t size, size_t max_size, unsigned seed) {
  Random random(seed);
  const Bytes archive(data + std::min<size_t>(size, 1), data + size);
  Items items = ReadItems(archive);
  if (items.empty() || random() % 8 == 0) return LLVMFuzzerMutate(data, size, max_size);

  if (random() % 16 == 0) data[0] = static_cast<uint8_t>(random());
  for (auto changes = 1 + random() % 3; changes > 0 && !items.empty(); --changes) {
    Change(items, random);
  }
  if (!items.empty()) Repair(items, random() % 5);
  const Bytes built = BuildZip(items);
  if (built.size() + 1 > max_size) return LLVMFuzzerMutate(data, size, max_size);
  memcpy(data + 1, built.data(), built.size());
  return built.size() + 1;
}
