#include "simulator/package/certificate.h"

#include <openssl/bio.h>
#include <openssl/bn.h>
#include <openssl/evp.h>
#include <openssl/mem.h>
#include <openssl/obj.h>
#include <openssl/rsa.h>
#include <openssl/sha.h>
#include <openssl/x509v3.h>

#include <algorithm>
#include <cctype>

#include "simulator/phone/text.h"

namespace simulator {

namespace {

PublicKey ReadKey(X509* certificate);
std::optional<int64_t> SecondsOf(const ASN1_TIME* time);
std::string IssuerAndSerial(const X509* certificate);
std::string Text(const uint8_t* bytes, int size);
std::string NameText(const X509_NAME* name);
std::string AttributeText(const X509_NAME_ENTRY* attribute);
std::string KeyKind(const ASN1_OBJECT* algorithm);
std::string SignatureName(const ASN1_OBJECT* algorithm);

}  // namespace

std::optional<CertificateFacts> ParseCertificate(std::string_view der) {
  const auto* const start = reinterpret_cast<const uint8_t*>(der.data());
  const uint8_t* end = start;
  const bssl::UniquePtr<X509> certificate(d2i_X509(nullptr, &end, static_cast<long>(der.size())));
  if (certificate == nullptr) return {};
  const X509_NAME* const subject = X509_get_subject_name(certificate.get());
  const X509_NAME* const issuer = X509_get_issuer_name(certificate.get());
  const X509_ALGOR* signature = nullptr;
  const ASN1_OBJECT* algorithm = nullptr;
  X509_get0_signature(nullptr, &signature, certificate.get());
  X509_ALGOR_get0(&algorithm, nullptr, nullptr, signature);

  CertificateFacts facts;
  facts.subject = NameText(subject);
  facts.issuer = NameText(issuer);
  facts.is_self_issued = X509_NAME_cmp(subject, issuer) == 0;
  der = der.substr(0, static_cast<size_t>(end - start));
  facts.sha256 = Sha256Hex(der);
  facts.sha1 = Sha1Hex(der);
  facts.signature_algorithm = SignatureName(algorithm);
  const int nid = OBJ_obj2nid(algorithm);
  facts.has_known_digest = nid == NID_md5WithRSAEncryption || nid == NID_sha1WithRSAEncryption ||
                           nid == NID_sha256WithRSAEncryption;
  facts.not_after = SecondsOf(X509_get0_notAfter(certificate.get()));
  facts.key = ReadKey(certificate.get());
  facts.issuer_and_serial = IssuerAndSerial(certificate.get());
  if (const ASN1_OCTET_STRING* const id = X509_get0_subject_key_id(certificate.get())) {
    facts.key_id = Text(ASN1_STRING_get0_data(id), ASN1_STRING_length(id));
  }
  return facts;
}

AlgorithmFacts AlgorithmOf(const ASN1_OBJECT* algorithm) {
  const int nid = OBJ_obj2nid(algorithm);
  if (nid != NID_undef) return {nid, OBJ_nid2sn(nid)};
  char text[80] = "";
  OBJ_obj2txt(text, sizeof(text), algorithm, 1);
  return {nid, text};
}

AlgorithmFacts ParseAlgorithm(std::string_view der) {
  const auto* bytes = reinterpret_cast<const uint8_t*>(der.data());
  const bssl::UniquePtr<X509_ALGOR> parsed(
      d2i_X509_ALGOR(nullptr, &bytes, static_cast<long>(der.size())));
  if (parsed == nullptr) return {};
  const ASN1_OBJECT* algorithm = nullptr;
  X509_ALGOR_get0(&algorithm, nullptr, nullptr, parsed.get());
  return AlgorithmOf(algorithm);
}

std::string Sha1Hex(std::string_view bytes) {
  uint8_t digest[SHA_DIGEST_LENGTH];
  SHA1(reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size(), digest);
  return HexText({reinterpret_cast<const char*>(digest), sizeof(digest)});
}

std::string Sha256Hex(std::string_view bytes) {
  Sha256 digest;
  digest.Add(bytes);
  return digest.Hex();
}

std::string Sha256::Hex() {
  uint8_t digest[SHA256_DIGEST_LENGTH];
  SHA256_Final(digest, &state_);
  return HexText({reinterpret_cast<const char*>(digest), sizeof(digest)});
}

namespace {

PublicKey ReadKey(X509* certificate) {
  PublicKey key;
  X509_PUBKEY* const info = X509_get_X509_PUBKEY(certificate);
  ASN1_OBJECT* algorithm = nullptr;
  X509_PUBKEY_get0_param(&algorithm, nullptr, nullptr, nullptr, info);
  key.algorithm = KeyKind(algorithm);
  uint8_t* der = nullptr;
  const int size = i2d_X509_PUBKEY(info, &der);
  const bssl::UniquePtr<uint8_t> owner(der);
  key.sha256 = Sha256Hex(Text(der, size));
  // X509_get_pubkey returns null for a key that the library does not support, such as a key on an
  // unknown curve.
  const bssl::UniquePtr<EVP_PKEY> parsed(X509_get_pubkey(certificate));
  if (parsed == nullptr) return key;
  key.bits = EVP_PKEY_bits(parsed.get());
  if (const RSA* const rsa = EVP_PKEY_get0_RSA(parsed.get())) {
    std::string modulus(BN_num_bytes(RSA_get0_n(rsa)), '\0');
    BN_bn2bin(RSA_get0_n(rsa), reinterpret_cast<uint8_t*>(modulus.data()));
    key.modulus_sha256 = Sha256Hex(modulus);
  }
  return key;
}

// Returns the seconds from 1970 to `time`. ASN1_TIME_diff accepts both UTCTime and
// GeneralizedTime.
std::optional<int64_t> SecondsOf(const ASN1_TIME* time) {
  constexpr int64_t kSecondsOfDay = 86'400;
  const bssl::UniquePtr<ASN1_TIME> start(ASN1_TIME_set(nullptr, 0));
  int days = 0;
  int seconds = 0;
  if (start == nullptr || ASN1_TIME_diff(&days, &seconds, start.get(), time) == 0) return {};
  return days * kSecondsOfDay + seconds;
}

// Writes the RelativeDistinguishedNames in reverse order, and the attributes inside each of them in
// their own order. Leaves out all attributes after the first kMostAttributes. Ordinary names have
// far fewer attributes.
std::string NameText(const X509_NAME* name) {
  constexpr int kMostAttributes = 256;
  std::string text, part;
  const int count = std::min(X509_NAME_entry_count(name), kMostAttributes);
  for (int i = 0; i < count; ++i) {
    const X509_NAME_ENTRY* const attribute = X509_NAME_get_entry(name, i);
    part += (part.empty() ? "" : " + ") + AttributeText(attribute);
    const bool goes_on = i + 1 < count && X509_NAME_ENTRY_set(X509_NAME_get_entry(name, i + 1)) ==
                                              X509_NAME_ENTRY_set(attribute);
    if (goes_on) continue;
    text.insert(0, part + (text.empty() ? "" : ", "));
    part.clear();
  }
  return text;
}

// Writes the JDK's keywords for the usual types of attributes, because people search for these
// keywords. The library's own function for names writes other keywords. Here the library therefore
// prints only the value: in quotation marks if the value has special characters, and as hexadecimal
// digits if the value is not a text.
std::string AttributeText(const X509_NAME_ENTRY* attribute) {
  constexpr unsigned long kFlags = ASN1_STRFLGS_ESC_2253 | ASN1_STRFLGS_ESC_QUOTE |
                                   ASN1_STRFLGS_UTF8_CONVERT | ASN1_STRFLGS_DUMP_UNKNOWN |
                                   ASN1_STRFLGS_DUMP_DER;
  const AlgorithmFacts type = AlgorithmOf(X509_NAME_ENTRY_get_object(attribute));
  std::string text = type.nid == NID_undef ? "OID." + type.name : type.name;
  for (char& c : text) c = static_cast<char>(toupper(static_cast<unsigned char>(c)));
  if (type.nid == NID_title) text = "T";
  if (type.nid == NID_surname) text = "SURNAME";
  if (type.nid == NID_givenName) text = "GIVENNAME";
  const bssl::UniquePtr<BIO> out(BIO_new(BIO_s_mem()));
  ASN1_STRING_print_ex(out.get(), X509_NAME_ENTRY_get_data(attribute), kFlags);
  const uint8_t* value = nullptr;
  size_t size = 0;
  BIO_mem_contents(out.get(), &value, &size);
  return text + "=" + Text(value, static_cast<int>(size));
}

// Uses the JDK's names for the three kinds of keys that sign packages.
std::string KeyKind(const ASN1_OBJECT* algorithm) {
  const AlgorithmFacts facts = AlgorithmOf(algorithm);
  if (facts.nid == NID_rsaEncryption) return "RSA";
  if (facts.nid == NID_X9_62_id_ecPublicKey) return "EC";
  return facts.nid == NID_dsa ? "DSA" : facts.name;
}

// If the library knows the algorithm and its digest, the result has the form of keytool's -sigalg,
// such as "SHA256withRSA". Otherwise the result is the name from AlgorithmOf.
std::string SignatureName(const ASN1_OBJECT* algorithm) {
  int digest = NID_undef;
  int key = NID_undef;
  const bool is_known = OBJ_find_sigid_algs(OBJ_obj2nid(algorithm), &digest, &key) != 0;
  if (!is_known || digest == NID_undef) return AlgorithmOf(algorithm).name;
  const char* const kind = key == NID_rsaEncryption ? "RSA" : key == NID_dsa ? "DSA" : "ECDSA";
  return std::string(OBJ_nid2sn(digest)) + "with" + kind;
}

std::string IssuerAndSerial(const X509* certificate) {
  const uint8_t* issuer = nullptr;
  size_t issuer_size = 0;
  X509_NAME_get0_der(X509_get_issuer_name(certificate), &issuer, &issuer_size);
  uint8_t* serial = nullptr;
  const int serial_size = i2d_ASN1_INTEGER(X509_get0_serialNumber(certificate), &serial);
  const bssl::UniquePtr<uint8_t> owner(serial);
  return Text(issuer, static_cast<int>(issuer_size)) + Text(serial, serial_size);
}

// The library reports a failure by a negative `size`. The result is then empty.
std::string Text(const uint8_t* bytes, int size) {
  if (size <= 0) return {};
  return {reinterpret_cast<const char*>(bytes), static_cast<size_t>(size)};
}

}  // namespace

}  // namespace simulator
