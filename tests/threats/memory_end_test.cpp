// Documents at the very end of memory, for the platform's own parser: what it reads beyond them
// ends the test.
#include <gtest/gtest.h>

#include "apk/apk.h"
#include "support/compiled_manifest.h"
#include "support/log_capture.h"
#include "support/memory_end.h"

namespace {

// Parses the document in the block that the tool makes for it, at the end of memory: the document,
// and room for an attribute (20 bytes), or for the header of a chunk (8 bytes), that is not there.
bool ParseAtMemoryEnd(ApkTools::Apk* apk, const Bytes& document) {
  PutNextBlockAtMemoryEnd(document.size() + 20);
  const bool parsed = apk->ParseAndroidManifest(document);
  EXPECT_TRUE(WasPutAtMemoryEnd());
  return parsed;
}

TEST(CompiledManifestAtMemoryEnd, IsNotReadBeyondHoweverShortItIs) {
  const Bytes whole = CompiledManifest("com.example.app", true);
  for (size_t size = 0; size <= whole.size(); ++size) {
    LogCapture log;
    ApkTools::Apk apk(-1);
    EXPECT_EQ(ParseAtMemoryEnd(&apk, Bytes(whole.begin(), whole.begin() + static_cast<int>(size))),
              size == whole.size())
        << size;
  }
}

// Writes the size of the chunk that starts at `chunk`.
void SetSize(Bytes* document, size_t chunk, size_t size) {
  for (size_t i = 0; i < 4; ++i) (*document)[chunk + 4 + i] = static_cast<uint8_t>(size >> (8 * i));
}

// The last node ends so many bytes before the document does, and the header of another is looked
// for there.
TEST(CompiledManifestAtMemoryEnd, IsNotReadBeyondForANodeThatIsNotThere) {
  for (uint8_t rest = 1; rest <= 8; ++rest) {
    Bytes document = CompiledManifest("com.example.app", true);
    document.insert(document.end(), rest, 0);
    SetSize(&document, 0, document.size());
    LogCapture log;
    ApkTools::Apk apk(-1);
    EXPECT_TRUE(ParseAtMemoryEnd(&apk, document));
    EXPECT_EQ(apk.GetPackageName(), "com.example.app");
    EXPECT_TRUE(apk.IsSsPermissionRequired());
  }
}

// An attribute of size 0 may lie where its element ends: all of it lies behind that.
TEST(CompiledManifestAtMemoryEnd, IsNotReadBeyondForAnAttributeThatIsNotThere) {
  constexpr size_t kNode = 36, kAttribute = 20;
  Bytes document =
      CompiledXml()
          .Start("manifest", {StringAttribute("package", "p")})
          .StartWithSizelessAttributes("permission", StringAttribute("name", "other"), 1)
          .Build();
  document.resize(document.size() - kAttribute);
  SetSize(&document, 0, document.size());
  SetSize(&document, document.size() - kNode, kNode);
  LogCapture log;
  ApkTools::Apk apk(-1);
  EXPECT_TRUE(ParseAtMemoryEnd(&apk, document));
  EXPECT_EQ(apk.GetPackageName(), "p");
}

TEST(CompiledManifestAtMemoryEnd, WithoutRoomForAHeaderIsNone) {
  const Bytes whole = CompiledManifest("com.example.app");
  for (int size = 0; size < 8; ++size) {
    ApkTools::Apk apk(-1);
    LogCapture log;
    EXPECT_FALSE(ParseAtMemoryEnd(&apk, Bytes(whole.begin(), whole.begin() + size)));
    // The parser's code for a type that it does not take.
    EXPECT_EQ(log.records(), Records({Error("ParseAndroidManifest failed to init xml parser, "
                                            "error=0x80000001\n")}))
        << size;
  }
}

}  // namespace
