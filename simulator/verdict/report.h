// The result for one file: the one structure from which the text, the journal's last event and all
// other forms are made. Plain data, computed once by MakeReport (make_report.h).
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
  kOtherSigner,  // signed, and phones install it for another signer than the kernel knows it by
  kTrustedJar,
  kPartlySigned,
  kNotInstallable,  // something was signed, and phones do not install it
  kNotAccepted,     // all was signed, and it is not what the command line demands
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

// Signed or registered; should have been and was not; a library that does not lie beside the
// package, which is refused where the user is strict; nothing to sign.
enum class ItemState { kDone, kRefused, kAbsent, kNothing };

// A cause with what fills in its "%s".
struct Reason {
  const Cause* cause = nullptr;
  std::string detail;

  std::string Text() const;
};

// One thing that was to be signed or registered, or somebody who refuses all of it.
struct Item {
  ItemKind kind;
  std::string name;   // of a library: below the package's directory; of a key: what it is for
  std::string entry;  // of a library: in the package
  ItemState state;
  Reason reason;             // none for what is done
  bool is_verified = false;  // its bytes were compared with the manifest, and are the same
};

// The key that the JAR signature is made with, as kernel and tool know it.
struct KernelKey {
  std::string sha256;    // of its modulus; in hexadecimal
  int bits = 0;          // 0: not known
  bool was_got = false;  // the kernel got this digest; else it is what the tool would hand to it
};

// A part of the package, by what protects it.
struct Share {
  uint64_t entries = 0;
  uint64_t bytes = 0;  // in the archive
};

struct Protection {
  Share verified;   // as the manifest lists them, and the tool looked at them: dex and libraries
  Share vouched;    // as the manifest lists them, and the tool did not look at them
  Share unlisted;   // not in the manifest
  Share signature;  // the manifest, signature files and blocks
  std::vector<std::string> unlisted_names;
  Share differing = {};         // other than the manifest lists them
  Share uncompared = {};        // in the manifest, and not compared with it
  uint64_t differing_seen = 0;  // of the differing entries, at how many the tool looked
  std::vector<std::string> differing_names = {};
  std::vector<std::string> missing_names = {};  // in the manifest, and not in the package
};

enum class LinkState { kHolds, kBroken, kNotReached };

// One link of the chain from the key to the entries.
struct Link {
  const char* name;
  LinkState state;
  std::string text;  // what stands there; of a broken one, why it does not hold
};

struct Report {
  std::string file;       // as given
  std::string path;       // absolute, without symbolic links
  std::string installed;  // of a package that was laid out: <install>/base.apk; else empty
  Verdict verdict = Verdict::kNotSimulated;
  std::string package_name;  // as the tool reads it
  std::vector<Item> items;
  std::vector<Reason> warnings;

  std::string payload;                     // that the kernel got, in hexadecimal; empty: none
  std::optional<KernelKey> key;            // of a package with an RSA key
  std::optional<CertificateFacts> signer;  // of the JAR signature
  std::vector<std::string> schemes;        // that the file carries: "v1", "v2", …
  std::vector<NewerSignerFacts> newer;     // who signed with those after v1
  Judgement installer;
  Protection protection;
  uint64_t file_size = 0;
  std::string file_sha256;  // in lower-case hexadecimal; empty: not known
  ToolIdentity tool;
  std::vector<Link> chain;  // empty for a file that is not a package

  Events events;  // all that happened, in order
};

// The item that the verdict comes from, such as the first that was refused; null if nothing was.
const Item* DecisiveItem(const Report& report);

// A signer for whom the newest of the phones that take the package install it, and who is not the
// JAR's; null if all are the JAR's. Of the report the signer and the key are filled.
const CertificateFacts* OtherSigner(const Judgement& judgement, const Report& report);

// The exit status that a verdict stands for.
ExitStatus StatusOf(Verdict verdict);

}  // namespace simulator
