// The texts of a JAR signature, as far as explaining needs them: which entries the manifest lists
// with a digest, and what the signature file says of itself. Whether any of it holds is for the
// tool to say.
#pragma once

#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace simulator {

// A section: each attribute's name and value, in the order of the text. Continuation lines are put
// together; a line without a colon and a space is passed over.
using ManifestSection = std::vector<std::pair<std::string, std::string>>;

std::vector<ManifestSection> ParseJarManifest(std::string_view text);

// The names of the entries that the manifest has a digest for.
std::set<std::string> ListedEntries(std::string_view manifest);

// The schemes that the package was signed with besides JAR signing, as the signature file has them
// in X-Android-APK-Signed, such as "2, 3"; empty when it says nothing of the kind.
std::string ClaimedSchemes(std::string_view signature_file);

// Whether the signature file states a digest of the whole manifest, of whatever kind.
bool StatesManifestDigest(std::string_view signature_file);

}  // namespace simulator
