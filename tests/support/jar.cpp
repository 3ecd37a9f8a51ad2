#include "support/jar.h"

#include <openssl/base64.h>

#include <cstdlib>

#include "support/certificate.h"

std::string Base64Encode(const Bytes& data) {
  std::string text(4 * ((data.size() + 2) / 3) + 1, '\0');
  text.resize(EVP_EncodeBlock(reinterpret_cast<uint8_t*>(text.data()), data.data(), data.size()));
  return text;
}

std::string DigestText(const std::string& attribute, const Bytes& data) {
  if (attribute == "MD5-Digest") return Base64Encode(DigestOf(Digest::kMd5, data));
  if (attribute == "SHA1-Digest") return Base64Encode(DigestOf(Digest::kSha1, data));
  if (attribute == "SHA-256-Digest") return Base64Encode(DigestOf(Digest::kSha256, data));
  return "AAAA";
}

JarText JarText::Manifest() {
  JarText manifest;
  return manifest.Attribute("Manifest-Version", "1.0");
}

JarText JarText::SignatureFile() {
  JarText signature_file;
  return signature_file.Attribute("Signature-Version", "1.0");
}

JarText& JarText::Attribute(const std::string& name, const std::string& value) {
  constexpr size_t kLineLength = 70;  // without the line end
  std::string line = name + ": " + value;
  for (; line.size() > kLineLength; line = " " + line.substr(kLineLength)) {
    text_ += line.substr(0, kLineLength) + "\r\n";
  }
  text_ += line + "\r\n";
  return *this;
}

JarText& JarText::Digests(const std::vector<std::string>& attributes, const Bytes& data,
                          const std::string& suffix) {
  for (const std::string& attribute : attributes) {
    Attribute(attribute + suffix, DigestText(attribute, data));
  }
  return *this;
}

JarText& JarText::EndSection() {
  text_ += "\r\n";
  return *this;
}

JarText& JarText::Section(const std::string& name, const std::vector<std::string>& attributes,
                          const Bytes& data) {
  return Attribute("Name", name).Digests(attributes, data).EndSection();
}

std::string SignatureFileText(const std::string& manifest,
                              const std::vector<std::string>& attributes) {
  return JarText::SignatureFile()
      .Digests(attributes, ToBytes(manifest), "-Manifest")
      .EndSection()
      .text();
}
