// What came of one file: the one structure from which the text, the journal's last event and any
// other form of it are made. Plain data, computed once by MakeReport (make_report.h) from what the
// journal tells and from what can be seen in the file.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "simulator/package/facts.h"
#include "simulator/run/events.h"
#include "simulator/verdict/causes.h"

namespace simulator {

enum class Verdict {
  kSigned,
  kPartlySigned,
  kRefused,
  kTrustedJar,
  kNotTrustedJar,
  kNotLookedAt,
  kNotSimulated,
};

enum class ItemKind { kPackage, kJar, kFile, kLibrary, kKey, kTool };

enum class ItemState {
  kDone,     // signed, or registered
  kRefused,  // should have been, and was not
  kAbsent,   // a library that does not lie beside the package; refused where the user is strict
  kNothing,  // nothing to sign
};

// A cause with what fills in its "%s".
struct Reason {
  const Cause* cause = nullptr;
  std::string detail;

  std::string Text() const;
};

// One thing that was to be signed or registered.
struct Item {
  ItemKind kind;
  std::string name;   // of a library: below the package's folder; of a key: what it is for
  std::string entry;  // of a library: in the package
  ItemState state;
  Reason reason;  // none for what is done
};

// A part of the package, by what protects it.
struct Share {
  uint64_t entries = 0;
  uint64_t bytes = 0;  // in the archive
};

struct Protection {
  Share verified;   // dex and libraries, whose digests were compared with the manifest
  Share vouched;    // in the manifest, and not compared or not the same
  Share unlisted;   // not in the manifest
  Share signature;  // the manifest, signature files and blocks
  std::vector<std::string> unlisted_names;
};

enum class LinkState { kHolds, kBroken, kNotReached };

// One link of the chain from the key to the entries, each of which vouches for the next.
struct Link {
  const char* name;
  LinkState state;
  std::string text;  // what stands there; of a broken one, why it does not hold
};

struct Report {
  std::string file;  // as given
  std::string path;  // absolute, without symbolic links
  Verdict verdict = Verdict::kNotSimulated;
  std::string package_name;
  std::vector<Item> items;
  std::vector<Reason> warnings;

  std::optional<CertificateFacts> signer;  // of the JAR signature
  std::vector<std::string> schemes;        // that the file carries: "v1", "v2", …
  std::vector<NewerSignerFacts> newer;     // who signed with those after v1
  Protection protection;
  uint64_t file_size = 0;
  std::vector<Link> chain;  // empty for what is no package

  Events events;  // all that happened, in order
};

// The exit status that a verdict stands for.
int StatusOf(Verdict verdict);

}  // namespace simulator
