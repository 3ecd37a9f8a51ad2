#include "support/certificate.h"

#include <openssl/digest.h>
#include <openssl/ec_key.h>
#include <openssl/ecdsa.h>
#include <openssl/evp.h>
#include <openssl/mem.h>
#include <openssl/nid.h>
#include <openssl/rsa.h>
#include <openssl/x509.h>

#include <cstdlib>

#include "support/keys.h"

namespace {

struct DigestFacts {
  const EVP_MD* (*function)();
  int nid;
  const char* oid;
  const char* rsa_oid;
  const char* info_prefix;  // the start of the DigestInfo, before the digest
};

constexpr DigestFacts kDigests[] = {
    {EVP_md5, NID_md5, "1.2.840.113549.2.5", "1.2.840.113549.1.1.4",
     "3020300c06082a864886f70d020505000410"},
    {EVP_sha1, NID_sha1, "1.3.14.3.2.26", "1.2.840.113549.1.1.5", "3021300906052b0e03021a05000414"},
    {EVP_sha256, NID_sha256, "2.16.840.1.101.3.4.2.1", "1.2.840.113549.1.1.11",
     "3031300d060960864801650304020105000420"},
};

const DigestFacts& Facts(Digest digest) { return kDigests[static_cast<int>(digest)]; }

}  // namespace

std::string DigestOid(Digest digest) { return Facts(digest).oid; }

std::string RsaSignatureOid(Digest digest) { return Facts(digest).rsa_oid; }

Bytes DigestOf(Digest digest, const Bytes& data) {
  Bytes result(EVP_MAX_MD_SIZE);
  unsigned length = 0;
  if (!EVP_Digest(data.data(), data.size(), result.data(), &length, Facts(digest).function(),
                  nullptr)) {
    abort();
  }
  result.resize(length);
  return result;
}

Bytes SignWith(const std::string& key, Digest digest, const Bytes& data) {
  const Bytes hash = DigestOf(digest, data);
  Bytes signature(static_cast<size_t>(EVP_PKEY_size(TestKey(key))));
  unsigned length = 0;
  const int done =
      EVP_PKEY_id(TestKey(key)) == EVP_PKEY_RSA
          ? RSA_sign(Facts(digest).nid, hash.data(), static_cast<unsigned>(hash.size()),
                     signature.data(), &length, TestRsaKey(key))
          : ECDSA_sign(0, hash.data(), hash.size(), signature.data(), &length,
                       EVP_PKEY_get0_EC_KEY(TestKey(key)));
  if (done != 1) abort();
  signature.resize(length);
  return signature;
}

Bytes EncodedMessage(Digest digest, const Bytes& data, size_t size) {
  const Bytes digest_info = Concat({FromHex(Facts(digest).info_prefix), DigestOf(digest, data)});
  if (digest_info.size() + 3 > size) return {};
  const Bytes padding(size - 3 - digest_info.size(), 0xff);
  return Concat({{0, 1}, padding, {0}, digest_info});
}

Bytes AlgorithmIdentifier(const std::string& oid, const Bytes& parameters) {
  return der::Sequence({der::Oid(oid), parameters});
}

Bytes PublicKeyInfo(const std::string& key) {
  uint8_t* encoded = nullptr;
  const int length = i2d_PUBKEY(TestKey(key), &encoded);
  if (length <= 0) abort();
  const Bytes info(encoded, encoded + length);
  OPENSSL_free(encoded);
  return info;
}

Bytes PublicKeyInfoAround(const Bytes& public_key) {
  return der::Sequence({AlgorithmIdentifier("1.2.840.113549.1.1.1"), der::BitString(public_key)});
}

Bytes Name(const std::vector<std::pair<std::string, std::string>>& attributes) {
  std::vector<Bytes> names;
  for (const auto& [oid, text] : attributes) {
    names.push_back(
        der::Set({der::Sequence({der::Oid(oid), der::Element(der::kUtf8String, text)})}));
  }
  return der::Sequence(names);
}

Bytes Extension(const std::string& oid, const Bytes& value, bool critical) {
  return der::Sequence(
      {der::Oid(oid), critical ? der::Boolean(0xff) : Bytes(), der::OctetString(value)});
}

Bytes Certificate::Tbs() const {
  if (tbs.has_value()) return *tbs;
  return der::Sequence({
      version,
      serial,
      tbs_algorithm.value_or(AlgorithmIdentifier(RsaSignatureOid(digest))),
      issuer,
      validity,
      subject,
      public_key_info.has_value() ? *public_key_info : PublicKeyInfo(key),
      issuer_unique_id,
      subject_unique_id,
      extensions.empty() ? Bytes() : der::Context(3, der::Sequence(extensions)),
      tbs_tail,
  });
}

Bytes Certificate::Build() const {
  const Bytes signed_part = Tbs();
  const std::string& signer = signing_key.empty() ? key : signing_key;
  return der::Sequence({
      signed_part,
      signature_algorithm.value_or(AlgorithmIdentifier(RsaSignatureOid(digest))),
      signature.has_value() ? *signature : der::BitString(SignWith(signer, digest, signed_part)),
  });
}
