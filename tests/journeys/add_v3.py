#!/usr/bin/env python3
"""add_v3.py APK CERTIFICATE KEY FIRST LAST [ID]: adds a signature to the signing block of the package
APK, and keeps the block's other signatures. Makes the block if APK has none. The signature is a v3
signature for phones of the API levels FIRST to LAST. With ID (hexadecimal), the signature gets this
ID in the block, but keeps the form of a v3 signature. openssl makes the signature."""

import hashlib
import struct
import subprocess
import sys

V3 = "f05368c0"
RSA_SHA256 = 0x0103
MAGIC = b"APK Sig Block 42"


def with_length(*parts):
    return b"".join(struct.pack("<I", len(part)) + part for part in parts)


def openssl(*words, data=None):
    return subprocess.run(["openssl", *words], input=data, stdout=subprocess.PIPE, check=True).stdout


def content_digest(sections):
    """Cuts the sections into pieces of at most 1 MiB. Returns the digest of the digests of all pieces."""
    pieces = [section[at:at + (1 << 20)] for section in sections for at in range(0, len(section), 1 << 20)]
    digests = [hashlib.sha256(b"\xa5" + struct.pack("<I", len(piece)) + piece).digest() for piece in pieces]
    return hashlib.sha256(b"\x5a" + struct.pack("<I", len(pieces)) + b"".join(digests)).digest()


def main(path, certificate, key, first, last, scheme=V3):
    data = open(path, "rb").read()
    end = data.rindex(b"PK\5\6")
    directory = struct.unpack_from("<I", data, end + 16)[0]
    has_block = data[directory - 16:directory] == MAGIC
    start = directory - struct.unpack_from("<Q", data, directory - 24)[0] - 8 if has_block else directory
    # The digest covers the end-of-central-directory record, but with the offset of the signing
    # block in place of the central directory's offset.
    signed_end = data[end:end + 16] + struct.pack("<I", start) + data[end + 20:]
    digest = content_digest([data[:start], data[directory:end], signed_end])

    levels = struct.pack("<II", int(first), int(last))
    signed = (with_length(with_length(struct.pack("<I", RSA_SHA256) + with_length(digest)),
                          with_length(openssl("x509", "-in", certificate, "-outform", "DER"))) +
              levels + with_length(b""))
    signature = openssl("dgst", "-sha256", "-sign", key, data=signed)
    public_key = openssl("pkey", "-in", key, "-pubout", "-outform", "DER")
    signer = (with_length(signed) + levels +
              with_length(with_length(struct.pack("<I", RSA_SHA256) + with_length(signature)), public_key))
    value = with_length(with_length(signer))

    pairs = data[start + 8:directory - 24] if has_block else b""
    pairs += struct.pack("<QI", len(value) + 4, int(scheme, 16)) + value
    size = struct.pack("<Q", len(pairs) + 24)
    block = size + pairs + size + MAGIC
    moved_end = data[end:end + 16] + struct.pack("<I", start + len(block)) + data[end + 20:]
    open(path, "wb").write(data[:start] + block + data[directory:end] + moved_end)


main(*sys.argv[1:])
