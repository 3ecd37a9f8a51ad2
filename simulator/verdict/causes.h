// Why something was not signed, and what to do: the one table of it. Its rows stand in
// docs/messages.md as well, word for word, and their codes in docs/journal.schema.json; a test
// holds the three together. A code never changes its meaning: scripts go by it.
//
// A reason is the end of a sentence such as "not signed: …"; a cure is one or more sentences. "%s"
// in a reason stands for what a single run fills in.
#pragma once

namespace simulator {

struct Cause {
  const char* code;
  const char* reason;
  const char* cure;
};

namespace cause {

// ---- The tool did not look at the file.
inline constexpr Cause kFileMissing = {
    "file-missing", "there is no such file",
    "Check the name; a relative one counts from the folder in which the tool is run."};
inline constexpr Cause kFileNoPermission = {
    "file-no-permission", "it may not be read",
    "Give the user who runs the tool the right to read the file and to enter its folders."};
inline constexpr Cause kFileNotOpened = {"file-not-opened", "it cannot be opened (%s)",
                                         "Mend what the error names, and run again."};
inline constexpr Cause kReadOnlyFileSystem = {
    "read-only-file-system",
    "it lies on a read-only file system, where the tool leaves every file alone",
    "Nothing, for a file of the system image. Any other: copy it to where it can be written."};
inline constexpr Cause kStandardInputClosed = {
    "standard-input-closed",
    "standard input is closed, so the file got its place, descriptor 0, which the tool takes for a "
    "failure",
    "Start the tool with a standard input, be it /dev/null."};

// ---- The simulation could not tell.
inline constexpr Cause kToolNotStarted = {"tool-not-started", "%s", "Check --tool and --runner."};
inline constexpr Cause kToolTimedOut = {
    "tool-timed-out", "it was still busy after %s and was stopped",
    "The tool waits for ever while its integrity value reads ffffffff. A large file may need a "
    "larger --timeout."};
inline constexpr Cause kStandInsMissing = {
    "stand-ins-missing", "the stand-ins were not loaded into %s",
    "Check --tool: it has to be a dynamically linked program for this processor or for --runner."};
inline constexpr Cause kToolSilent = {
    "tool-silent", "the tool neither said nor did anything, though the file can be opened",
    "Check --tool: it has to be apktoolkit."};
inline constexpr Cause kStateNotKept = {"state-not-kept", "what was signed cannot be kept in %s",
                                        "Make the --state folder writable."};
inline constexpr Cause kNotInstalled = {"not-installed", "its libraries cannot be laid out: %s",
                                        "Make room in the folder for temporary files (TMPDIR)."};

// ---- What the file is.
inline constexpr Cause kFolder = {"folder", "it is a folder",
                                  "Name the package inside it, such as base.apk."};
inline constexpr Cause kSpecialFile = {"special-file", "it is a device, a pipe or a socket",
                                       "Name a file."};
inline constexpr Cause kEmptyFile = {"empty-file", "it is empty, a file of 0 bytes",
                                     "Build, copy or download it again."};
inline constexpr Cause kTextFile = {"text-file", "it is a text and not an archive",
                                    "Look into it: a failed download leaves its message so."};
inline constexpr Cause kCutArchive = {"cut-archive",
                                      "it begins like an archive and has no end: it was cut off",
                                      "Copy or download it again, and compare the sizes."};
inline constexpr Cause kNoArchive = {"no-archive", "it is not a zip archive",
                                     "Name a package or a JAR."};
inline constexpr Cause kEmptyArchive = {"empty-archive", "it is an archive without entries",
                                        "Build it again."};
inline constexpr Cause kDamagedArchive = {
    "damaged-archive", "it is a damaged archive, which the zip library does not open",
    "Copy or download it again. unzip -t, and the ziparchive lines of the log, name the fault."};
inline constexpr Cause kJarNotTrusted = {
    "jar-not-trusted",
    "it is a plain JAR, and those are signed only when the kernel trusts them already (%s)",
    "Nothing, unless the JAR should have come from a trusted image; --trust makes it so here."};
inline constexpr Cause kAndroidManifestDamaged = {
    "android-manifest-damaged",
    "its AndroidManifest.xml cannot be extracted, so it counts as a plain JAR, which the kernel "
    "does "
    "not trust",
    "Copy or build the package again; unzip -t names the damaged entry."};

// ---- A package's signature.
inline constexpr Cause kUnsigned = {"unsigned", "it is unsigned: META-INF/MANIFEST.MF is missing",
                                    "Sign it: apksigner sign --v1-signing-enabled true."};
inline constexpr Cause kNewerSchemeOnly = {
    "newer-scheme-only",
    "it is signed with %s alone, and this tool reads JAR signatures (v1): META-INF/MANIFEST.MF is "
    "missing",
    "Sign it with v1 as well: enableV1Signing true for the Gradle plugin, or apksigner sign "
    "--v1-signing-enabled true --min-sdk-version 23."};
inline constexpr Cause kManifestUnreadable = {
    "manifest-unreadable", "META-INF/MANIFEST.MF cannot be extracted",
    "Copy or build the package again; unzip -t names the damaged entry."};
inline constexpr Cause kSignatureFileMissing = {
    "signature-file-missing", "there is no signature file: no entry META-INF/*.SF, in capitals",
    "Sign the package again."};
inline constexpr Cause kSignatureFileUnreadable = {
    "signature-file-unreadable", "its signature file %s cannot be extracted",
    "Copy or build the package again; unzip -t names the damaged entry."};
inline constexpr Cause kSignatureFileMalformed = {
    "signature-file-malformed", "its signature file %s does not parse", "Sign the package again."};
inline constexpr Cause kSignatureBlockMissing = {
    "signature-block-missing", "the block %s, which belongs to its signature file, is missing",
    "Sign the package again."};
inline constexpr Cause kSignatureBlockUnreadable = {
    "signature-block-unreadable", "its signature block %s cannot be extracted",
    "Copy or build the package again; unzip -t names the damaged entry."};
inline constexpr Cause kSignatureBlockMalformed = {"signature-block-malformed",
                                                   "its signature block %s does not parse",
                                                   "Sign the package again with apksigner."};
inline constexpr Cause kEcKey = {"ec-key", "its key is an EC key, and this tool knows RSA alone",
                                 "Sign it with an RSA key of 2048 to 4096 bits."};
inline constexpr Cause kDsaKey = {"dsa-key", "its key is a DSA key, and this tool knows RSA alone",
                                  "Sign it with an RSA key of 2048 to 4096 bits."};
inline constexpr Cause kKeyTooLarge = {"key-too-large",
                                       "its RSA key has %s bits, and this tool takes at most 4096",
                                       "Sign it with an RSA key of 2048 to 4096 bits."};
inline constexpr Cause kKeyTooSmall = {
    "key-too-small", "its RSA key has %s bits, and this tool takes no fewer than 128",
    "Sign it with an RSA key of 2048 to 4096 bits."};
inline constexpr Cause kExponentRefused = {
    "exponent-refused",
    "its RSA key has the public exponent %s, with which anyone can make its signatures",
    "Do not trust this package. A key of one's own has the exponent 65537."};
inline constexpr Cause kCertificateIssued = {
    "certificate-issued",
    "its certificate was issued by another (%s), and this tool takes self-signed ones alone",
    "Sign it with a self-signed certificate: keytool -genkeypair -keyalg RSA -sigalg "
    "SHA256withRSA."};
inline constexpr Cause kCertificateDigest = {
    "certificate-digest",
    "its certificate is signed with %s, and this tool reads MD5, SHA-1 and SHA-256 with RSA",
    "Make a certificate for the same key with SHA-256: keytool -selfcert -sigalg SHA256withRSA. "
    "Without -sigalg keytool takes SHA-384: that of JDK 21 for every RSA key, that of JDK 17 for "
    "keys of more than 3072 bits."};
inline constexpr Cause kCertificateChanged = {
    "certificate-changed", "its certificate does not carry a signature by its own key",
    "Sign the package again; if it comes back, make a new certificate for the key."};
inline constexpr Cause kSignedAttributes = {
    "signed-attributes",
    "its signature covers signed attributes, as jarsigner writes them, and this tool does not read "
    "those",
    "Sign it with apksigner; no option of jarsigner helps."};
inline constexpr Cause kSignatureDigest = {
    "signature-digest", "it is signed over %s, and this tool reads MD5, SHA-1 and SHA-256",
    "Sign it with SHA-256 and RSA PKCS#1 v1.5, as apksigner does."};
inline constexpr Cause kSignatureFileChanged = {
    "signature-file-changed", "its signature file %s was changed after it was signed",
    "Sign the package again, as the last step that changes it."};
inline constexpr Cause kSignatureWrong = {
    "signature-wrong", "the signature in %s was not made by the key of its certificate",
    "Sign the package again."};
inline constexpr Cause kManifestChanged = {
    "manifest-changed", "META-INF/MANIFEST.MF was changed after it was signed",
    "Sign the package again, as the last step that changes it."};
inline constexpr Cause kManifestDigest = {
    "manifest-digest",
    "its signature file has no digest of the manifest that this tool reads: SHA-1 or SHA-256",
    "Sign it with SHA-256 digests, as apksigner does."};
inline constexpr Cause kManifestMalformed = {
    "manifest-malformed", "META-INF/MANIFEST.MF does not parse", "Sign the package again."};
inline constexpr Cause kAndroidManifestText = {
    "android-manifest-text", "its AndroidManifest.xml is not in the compiled form",
    "Build the package with aapt or aapt2, which compile it."};
inline constexpr Cause kDexChanged = {
    "dex-changed", "classes.dex is not the one that was signed",
    "Sign the package again, as the last step that changes it. If nobody changed it: do not trust "
    "it."};
inline constexpr Cause kDexNotListed = {
    "dex-not-listed", "classes.dex is not in the manifest: it was added after signing",
    "Sign the package again, as the last step that changes it. If nobody changed it: do not trust "
    "it."};
inline constexpr Cause kDexDigest = {
    "dex-digest",
    "the manifest has no digest of classes.dex that this tool reads: SHA-1 or SHA-256",
    "Sign it with SHA-256 digests, as apksigner does."};
inline constexpr Cause kNoMemory = {"no-memory", "the tool had no memory left",
                                    "Run it again where there is more."};

// ---- The kernel.
inline constexpr Cause kKernelRefused = {
    "kernel-refused", "the kernel refused (%s)",
    "The file was good. docs/guide.md, \"When the kernel refuses\", says where to look."};
inline constexpr Cause kIntegrityZero = {
    "integrity-zero", "the tool's own integrity value settled at 0, so that it may not sign",
    "The file was good. Look at the domain that the tool is started from: its value is to be "
    "neither 0 nor ffffffff."};
inline constexpr Cause kIntegrityMissing = {
    "integrity-missing", "the tool has no integrity value: /proc/self/integrity/value is not there",
    "The file was good. The kernel lacks the feature, or /proc is not mounted."};
inline constexpr Cause kIntegrityUnreadable = {
    "integrity-unreadable", "the tool's own integrity value reads \"%s\", which is no number",
    "The file was good. Look at what /proc/self/integrity/value holds on that kernel."};

// ---- A library.
inline constexpr Cause kLibraryChanged = {
    "library-changed", "its bytes are not those that the manifest lists",
    "The file beside the package was changed after it was installed. Install the package again."};
inline constexpr Cause kLibraryNotListed = {
    "library-not-listed", "the manifest does not list it: it was added after signing",
    "Sign the package again, as the last step that changes it."};
inline constexpr Cause kLibraryDigest = {
    "library-digest", "the manifest has no digest of it that this tool reads: SHA-1 or SHA-256",
    "Sign the package with SHA-256 digests, as apksigner does."};
inline constexpr Cause kLibraryNoPermission = {
    "library-no-permission", "it may not be read",
    "Give the user who runs the tool the right to read it and to enter its folders."};
inline constexpr Cause kLibraryNotOpened = {"library-not-opened", "it cannot be opened (%s)",
                                            "Mend what the error names, and run again."};
inline constexpr Cause kLibraryNoFile = {
    "library-no-file", "what lies there is not a file, or too large to read",
    "Find out who put it there, and install the package again."};
inline constexpr Cause kLibraryInPackage = {
    "library-in-package", "it stays inside the package (extractNativeLibs=\"false\")",
    "Nothing: it is loaded from the package."};
inline constexpr Cause kLibraryNotInstalled = {
    "library-not-installed", "no libraries for its processor lie beside the package",
    "Nothing, where the phone is of another kind. For a package that lies alone: --install; for "
    "all "
    "processors: --install=all."};
inline constexpr Cause kLibraryMissing = {
    "library-missing", "it does not lie beside the package, where others are",
    "Install the package again, unless the installer leaves it out on purpose."};
inline constexpr Cause kLibraryOtherAbi = {
    "library-other-abi", "no phone of this kind installs it",
    "Nothing: this tool knows arm64-v8a, armeabi-v7a and armeabi."};
inline constexpr Cause kPackageRefused = {"package-refused", "the package is refused",
                                          "Mend the package; this follows."};
inline constexpr Cause kNotReached = {"not-reached", "the tool did not come to it",
                                      "See why the tool ended early."};

// ---- The key.
inline constexpr Cause kRegistrationRefused = {
    "registration-refused", "libzu answered %s",
    "The code is the library's own. What was signed stays signed."};
inline constexpr Cause kRegistrationNoPath = {"registration-no-path",
                                              "its path cannot be found out",
                                              "Check that /proc is mounted and can be read."};

// ---- The tool itself.
inline constexpr Cause kToolKilled = {"tool-killed", "it was killed by signal %s",
                                      "Report it, with the file."};
inline constexpr Cause kToolFailed = {"tool-failed", "it ended with status %s",
                                      "Check --tool: apktoolkit ends with 0 for every file."};
inline constexpr Cause kToolError = {"tool-error", "it logged an error: %s",
                                     "docs/messages.md has every message."};

// ---- Warnings: all may be signed, and yet.
inline constexpr Cause kOtherKey = {
    "other-key",
    "%s is of another key than the JAR signature: phones install the package for that key, and the "
    "kernel gets this one",
    "Sign it with one key for all schemes; a rotated key reaches the newer ones alone. If it is "
    "not "
    "of your making: do not trust it."};
inline constexpr Cause kSchemesStripped = {
    "schemes-stripped",
    "the signature file says that the package is signed with %s as well, and it is not: phones do "
    "not install it",
    "Sign the package again, as the last step that changes it."};
inline constexpr Cause kSigningBlockDamaged = {"signing-block-damaged",
                                               "the block of the schemes after v1 does not read",
                                               "Sign the package again."};
inline constexpr Cause kSeveralSigners = {
    "several-signers", "it has more than one signer; the kernel gets the key of %s alone",
    "Sign it with one key."};
inline constexpr Cause kForgeableKey = {
    "forgeable-key", "the key has the public exponent %s: anyone can make its signatures",
    "Do not trust this package. A key of one's own has the exponent 65537."};
inline constexpr Cause kUnlistedEntries = {
    "unlisted-entries", "the signature does not protect %s: no digest in the manifest",
    "Sign the package again, as the last step that changes it; --verbose lists them."};
inline constexpr Cause kNotLaidOut = {
    "not-laid-out", "--install leaves out %s",
    "An installer takes files of the form lib/ABI/NAME that can be extracted."};

}  // namespace cause

}  // namespace simulator
