// The tool's parser reads each certificate of Debian's package ca-certificates. The results are
// compared with the output of `openssl x509`.
#include <gtest/gtest.h>
#include <openssl/bio.h>
#include <openssl/mem.h>
#include <openssl/pem.h>

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <iterator>
#include <map>
#include <sstream>

#include "crypto/parsed_certificate.h"

namespace {

constexpr char kDirectory[] = "/usr/share/ca-certificates";

std::vector<std::string> CertificateFiles() {
  std::vector<std::string> files;
  std::error_code error;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(kDirectory, error)) {
    if (entry.path().extension() == ".crt") files.push_back(entry.path());
  }
  std::sort(files.begin(), files.end());
  return files;
}

// The output of the command. If the command fails, the output can be incomplete.
std::string OutputOf(const std::string& command) {
  FILE* pipe = popen(command.c_str(), "r");
  if (pipe == nullptr) return "";
  std::string output;
  char buffer[4096];
  for (size_t n; (n = fread(buffer, 1, sizeof(buffer), pipe)) > 0;) output.append(buffer, n);
  pclose(pipe);
  return output;
}

// openssl's description of the certificate. Names have one attribute per line: the object
// identifier in digits, and the value as the DER of the string.
std::vector<std::string> OpensslLines(const std::string& file) {
  std::istringstream output(
      OutputOf("exec openssl x509 -noout -in '" + file +
               "' -serial -dates -dateopt iso_8601 -subject -issuer "
               "-nameopt oid,dump_all,dump_der,sep_multiline "
               "-ext keyUsage,basicConstraints,subjectAltName,issuerAltName 2>/dev/null"));
  std::vector<std::string> lines;
  for (std::string line; std::getline(output, line);) lines.push_back(line);
  return lines;
}

// The DER in the PEM file; empty if the file cannot be read.
Bytes DerOf(const std::string& file) {
  bssl::UniquePtr<BIO> bio(BIO_new_file(file.c_str(), "r"));
  char* name = nullptr;
  char* header = nullptr;
  uint8_t* data = nullptr;
  long length = 0;
  if (bio == nullptr || !PEM_read_bio(bio.get(), &name, &header, &data, &length)) return {};
  const Bytes der(data, data + length);
  OPENSSL_free(name);
  OPENSSL_free(header);
  OPENSSL_free(data);
  return der;
}

// The rest of the first line that starts with `start`, or an empty text if no line does.
std::string After(const std::vector<std::string>& lines, const std::string& start) {
  for (const std::string& line : lines) {
    if (line.compare(0, start.size(), start) == 0) return line.substr(start.size());
  }
  return "";
}

// The value of the extension with this title: the line after the title, unindented.
std::string ExtensionText(const std::vector<std::string>& lines, const std::string& title) {
  for (size_t i = 0; i + 1 < lines.size(); ++i) {
    if (lines[i].compare(0, title.size(), title) != 0) continue;
    const size_t start = lines[i + 1].find_first_not_of(' ');
    return start == std::string::npos ? "" : lines[i + 1].substr(start);
  }
  return "";
}

bool HasExtension(const std::vector<std::string>& lines, const std::string& title) {
  return std::any_of(lines.begin(), lines.end(), [&](const std::string& line) {
    return line.compare(0, title.size(), title) == 0;
  });
}

// Each attribute that the tool's parser keeps, as "TYPE VALUE-IN-HEX".
std::vector<std::string> NameLines(const x509_name& name) {
  std::vector<std::string> lines;
  for (size_t i = 0; i < name.attribute_count; ++i) {
    std::string line = std::to_string(name.attributes[i].type) + " ";
    for (const uint8_t byte : Field(name.attributes[i].value, name.attributes[i].value_length)) {
      char digits[3];
      snprintf(digits, sizeof(digits), "%02X", byte);
      line += digits;
    }
    lines.push_back(line);
  }
  return lines;
}

// Like NameLines, but from the indented lines "OID=#DER" that follow the line `title`.
std::vector<std::string> OpensslNameLines(const std::vector<std::string>& lines,
                                          const std::string& title) {
  const std::map<std::string, int> types = {{"0.9.2342.19200300.100.1.25", 1},
                                            {"2.5.4.3", 2},
                                            {"2.5.4.6", 3},
                                            {"2.5.4.7", 4},
                                            {"2.5.4.8", 5},
                                            {"2.5.4.10", 6},
                                            {"2.5.4.11", 7},
                                            {"0.9.2342.19200300.100.1.1", 8}};
  std::vector<std::string> kept;
  auto line = std::find(lines.begin(), lines.end(), title);
  if (line == lines.end()) return kept;
  while (++line != lines.end() && line->compare(0, 4, "    ") == 0) {
    const size_t equals = line->find("=#");
    const auto type = types.find(line->substr(4, equals - 4));
    if (type == types.end()) continue;
    // A string of fewer than 128 bytes has two header octets, which are four digits.
    kept.push_back(std::to_string(type->second) + " " + line->substr(equals + 2 + 4));
  }
  return kept;
}

std::string Iso8601(const x509_parser_time& time) {
  char text[sizeof("YYYY-MM-DD HH:MM:SSZ") + 20];
  snprintf(text, sizeof(text), "%04d-%02d-%02d %02d:%02d:%02dZ", time.year, time.month, time.day,
           time.hour, time.minute, time.second);
  return text;
}

std::string KeyUsageText(uint32_t bits) {
  const char* const kNames[] = {"Digital Signature", "Non Repudiation", "Key Encipherment",
                                "Data Encipherment", "Key Agreement",   "Certificate Sign",
                                "CRL Sign",          "Encipher Only",   "Decipher Only"};
  std::string text;
  for (size_t bit = 0; bit < std::size(kNames); ++bit) {
    if ((bits >> bit & 1) != 0) text += (text.empty() ? "" : ", ") + std::string(kNames[bit]);
  }
  return text;
}

std::string BasicConstraintsText(const x509_certificate& cert) {
  std::string text = cert.ca != 0 ? "CA:TRUE" : "CA:FALSE";
  if ((cert.extensions_present & kX509PathLenConstraint) != 0) {
    text += ", pathlen:" + std::to_string(cert.path_len_constraint);
  }
  return text;
}

void ExpectAsOpensslReads(const x509_certificate& cert, const std::vector<std::string>& lines) {
  const std::string serial = After(lines, "serial=");
  ASSERT_FALSE(serial.empty());
  const std::string low = serial.substr(serial.size() - std::min<size_t>(serial.size(), 8));
  EXPECT_EQ(cert.serial_number, std::stoul(low, nullptr, 16));

  EXPECT_EQ(Iso8601(cert.not_before), After(lines, "notBefore="));
  EXPECT_EQ(Iso8601(cert.not_after), After(lines, "notAfter="));

  EXPECT_FALSE(NameLines(cert.issuer).empty());
  EXPECT_EQ(NameLines(cert.issuer), OpensslNameLines(lines, "issuer="));
  EXPECT_EQ(NameLines(cert.subject), OpensslNameLines(lines, "subject="));

  const std::pair<const char*, uint32_t> extensions[] = {
      {"X509v3 Basic Constraints:", kX509BasicConstraints},
      {"X509v3 Key Usage:", kX509KeyUsage},
      {"X509v3 Subject Alternative Name:", kX509SubjectAltName},
      {"X509v3 Issuer Alternative Name:", kX509IssuerAltName},
  };
  for (const auto& [title, bit] : extensions) {
    EXPECT_EQ((cert.extensions_present & bit) != 0, HasExtension(lines, title)) << title;
  }
  if ((cert.extensions_present & kX509KeyUsage) != 0) {
    EXPECT_EQ(KeyUsageText(cert.key_usage), ExtensionText(lines, "X509v3 Key Usage:"));
  }
  if ((cert.extensions_present & kX509BasicConstraints) != 0) {
    EXPECT_EQ(BasicConstraintsText(cert), ExtensionText(lines, "X509v3 Basic Constraints:"));
  }
}

}  // namespace

TEST(X509DebianCertificates, EveryCertificateIsReadAsOpensslReadsIt) {
  const std::vector<std::string> files = CertificateFiles();
  ASSERT_FALSE(files.empty()) << "no certificates in " << kDirectory;
  uint32_t extensions_seen = 0;
  for (const std::string& file : files) {
    SCOPED_TRACE(file);
    const std::vector<std::string> lines = OpensslLines(file);
    const ParsedCertificate parsed(DerOf(file));
    ASSERT_EQ(parsed.result, 0);
    EXPECT_EQ(parsed.cert.cert_length, parsed.bytes.size());
    ExpectAsOpensslReads(parsed.cert, lines);
    extensions_seen |= parsed.cert.extensions_present;
  }
  // Makes sure that the comparisons of key usages and basic constraints had values to compare.
  EXPECT_EQ(extensions_seen & 7u, kX509BasicConstraints | kX509PathLenConstraint | kX509KeyUsage);
}
