// The result for one file. All outputs about the file, such as the text and the journal's last
// event, are made from this result. MakeReport (make_report.h) computes the result. Gate (gate.h)
// can then add refused items and change the verdict.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "simulator/installer/judgement.h"
#include "simulator/package/facts.h"
#include "simulator/run/run_record.h"
#include "simulator/verdict/causes.h"
#include "simulator/verdict/exit_status.h"

namespace simulator {

enum class Verdict {
  kSigned,
  kOtherSigner,  // signed, but phones install it as signed by another signer than the JAR signer
  kTrustedJar,
  kPartlySigned,
  kNotInstallable,  // something was signed, but not all phones install the package
  kNotAccepted,     // the verdict was good, but a demand of Gate (gate.h) is not met
  kRefused,
  kNotTrustedJar,
  kNotLookedAt,
  kNotSimulated,
};

enum class ItemKind {
  kPackage,
  kJar,
  kFile,
  kEntries,
  kLibrary,
  kKey,
  kTool,
  kInstaller,
  kSigner,
  kWarnings
};

enum class ItemState {
  kDone,     // signed or registered
  kRefused,  // should be signed, registered, installed or accepted, but is not
  kAbsent,   // a library that is not beside the package; kRefused under --strict
  kNothing   // nothing to sign
};

// A cause and the text for its "%s".
struct Reason {
  const Cause* cause = nullptr;
  std::string detail;

  std::string Text() const;
};

// One thing to sign or to register, and the result. Items of the kinds kEntries, kTool, kInstaller,
// kSigner and kWarnings are other reasons to refuse the file.
struct Item {
  ItemKind kind;
  std::string name;   // of a library: its path below the package's directory, or else its entry;
                      // of a key: the package's name or the JAR's path, under which it is
                      // registered; empty if libzu was not asked
  std::string entry;  // of a library: its entry in the package
  ItemState state;
  Reason reason;  // a null cause if the state is kDone
  // A package: the tool verified it. A library: its bytes match the manifest.
  bool is_verified = false;
};

// The key whose digest the kernel got. If the kernel got no digest, the key whose digest the tool
// would send.
struct KernelKey {
  std::string sha256;    // of its modulus; in hexadecimal
  int bits = 0;          // 0: not known
  bool was_got = false;  // true: the kernel got this digest; false: the tool would send it
};

// The size of a part of the package.
struct Share {
  uint64_t entries = 0;
  uint64_t bytes = 0;  // compressed
};

struct Protection {
  Share verified;   // entries that match the manifest, checked by the tool: dex and libraries
  Share vouched;    // entries that match the manifest, not checked by the tool
  Share unlisted;   // entries without a digest in the manifest
  Share signature;  // the manifest, signature files and blocks
  std::vector<std::string> unlisted_names;
  Share differing;              // entries that do not match the manifest
  Share uncompared;             // listed entries that were not compared with the manifest
  uint64_t differing_seen = 0;  // the number of differing entries that the tool checked
  std::vector<std::string> differing_names;
  std::vector<std::string> missing_names;  // in the manifest, but not in the package
};

enum class LinkState { kHolds, kBroken, kNotReached };

// One link of the chain from the key to the entries.
struct Link {
  const char* name;
  LinkState state;
  std::string text;  // describes the link; if the link is broken, the reason
};

struct Report {
  std::string file;       // as given
  std::string path;       // absolute, without symbolic links
  std::string installed;  // the copy with extracted libraries: <install>/base.apk; empty: none
  Verdict verdict = Verdict::kNotSimulated;
  std::string package_name;  // as the tool reads it
  std::vector<Item> items;
  std::vector<Reason> warnings;

  std::string payload;                     // that the kernel got, in hexadecimal; empty: none
  std::optional<KernelKey> key;            // of a package with an RSA key
  std::optional<CertificateFacts> signer;  // of the JAR signature
  std::vector<std::string> schemes;        // the file's schemes: "v1", "v2", …
  std::vector<NewerSignerFacts> newer;     // the signers of the schemes after v1
  Judgement installer;
  Protection protection;
  uint64_t file_size = 0;
  std::string file_sha256;  // in lower-case hexadecimal; empty: not known
  ToolIdentity tool;
  std::vector<Link> chain;  // empty for a file that is not a package

  Events events;  // all events, in order
};

// The refused item that decides the verdict: the installer's item if the installer caused the
// verdict, else the first refused item. Null if nothing was refused.
const Item* DecisiveItem(const Report& report);

// Returns a signer whom the newest phones take as the package's signer, but who is not the JAR
// signer. Null if there is no such signer. "The newest phones" are those of the last range in
// `judgement` that installs the package. Reads only the signer and the key of the report.
const CertificateFacts* OtherSigner(const Judgement& judgement, const Report& report);

// False for an item about the phones' installer, or about a demand that is not met (gate.h). True
// for all other items.
bool IsByTool(const Item& item);

// True for a file that was signed in this run; false for a registered key.
bool IsSigned(const Item& item);

ExitStatus StatusOf(Verdict verdict);

}  // namespace simulator
