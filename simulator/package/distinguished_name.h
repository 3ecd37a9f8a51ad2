// X.509 names as text, in the way in which the JDK writes them, and with it keytool, jarsigner and
// apksigner: the last attribute first, "CN=Vault, O=Example".
#pragma once

#include <string>
#include <string_view>

namespace simulator {

// `der` is a Name (RFC 5280 §4.1.2.4). UTF-8; empty where it does not read.
std::string NameText(std::string_view der);

}  // namespace simulator
