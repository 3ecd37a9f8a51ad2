// Builds X.509 certificates (RFC 5280 §4.1), good and malformed.
//
// Build writes the Bytes of each field unchanged, so a field holds the complete encoding of its
// value: identifier, length and contents octets. A test changes a certificate by assigning to a
// field. If a std::optional field has no value, Build computes that field from the other members.
#pragma once

#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "support/der.h"

// The digest algorithms that a signature can use.
enum class Digest { kMd5, kSha1, kSha256 };

std::string DigestOid(Digest digest);        // of the digest itself
std::string RsaSignatureOid(Digest digest);  // of RSA PKCS#1 v1.5 with this digest
Bytes DigestOf(Digest digest, const Bytes& data);
// The signature over `data` by the test key `key` (support/keys.h): PKCS#1 v1.5 with an RSA key,
// ECDSA with an EC key.
Bytes SignWith(const std::string& key, Digest digest, const Bytes& data);
// The encoded message of the data (RFC 8017 §9.2) in `size` bytes. The padding fills the remaining
// bytes and can be empty. Returns no bytes if the DigestInfo does not fit.
Bytes EncodedMessage(Digest digest, const Bytes& data, size_t size);
// An AlgorithmIdentifier with NULL or the given parameters.
Bytes AlgorithmIdentifier(const std::string& oid, const Bytes& parameters = der::Null());
// The SubjectPublicKeyInfo of the test key.
Bytes PublicKeyInfo(const std::string& key);
// A SubjectPublicKeyInfo for RSA around any contents, such as an RSAPublicKey.
Bytes PublicKeyInfoAround(const Bytes& public_key);

// A Name. Each pair is an attribute: its object identifier, and its text as a UTF8String.
Bytes Name(const std::vector<std::pair<std::string, std::string>>& attributes);
// An Extension. The critical flag is written only if it is TRUE.
Bytes Extension(const std::string& oid, const Bytes& value, bool critical = false);

struct Certificate {
  // The subject's key. It also signs the certificate, unless `signing_key` names another key.
  std::string key = "rsa-2048";
  std::string signing_key;
  Digest digest = Digest::kSha256;

  // The fields of the tbsCertificate, in order.
  Bytes version = der::Context(0, der::Integer(2));  // empty: v1
  Bytes serial = der::Integer(0x1234);
  std::optional<Bytes> tbs_algorithm;
  Bytes issuer = Name({{"2.5.4.3", "Test"}});
  Bytes validity = der::Sequence(
      {der::Element(der::kUtcTime, "200102030405Z"), der::Element(der::kUtcTime, "490102030405Z")});
  Bytes subject = Name({{"2.5.4.3", "Test"}});
  std::optional<Bytes> public_key_info;
  Bytes issuer_unique_id;         // [1], or empty
  Bytes subject_unique_id;        // [2], or empty
  std::vector<Bytes> extensions;  // each an Extension; empty: no [3]
  Bytes tbs_tail;                 // anything after the extensions

  std::optional<Bytes> tbs;  // in place of all fields of the tbsCertificate
  std::optional<Bytes> signature_algorithm;
  std::optional<Bytes> signature;  // the BIT STRING

  Bytes Tbs() const;
  Bytes Build() const;
};
