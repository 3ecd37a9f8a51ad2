// Writes the texts of a signed JAR (JAR File Specification, "Signed JAR File"): the manifest and
// the signature file, with their digests.
#pragma once

#include <string>
#include <vector>

#include "support/der.h"

// Returns the data in base64, in the standard alphabet and with padding.
std::string Base64Encode(const Bytes& data);

// The digest of the data in base64. `attribute` chooses the algorithm: "MD5-Digest", "SHA1-Digest"
// or "SHA-256-Digest". For any other attribute, the text "AAAA".
std::string DigestText(const std::string& attribute, const Bytes& data);

// A manifest or signature file, line by line. Each line has at most 72 bytes, including the CR LF
// at its end. A longer attribute continues on the next line.
class JarText {
 public:
  // Starts with the main section's first line, such as "Manifest-Version: 1.0".
  static JarText Manifest();
  static JarText SignatureFile();

  JarText& Attribute(const std::string& name, const std::string& value);
  // Adds one digest attribute for each name in `attributes`.
  JarText& Digests(const std::vector<std::string>& attributes, const Bytes& data,
                   const std::string& suffix = "");
  JarText& EndSection();
  // Adds a whole section: "Name", the digests, and the empty line at the section's end.
  JarText& Section(const std::string& name, const std::vector<std::string>& attributes,
                   const Bytes& data);

  const std::string& text() const { return text_; }

 private:
  std::string text_;
};

// The text of the signature file for this manifest, with one attribute "…-Digest-Manifest" for each
// digest attribute in `attributes`.
std::string SignatureFileText(const std::string& manifest,
                              const std::vector<std::string>& attributes);
