// apk/android_manifest.cpp: any bytes as the compiled Android manifest, put where memory ends, for
// the platform's parser is not instrumented.
#include "apk/apk.h"
#include "fuzz/fuzz.h"
#include "support/memory_end.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  ApkTools::Apk apk(-1);
  const bool parsed = apk.ParseAndroidManifest(AtMemoryEnd(data, size));
  Require(parsed || (apk.GetPackageName().empty() && !apk.IsSsPermissionRequired()),
          "what does not parse says nothing");
  // Each character of a name comes from its own place in the document: one of UTF-16 makes up to
  // three bytes of UTF-8 for two.
  Require(apk.GetPackageName().size() <= 2 * size, "a name is no longer than its document");
  return 0;
}
