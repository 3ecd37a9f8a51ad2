# shellcheck shell=bash
#
# Functions that make packages and signers with the tools that developers use. scripts/demo,
# tests/journeys/make_golden_packages and tests/threats/make_threat_packages source this file.

recipes_dir=$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)

# make_unsigned_package APK: compiles and packs the example package of vault/: its Android manifest,
# one class, and one native library for 64-bit Arm and for 32-bit Arm.
make_unsigned_package() {
  local apk=$1 sources=$recipes_dir/vault work
  work=$(mktemp -d)
  mkdir -p "$work/lib/arm64-v8a" "$work/lib/armeabi-v7a"
  compile_library aarch64-linux-android27 "$work/lib/arm64-v8a/libvault.so"
  compile_library armv7a-linux-androideabi27 "$work/lib/armeabi-v7a/libvault.so"
  smali assemble --api 27 -o "$work/classes.dex" "$sources/Vault.smali"
  put_android_manifest "$apk" "$sources/AndroidManifest.xml"
  put_entries "$apk" "$work" classes.dex lib/{arm64-v8a,armeabi-v7a}/libvault.so
  rm -r "$work"
}

# put_android_manifest APK MANIFEST: compiles the Android manifest MANIFEST, and makes a new package
# APK that contains only the compiled manifest.
put_android_manifest() {
  aapt package -f -M "$2" -F "$1" -I /usr/share/android-framework-res/framework-res.apk
}

compile_library() {  # TARGET LIBRARY
  clang -target "$1" -shared -fPIC -O2 -nostdlib -fuse-ld=lld -o "$2" \
    "$recipes_dir/vault/vault.c"
}

# put_entries APK DIRECTORY ENTRY...: adds the files DIRECTORY/ENTRY to the package. Replaces
# existing entries of these names.
put_entries() {
  local apk directory=$2
  apk=$(realpath "$1")
  shift 2
  aapt remove "$apk" "$@" >/dev/null 2>&1 || true
  (cd "$directory" && aapt add "$apk" "$@" >/dev/null)
}

# test_key NAME: prints the path of the fixed test key NAME.
test_key() {
  echo "$recipes_dir/keys/$1.pem"
}

# make_signer KEY DIRECTORY: writes a self-signed certificate of the fixed test key KEY to
# DIRECTORY/KEY.pem. Also writes the test key to DIRECTORY, in the forms for apksigner (KEY.pk8) and
# jarsigner (KEY.p12, alias cert, password android).
make_signer() {
  local key out=$2/$1
  key=$(test_key "$1")
  openssl req -x509 -new -key "$key" -sha256 -subj "/O=Example/CN=$1" -days 10000 -out "$out.pem"
  openssl pkcs8 -topk8 -nocrypt -in "$key" -outform DER -out "$out.pk8"
  openssl pkcs12 -export -inkey "$key" -in "$out.pem" -name cert -passout pass:android \
    -out "$out.p12"
}

# install_libraries APK: extracts the package's native libraries to lib/ beside the package, as the
# installer does. First deletes an existing lib/.
install_libraries() {
  local directory work
  directory=$(dirname "$1") work=$(mktemp -d)
  unzip -q "$1" 'lib/*' -d "$work"
  rm -rf "${directory:?}/lib"
  mkdir "$directory/lib"
  mv "$work/lib/arm64-v8a" "$directory/lib/arm64"
  mv "$work/lib/armeabi-v7a" "$directory/lib/arm"
  rm -r "$work"
}

# signer_modulus CERTIFICATE: prints the modulus of the certificate's key, as hexadecimal digits.
signer_modulus() {
  openssl x509 -in "$1" -noout -modulus | sed 's/^Modulus=//'
}

# modulus_digest CERTIFICATE: prints the SHA-256 digest of the modulus of the certificate's key.
modulus_digest() {
  signer_modulus "$1" | basenc --base16 -d | openssl dgst -sha256 -r | cut -d' ' -f1
}
