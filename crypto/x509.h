// One X.509 certificate (RFC 5280), read into a record that points into the caller's bytes.
#pragma once

#include <cstddef>
#include <cstdint>

#include "crypto/asn1.h"

struct x509_parser_time {
  uint16_t year;
  uint8_t month, day, hour, minute, second;
};

struct x509_name_attribute {
  uint32_t type;
  const uint8_t* value;
  uint64_t value_length;
};

struct x509_name {
  x509_name_attribute attributes[20];
  uint64_t attribute_count;
  const uint8_t* email;
  uint64_t email_length;
  const uint8_t* alt_email;
  uint64_t alt_email_length;
  const uint8_t* dns;
  uint64_t dns_length;
  const uint8_t* uri;
  uint64_t uri_length;
  const uint8_t* ip;
  uint64_t ip_length;
  asn1_oid rid;
};

struct x509_certificate {
  x509_certificate* next;
  uint32_t version;
  uint32_t serial_number;
  asn1_oid signature_oid, signature_params_oid;
  x509_name issuer;
  x509_name subject;
  x509_parser_time not_before, not_after;
  asn1_oid public_key_oid, public_key_params_oid;
  const uint8_t* public_key;
  uint64_t public_key_length;
  asn1_oid signature_algorithm_oid, signature_algorithm_params_oid;
  const uint8_t* signature_value;
  uint64_t signature_value_length;
  uint32_t extensions_present;
  uint32_t ca;
  uint32_t path_len_constraint;
  uint32_t key_usage;
  const uint8_t* cert_start;
  uint64_t cert_length;
  const uint8_t* tbs_start;
  uint64_t tbs_length;
};

int x509_certificate_parse(const uint8_t* buf, size_t len, x509_certificate* cert);
