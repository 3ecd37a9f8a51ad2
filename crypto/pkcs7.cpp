#include "crypto/pkcs7.h"

#include <algorithm>
#include <cstdarg>
#include <cstddef>
#include <cstdio>
#include <cstring>

#include "crypto/asn1.h"
#include "crypto/wrapping.h"
#include "crypto/x509.h"

namespace {

// The signature block. Every offset is counted from the start of the block. An offset may be beyond
// the end of the block.
struct Block {
  const uint8_t* bytes;
  size_t length;

  // Reads the header at `offset`. Fails if the header is not inside the block, or if the element
  // does not end within `bound` bytes from `offset`.
  bool Read(size_t offset, size_t bound, asn1_hdr* hdr) const;
  // Reads the header at `offset`. Fails if the element does not end at or before `end`. The caller
  // must pass an `end` of at most `length`.
  bool ReadInside(size_t offset, size_t end, asn1_hdr* hdr) const;
  // The offsets where an element's contents start, and where they end.
  size_t Enter(const asn1_hdr& hdr) const { return static_cast<size_t>(hdr.payload - bytes); }
  size_t Skip(const asn1_hdr& hdr) const { return Enter(hdr) + hdr.length; }
};

bool ReadBlock(const Block& block, pkcs7* record);
bool ReadHeaders(const Block& block, asn1_hdr* hdr);
bool ReadCertificate(const Block& block, const asn1_hdr& certificates,
                     x509_certificate* certificate, pkcs7* record);
bool ReadPublicKey(const Block& block, const x509_certificate& certificate, pkcs7* record);
void StoreExponent(const asn1_hdr& exponent, pkcs7* record);
bool ReadSigner(const Block& block, const asn1_hdr& certificates, pkcs7* record);
bool ReadDigestAlgorithm(const Block& block, size_t offset, size_t end, asn1_hdr* algorithm);

// Prints the failure on a line of its own. Returns false.
bool Fail(const char* format, ...) __attribute__((format(printf, 1, 2)));

constexpr char kUnreadable[] = "PUBLIC KEY ERROR: reading asn1 tag fail";
constexpr char kNotAnInteger[] = "PUBLIC KEY ERROR: processing INTEGER tag fail";

}  // namespace

int processCert(const uint8_t* block, uint32_t length, pkcs7* record) {
  return ReadBlock({block, length}, record) ? 0 : 1;
}

namespace {

bool ReadBlock(const Block& block, pkcs7* record) {
  asn1_hdr certificates;
  x509_certificate certificate;
  if (!ReadHeaders(block, &certificates)) return Fail("processPKCS7Header() error");
  // Deliberate: if the certificate cannot be parsed, only the line of ReadCertificate is printed.
  // Every other failure prints a second line, which names the step.
  if (!ReadCertificate(block, certificates, &certificate, record)) return false;
  if (!ReadPublicKey(block, certificate, record)) return Fail("processPublicKey() error");
  return ReadSigner(block, certificates, record) || Fail("processSignHeader() error");
}

bool Block::Read(size_t offset, size_t bound, asn1_hdr* hdr) const {
  *hdr = {};
  if (offset > length) return false;
  return asn1_get_next_bounded(bytes + offset, length - offset, bound, hdr) == 0;
}

bool Block::ReadInside(size_t offset, size_t end, asn1_hdr* hdr) const {
  return offset <= end && asn1_get_next(bytes + offset, end - offset, hdr) == 0;
}

// Reads the headers from the start of the block to the [0] of the certificates. Leaves the last
// header in `hdr`. Deliberate: no tag is checked. Each element, header included, may be as long as
// the whole block. An element may therefore end beyond the block.
WRAPS_ON_PURPOSE bool ReadHeaders(const Block& block, asn1_hdr* hdr) {
  if (!block.Read(0, block.length, hdr) || !block.Read(block.Enter(*hdr), block.length, hdr)) {
    return Fail("CANT PROCESS CERTIFICATE TAG");
  }

  if (block.Read(block.Skip(*hdr), block.length, hdr) &&   // the [0] of the content
      block.Read(block.Enter(*hdr), block.length, hdr) &&  // the SignedData
      block.Read(block.Enter(*hdr), block.length, hdr) &&  // its version
      block.Read(block.Skip(*hdr), block.length, hdr) &&   // the digestAlgorithms
      block.Read(block.Skip(*hdr), block.length, hdr) &&   // the contentInfo
      block.Read(block.Skip(*hdr), block.length, hdr)) {   // the [0] of the certificates
    return true;
  }
  // Deliberate: the payload of an unreadable header is null. The printed offset is therefore 0
  // minus the address of the block.
  const uintptr_t offset =
      reinterpret_cast<uintptr_t>(hdr->payload) - reinterpret_cast<uintptr_t>(block.bytes);
  return Fail("CANT PROCESS CERTIFICATE TAG = %d, offset = %p", static_cast<int>(hdr->tag),
              reinterpret_cast<void*>(offset));
}

// Deliberate: the first of several certificates is used, even if the SignerInfo names another.
bool ReadCertificate(const Block& block, const asn1_hdr& certificates,
                     x509_certificate* certificate, pkcs7* record) {
  const size_t available = block.length - block.Enter(certificates);
  const int result = x509_certificate_parse(
      certificates.payload, std::min<size_t>(certificates.length, available), certificate);
  if (result != 0) return Fail("x509_certificate_parse() error %i", result);

  record->cert_signature = certificate->signature_value;
  record->cert_signature_length = static_cast<uint32_t>(certificate->signature_value_length);
  record->tbs_data = certificate->tbs_start;
  record->tbs_data_length = static_cast<uint32_t>(certificate->tbs_length);
  return true;
}

// Reads the RSAPublicKey (RFC 8017 §A.1.1). Deliberate: tag numbers are checked, classes are not.
bool ReadPublicKey(const Block& block, const x509_certificate& certificate, pkcs7* record) {
  asn1_hdr hdr;
  if (asn1_get_next(certificate.public_key, certificate.public_key_length, &hdr) != 0) {
    return Fail(kUnreadable);
  }
  if (hdr.tag != kAsn1Sequence) return Fail("PUBLIC KEY ERROR: processing SEQUENCE tag fail");

  asn1_hdr modulus;
  if (asn1_get_next(hdr.payload, hdr.length, &modulus) != 0) return Fail(kUnreadable);
  if (modulus.tag != kAsn1Integer) return Fail(kNotAnInteger);
  const uint32_t zeros = modulus.length > 0 && modulus.payload[0] == 0 ? 1 : 0;
  record->modulus = modulus.payload + zeros;
  record->modulus_length = modulus.length - zeros;

  // Deliberate: the exponent, header included, may be as long as the contents of the modulus. The
  // end of the key does not limit it. The exponent is copied, so its contents must be inside the
  // block.
  asn1_hdr exponent;
  if (!block.Read(block.Skip(modulus), modulus.length, &exponent)) return Fail(kUnreadable);
  if (exponent.tag != kAsn1Integer) return Fail(kNotAnInteger);
  if (block.Skip(exponent) > block.length) return Fail(kUnreadable);
  StoreExponent(exponent, record);
  return true;
}

// Deliberate: the fifth to the eighth byte of an exponent overwrite the modulus length, which
// follows the exponent in the record. Later bytes are dropped. The exponents of ordinary keys have
// at most three bytes. With a longer exponent, an attacker can choose the modulus length. The
// caller of processCert must therefore check the modulus length.
void StoreExponent(const asn1_hdr& exponent, pkcs7* record) {
  constexpr size_t kStart = offsetof(pkcs7, exponent);
  constexpr size_t kEnd = offsetof(pkcs7, modulus_length) + sizeof(record->modulus_length);
  static_assert(offsetof(pkcs7, modulus_length) == kStart + sizeof(record->exponent));

  memset(record->exponent, 0, sizeof(record->exponent));
  memcpy(reinterpret_cast<uint8_t*>(record) + kStart, exponent.payload,
         std::min<size_t>(exponent.length, kEnd - kStart));
}

// Reads the first SignerInfo (RFC 2315 §9.2). The element after the certificates is read as the
// signerInfos. Deliberate: failures here print "PUBLIC KEY ERROR", like failures in the public key.
bool ReadSigner(const Block& block, const asn1_hdr& certificates, pkcs7* record) {
  asn1_hdr signers, signer, version, issuer;
  if (!block.ReadInside(block.Skip(certificates), block.length, &signers) ||
      !block.ReadInside(block.Enter(signers), block.length, &signer) ||
      !block.ReadInside(block.Enter(signer), block.length, &version) ||
      !block.ReadInside(block.Skip(version), block.length, &issuer)) {
    return Fail(kUnreadable);
  }
  asn1_hdr algorithm;
  if (!ReadDigestAlgorithm(block, block.Skip(issuer), block.Skip(signer), &algorithm)) {
    return Fail("PUBLIC KEY ERROR: parse algorithm identifier");
  }

  // Deliberate: the two elements after the digestAlgorithm are found by position, and their tags
  // are not checked. If a SignerInfo has authenticated attributes, its digestEncryptionAlgorithm is
  // read as the encryptedDigest, and the package is then refused. The refusal is intended: the
  // encryptedDigest of such a SignerInfo signs the attributes, not the signature file. `bound` is
  // the offset of the first of the two elements. Each of the two elements, header included, may
  // have at most `bound` bytes.
  const size_t bound = block.Skip(algorithm);
  asn1_hdr encryption, digest;
  if (!block.Read(bound, bound, &encryption) ||
      !block.Read(block.Skip(encryption), bound, &digest)) {
    return Fail(kUnreadable);
  }
  record->signed_digest = digest.payload;
  record->signed_digest_length = digest.length;
  return true;
}

// Reads the AlgorithmIdentifier at `offset`. Fails if it does not end at or before `end`. Accepts
// any algorithm, because the tool uses the digest algorithm that the signature's DigestInfo names.
bool ReadDigestAlgorithm(const Block& block, size_t offset, size_t end, asn1_hdr* algorithm) {
  asn1_oid oid;
  const uint8_t* next;
  return block.ReadInside(offset, end, algorithm) && algorithm->class_ == kAsn1Universal &&
         algorithm->tag == kAsn1Sequence &&
         asn1_get_oid(algorithm->payload, algorithm->length, &oid, &next) == 0;
}

// Deliberate: misspelled words such as "PARCER" must stay. Programs that read standard output match
// on these lines.
bool Fail(const char* format, ...) {
  printf("CERT_PARCER [ERROR]: ");
  va_list arguments;
  va_start(arguments, format);
  vprintf(format, arguments);
  va_end(arguments);
  printf("\n");
  return false;
}

}  // namespace
