// The table of causes: the reason for each failure, refusal and warning, and what to do about it. A
// row has all facts about a cause. The tables in docs/messages.md and the codes in
// docs/journal.schema.json are written from the rows (tests/project/messages_test.py --write). A
// code never changes its meaning, because scripts match on it.
#pragma once

namespace simulator {

// The subject of a cause.
enum class Group {
  kNotLookedAt,  // the tool did not look at the file
  kSimulation,   // the simulation has no result
  kFile,         // the kind of the file
  kSignature,    // a package's signature
  kKernel,
  kLibrary,
  kKey,
  kTool,
  kInstaller,  // a phone's installer does not install the package, or its verifier gave up
  kGate,       // the file does not meet a demand of the gate (gate.h), such as --signer
  kWarning,    // a fact that the user should check, even if everything was signed
};

// The effect of a cause on the file or on one of its items (Item in report.h).
enum class Severity {
  kFailed,   // there is no result for the file
  kUnseen,   // the tool left the file alone
  kRefused,  // should be signed, registered, installed or accepted, but is not
  kFollows,  // like kRefused, but only because of another cause, which must be fixed first
  kAbsent,   // there is nothing to sign; a refusal under --strict
  kNothing,  // there is nothing to sign
  kDoubt,    // a warning; a refusal under --strict
  kWarning,
  kAlarm,  // a warning that the verdict's line also shows
};

// The links of the chain from the key to the entries. Each link vouches for the next one.
enum class ChainLink { kKey, kCertificate, kSignatureFile, kManifest, kEntries, kNone };

struct Cause {
  const char* code;
  Group group;
  Severity severity;
  ChainLink link;      // the link that the cause breaks; kNone: it breaks none
  const char* log;     // the messages that show the cause in the log, for docs/messages.md
  const char* reason;  // the end of a sentence such as "not signed: …"; "%s" becomes Reason::detail
  const char* cure;    // one or more sentences
};

namespace cause {

// The rows are wrapped by hand. clang-format would make this table twice as long.
// clang-format off

// ---- The tool did not look at the file.
inline constexpr Cause kFileMissing = {"file-missing", Group::kNotLookedAt, Severity::kUnseen,
    ChainLink::kKey, "", "there is no such file",
    "Check the name. A relative name starts at the directory in which the tool is run."};
inline constexpr Cause kFileNoPermission = {"file-no-permission", Group::kNotLookedAt,
    Severity::kUnseen, ChainLink::kKey, "", "there is no permission to read it",
    "Give the user who runs the tool the right to read the file and to enter its directories."};
inline constexpr Cause kFileNotOpened = {"file-not-opened", Group::kNotLookedAt, Severity::kUnseen,
    ChainLink::kKey, "", "it cannot be opened (%s)", "Fix the reported error, and run again."};
inline constexpr Cause kReadOnlyFileSystem = {"read-only-file-system", Group::kNotLookedAt,
    Severity::kUnseen, ChainLink::kKey, "",
    "it is on a read-only file system, where the tool signs nothing",
    "Nothing to do for a file of the system image. Copy any other file to a file system that can "
    "be written."};
inline constexpr Cause kStandardInputClosed = {"standard-input-closed", Group::kNotLookedAt,
    Severity::kUnseen, ChainLink::kKey, "", "standard input is closed, so the file got "
    "descriptor 0, which the tool treats as a failure",
    "Start the tool with a standard input, for example /dev/null."};
inline constexpr Cause kFileLeased = {"file-leased", Group::kNotLookedAt, Severity::kUnseen,
    ChainLink::kKey, "", "another process holds a lease on it",
    "Have that process close the file, and run again; /proc/locks shows its process ID."};
inline constexpr Cause kNoPackages = {"no-packages", Group::kNotLookedAt, Severity::kUnseen,
    ChainLink::kKey, "", "it is a directory, and no file in it or below it has a package's name",
    "--recursive looks at .apk, .jar, .apks, .xapk, .apkm and .aab. Name other files one by one, "
    "or with --files-from."};

// ---- The simulation has no result.
inline constexpr Cause kToolNotStarted = {"tool-not-started", Group::kSimulation, Severity::kFailed,
    ChainLink::kKey, "", "%s", "Check --tool and --runner."};
inline constexpr Cause kToolTimedOut = {"tool-timed-out", Group::kSimulation, Severity::kFailed,
    ChainLink::kKey, "", "it was still busy after %s and was stopped", "The tool waits as long "
    "as its integrity value is ffffffff, and for a while if another process holds a lease on the "
    "file. A large file may need a larger --timeout."};
inline constexpr Cause kStandInsMissing = {"stand-ins-missing", Group::kSimulation,
    Severity::kFailed, ChainLink::kKey, "", "the simulator's libraries were not loaded into %s",
    "Check --tool: it has to be a dynamically linked program for this processor or for --runner."};
inline constexpr Cause kToolSilent = {"tool-silent", Group::kSimulation, Severity::kFailed,
    ChainLink::kKey, "", "the tool logged nothing and did nothing, though the file can be opened",
    "Check --tool: it has to be apktoolkit."};
inline constexpr Cause kStateNotKept = {"state-not-kept", Group::kSimulation, Severity::kFailed,
    ChainLink::kKey, "", "the signed files cannot be remembered in %s",
    "Make the --state directory writable."};
inline constexpr Cause kNotInstalled = {"not-installed", Group::kSimulation, Severity::kFailed,
    ChainLink::kKey, "", "its libraries cannot be extracted beside it: %s",
    "Free space in the directory for temporary files (TMPDIR), or give --install=no."};
inline constexpr Cause kNotBegun = {"not-begun", Group::kSimulation, Severity::kFailed,
    ChainLink::kKey, "", "no file could be simulated: %s",
    "Fix the reported error, and run again."};
inline constexpr Cause kFileChanged = {"file-changed", Group::kSimulation, Severity::kFailed,
    ChainLink::kKey, "", "it was changed during the run", "Run again when nobody writes to the "
    "file."};
inline constexpr Cause kInterrupted = {"interrupted", Group::kSimulation, Severity::kFailed,
    ChainLink::kKey, "", "it was interrupted", "Run again."};

// ---- The kind of the file.
inline constexpr Cause kFolder = {"folder", Group::kFile, Severity::kRefused, ChainLink::kKey,
    "`OpenArchiveFd(`", "it is a directory", "Name the package inside it, or give --recursive."};
inline constexpr Cause kPackageDirectory = {"package-directory", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`OpenArchiveFd(`", "it is a directory with %s in it",
    "Name every package in it, the base and its splits: DIRECTORY/*.apk. Or give --recursive."};
inline constexpr Cause kSpecialFile = {"special-file", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`OpenArchiveFd(`", "it is a device, a pipe or a socket",
    "Name a regular file."};
inline constexpr Cause kEmptyFile = {"empty-file", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`OpenArchiveFd(`", "it is empty, a file of 0 bytes",
    "Build, copy or download it again."};
inline constexpr Cause kTextFile = {"text-file", Group::kFile, Severity::kRefused, ChainLink::kKey,
    "`OpenArchiveFd(`", "it is a text and not an archive",
    "It may be the error message of a failed download: read it."};
inline constexpr Cause kCutArchive = {"cut-archive", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`OpenArchiveFd(`", "it begins like an archive, but its end is missing: it "
    "was cut off",
    "Copy or download it again, and compare the sizes."};
inline constexpr Cause kNoArchive = {"no-archive", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`OpenArchiveFd(`", "it is not a zip archive", "Name a package or a JAR."};
inline constexpr Cause kEmptyArchive = {"empty-archive", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`OpenArchiveFd(`", "it is an archive without entries", "Build it again."};
inline constexpr Cause kDamagedArchive = {"damaged-archive", Group::kFile, Severity::kRefused,
    ChainLink::kEntries, "`OpenArchiveFd(`",
    "it is a damaged archive, which the zip library does not open",
    "Copy or download it again. unzip -t, and the ziparchive lines of the log, name the fault."};
inline constexpr Cause kEntryTwice = {"entry-twice", Group::kFile, Severity::kRefused,
    ChainLink::kEntries, "`OpenArchiveFd(`",
    "%s is in it more than once, and the zip library does not open such an archive",
    "Build the package again, with one entry of each name. If you did not build it, do not trust "
    "it."};
inline constexpr Cause kAppBundle = {"app-bundle", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`VELT can't verify a file`",
    "it is an app bundle (.aab), which no phone installs",
    "Make packages of it with bundletool build-apks, and name those."};
inline constexpr Cause kPackageSet = {"package-set", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`VELT can't verify a file`",
    "it is an archive of packages (.apks, .xapk), and not a package",
    "Unpack it, and name the packages in it, the base and its splits."};
inline constexpr Cause kPackageWithoutManifest = {"package-without-manifest", Group::kFile,
    Severity::kRefused, ChainLink::kKey, "`VELT can't verify a file`", "it has parts of a package "
    "(%s) and no AndroidManifest.xml, so it counts as a plain JAR, which the kernel does not trust",
    "Build the package again with aapt or aapt2, which put AndroidManifest.xml in it."};
inline constexpr Cause kJarNotTrusted = {"jar-not-trusted", Group::kFile, Severity::kRefused,
    ChainLink::kKey, "`VELT can't verify a file`",
    "it is a plain JAR, which is signed only if the kernel already trusts it; the kernel answered "
    "%s", "Nothing to do, unless the JAR should have come from a trusted image. In the simulator, "
    "--trust makes the kernel trust it."};
inline constexpr Cause kAndroidManifestDamaged = {"android-manifest-damaged", Group::kFile,
    Severity::kRefused, ChainLink::kKey, "`Can't extract Android Manifest`", "its "
    "AndroidManifest.xml cannot be extracted, so it counts as a plain JAR, which the kernel does "
    "not trust", "Copy or build the package again; unzip -t names the damaged entry."};

// ---- A package's signature.
inline constexpr Cause kUnsigned = {"unsigned", Group::kSignature, Severity::kRefused,
    ChainLink::kKey, "", "it is unsigned: META-INF/MANIFEST.MF is missing",
    "Sign it: apksigner sign --v1-signing-enabled true."};
inline constexpr Cause kNewerSchemeOnly = {"newer-scheme-only", Group::kSignature,
    Severity::kRefused, ChainLink::kKey, "", "it is signed only with %s, but this tool reads only "
    "JAR signatures (v1): META-INF/MANIFEST.MF is missing", "Sign it with v1 as well: "
    "enableV1Signing true for the Gradle plugin, or apksigner sign --v1-signing-enabled true "
    "--min-sdk-version 23."};
inline constexpr Cause kManifestUnreadable = {"manifest-unreadable", Group::kSignature,
    Severity::kRefused, ChainLink::kManifest, "", "META-INF/MANIFEST.MF cannot be extracted",
    "Copy or build the package again; unzip -t names the damaged entry."};
inline constexpr Cause kSignatureFileMissing = {"signature-file-missing", Group::kSignature,
    Severity::kRefused, ChainLink::kSignatureFile, "",
    "there is no signature file META-INF/*.SF (in capital letters)", "Sign the package again."};
inline constexpr Cause kSignatureFileUnreadable = {"signature-file-unreadable", Group::kSignature,
    Severity::kRefused, ChainLink::kSignatureFile, "", "its signature file %s cannot be extracted",
    "Copy or build the package again; unzip -t names the damaged entry."};
inline constexpr Cause kSignatureFileMalformed = {"signature-file-malformed", Group::kSignature,
    Severity::kRefused, ChainLink::kSignatureFile, "`Parse manifest:`",
    "its signature file %s does not parse", "Sign the package again."};
inline constexpr Cause kSignatureBlockMissing = {"signature-block-missing", Group::kSignature,
    Severity::kRefused, ChainLink::kCertificate, "`Can't extract RSA certificate`",
    "the block %s, which belongs to its signature file, is missing", "Sign the package again."};
inline constexpr Cause kSignatureBlockUnreadable = {"signature-block-unreadable", Group::kSignature,
    Severity::kRefused, ChainLink::kCertificate, "`Can't extract RSA certificate`",
    "its signature block %s cannot be extracted",
    "Copy or build the package again; unzip -t names the damaged entry."};
inline constexpr Cause kSignatureBlockMalformed = {"signature-block-malformed", Group::kSignature,
    Severity::kRefused, ChainLink::kCertificate,
    "`Unknown certificate type`, `RSA could not set key`", "its signature block %s does not parse",
    "Sign the package again with apksigner."};
inline constexpr Cause kEcKey = {"ec-key", Group::kSignature, Severity::kRefused, ChainLink::kKey,
    "`Can't extract RSA certificate`, `Unknown certificate type`",
    "its key is an EC key, and this tool supports only RSA",
    "Sign it with an RSA key of 2048 to 4096 bits. This changes the signer, so phones cannot "
    "update a published app with this package. Key rotation does not help: the JAR signature is "
    "still made with the first key."};
inline constexpr Cause kDsaKey = {"dsa-key", Group::kSignature, Severity::kRefused, ChainLink::kKey,
    "`Can't extract RSA certificate`, `Unknown certificate type`",
    "its key is a DSA key, and this tool supports only RSA",
    "Sign it with an RSA key of 2048 to 4096 bits. This changes the signer, so phones cannot "
    "update a published app with this package. Key rotation does not help: the JAR signature is "
    "still made with the first key."};
inline constexpr Cause kKeyTooLarge = {"key-too-large", Group::kSignature, Severity::kRefused,
    ChainLink::kKey, "`RSA could not verify certificate`",
    "its RSA key has %s bits, and this tool accepts at most 4096",
    "Sign it with an RSA key of 2048 to 4096 bits. This changes the signer, so phones cannot "
    "update a published app with this package. Key rotation does not help: the JAR signature is "
    "still made with the first key."};
inline constexpr Cause kKeyTooSmall = {"key-too-small", Group::kSignature, Severity::kRefused,
    ChainLink::kKey, "`RSA could not verify certificate`",
    "its RSA key has %s bits, and this tool accepts at least 128",
    "Sign it with an RSA key of 2048 to 4096 bits. This changes the signer, so phones cannot "
    "update a published app with this package. Key rotation does not help: the JAR signature is "
    "still made with the first key."};
inline constexpr Cause kExponentRefused = {"exponent-refused", Group::kSignature,
    Severity::kRefused, ChainLink::kKey, "`RSA could not set key`",
    "its RSA key has the public exponent %s, with which anyone can make its signatures",
    "Do not trust this package. Normal keys have the exponent 65537."};
inline constexpr Cause kCertificateIssued = {"certificate-issued", Group::kSignature,
    Severity::kRefused, ChainLink::kCertificate, "`RSA could not verify certificate`",
    "its certificate was issued by another subject (%s), and this tool accepts only self-signed "
    "certificates",
    "Sign it with a self-signed certificate: keytool -genkeypair -keyalg RSA -sigalg "
    "SHA256withRSA. This changes the signer, so phones cannot update a published app with this "
    "package."};
inline constexpr Cause kCertificateDigest = {"certificate-digest", Group::kSignature,
    Severity::kRefused, ChainLink::kCertificate, "`RSA could not verify certificate`",
    "its certificate is signed with %s, not RSA PKCS#1 v1.5 with MD5, SHA-1 or SHA-256",
    "Certify the same key with SHA-256, and sign again: keytool -selfcert -alias ALIAS -sigalg "
    "SHA256withRSA -validity 10000 -keystore KEYSTORE. This changes the signer, so phones cannot "
    "update a published app with this package. Without -sigalg, keytool uses SHA-384: in JDK 21 "
    "for every RSA key, in JDK 17 for keys of more than 3072 bits."};
inline constexpr Cause kCertificateChanged = {"certificate-changed", Group::kSignature,
    Severity::kRefused, ChainLink::kCertificate, "`RSA could not verify certificate`",
    "its certificate is not signed by its own key",
    "Sign the package again; if the error appears again, make a new certificate for the key."};
inline constexpr Cause kSignedAttributes = {"signed-attributes", Group::kSignature,
    Severity::kRefused, ChainLink::kSignatureFile, "`RSA could not verify data`", "its signature "
    "covers signed attributes, which new jarsigner versions write and this tool refuses",
    "Sign it with apksigner; no option of jarsigner helps."};
inline constexpr Cause kSignatureDigest = {"signature-digest", Group::kSignature,
    Severity::kRefused, ChainLink::kSignatureFile, "`RSA could not verify data`",
    "its signature uses %s, not RSA PKCS#1 v1.5 with MD5, SHA-1 or SHA-256",
    "Sign it with SHA-256 and RSA PKCS#1 v1.5, as apksigner does."};
inline constexpr Cause kSignatureFileChanged = {"signature-file-changed", Group::kSignature,
    Severity::kRefused, ChainLink::kSignatureFile, "`RSA could not verify data`",
    "its signature file %s was changed after it was signed",
    "Sign the package again, as the last step that changes it."};
inline constexpr Cause kSignatureWrong = {"signature-wrong", Group::kSignature, Severity::kRefused,
    ChainLink::kSignatureFile, "`RSA could not verify data`",
    "the signature in %s was not made by the key of its certificate", "Sign the package again."};
inline constexpr Cause kManifestChanged = {"manifest-changed", Group::kSignature,
    Severity::kRefused, ChainLink::kManifest, "`Can't validate manifest`",
    "META-INF/MANIFEST.MF was changed after it was signed",
    "Sign the package again, as the last step that changes it."};
inline constexpr Cause kManifestDigest = {"manifest-digest", Group::kSignature, Severity::kRefused,
    ChainLink::kManifest, "`Can't validate manifest`",
    "its signature file has no SHA-1 or SHA-256 digest of the manifest",
    "Sign it with SHA-256 digests, as apksigner does."};
inline constexpr Cause kManifestMalformed = {"manifest-malformed", Group::kSignature,
    Severity::kRefused, ChainLink::kManifest, "`Can't load manifest`",
    "META-INF/MANIFEST.MF does not parse", "Sign the package again."};
inline constexpr Cause kAndroidManifestText = {"android-manifest-text", Group::kSignature,
    Severity::kRefused, ChainLink::kManifest, "`Can't process Android Manifest`",
    "its AndroidManifest.xml is not in the compiled form",
    "Build the package with aapt or aapt2, which compile it."};
inline constexpr Cause kDexChanged = {"dex-changed", Group::kSignature, Severity::kRefused,
    ChainLink::kEntries, "`Integrity not confirmed: classes.dex`",
    "classes.dex is not the one that was signed", "Sign the package again, as the last step that "
    "changes it. If you did not change it yourself, do not trust it."};
inline constexpr Cause kDexNotListed = {"dex-not-listed", Group::kSignature, Severity::kRefused,
    ChainLink::kEntries, "`Can't find file in`",
    "classes.dex is not in the manifest: it was added after signing", "Sign the package again, "
    "as the last step that changes it. If you did not change it yourself, do not trust it."};
inline constexpr Cause kDexDigest = {"dex-digest", Group::kSignature, Severity::kRefused,
    ChainLink::kEntries, "`verifyData:`",
    "the manifest has no SHA-1 or SHA-256 digest of classes.dex",
    "Sign it with SHA-256 digests, as apksigner does."};
inline constexpr Cause kEntryEncrypted = {"entry-encrypted", Group::kSignature, Severity::kRefused,
    ChainLink::kEntries, "", "%s is encrypted, and no phone decrypts it",
    "Build the package again without a password."};
inline constexpr Cause kNoMemory = {"no-memory", Group::kSignature, Severity::kRefused,
    ChainLink::kCertificate, "`RSA could not`", "the tool had no memory left",
    "Run again with more memory."};

// ---- The kernel.
inline constexpr Cause kKernelRefused = {"kernel-refused", Group::kKernel, Severity::kRefused,
    ChainLink::kNone, "`VELT can't sign a`", "the kernel refused (%s)",
    "The file was good. docs/guide.md, \"When the kernel refuses\", says where to look."};
inline constexpr Cause kIntegrityZero = {"integrity-zero", Group::kKernel, Severity::kRefused,
    ChainLink::kNone, "`VELT can't sign a`",
    "the kernel set the tool's own integrity value to 0, so the tool is not allowed to sign", "The "
    "file was good. Check the domain that starts the tool: the tool's value must be neither 0 nor "
    "ffffffff."};
inline constexpr Cause kIntegrityMissing = {"integrity-missing", Group::kKernel, Severity::kRefused,
    ChainLink::kNone, "`VELT can't sign a`",
    "the tool has no integrity value: /proc/self/integrity/value does not exist",
    "The file was good. The kernel lacks the feature, or /proc is not mounted."};
inline constexpr Cause kIntegrityUnreadable = {"integrity-unreadable", Group::kKernel,
    Severity::kRefused, ChainLink::kNone, "`VELT can't sign a`",
    "the tool's own integrity value reads \"%s\", which is not a number",
    "The file was good. Check what /proc/self/integrity/value contains on that kernel."};

// ---- A library.
inline constexpr Cause kLibraryChanged = {"library-changed", Group::kLibrary, Severity::kRefused,
    ChainLink::kEntries, "`VeltSignJni: File not verified`",
    "its bytes are not those that the manifest lists",
    "The file beside the package was changed after it was installed. Install the package again."};
inline constexpr Cause kLibraryChangedInside = {"library-changed-inside", Group::kLibrary,
    Severity::kRefused, ChainLink::kEntries, "`VeltSignJni: File not verified`",
    "the package's own copy of it does not match the manifest",
    "Sign the package again, as the last step that changes it. If you did not change it "
    "yourself, do not trust it."};
inline constexpr Cause kLibraryNotListed = {"library-not-listed", Group::kLibrary,
    Severity::kRefused, ChainLink::kEntries, "`Can't find file in`",
    "the manifest does not list it: it was added after signing",
    "Sign the package again, as the last step that changes it."};
inline constexpr Cause kLibraryDigest = {"library-digest", Group::kLibrary, Severity::kRefused,
    ChainLink::kEntries, "`verifyData:`",
    "the manifest has no SHA-1 or SHA-256 digest of it",
    "Sign the package with SHA-256 digests, as apksigner does."};
inline constexpr Cause kLibraryNoPermission = {"library-no-permission", Group::kLibrary,
    Severity::kRefused, ChainLink::kNone, "`Can't open file`", "there is no permission to read it",
    "Give the user who runs the tool the right to read it and to enter its directories."};
inline constexpr Cause kLibraryNotOpened = {"library-not-opened", Group::kLibrary,
    Severity::kRefused, ChainLink::kNone, "`Can't open file`, `File %s is not opened`",
    "it cannot be opened (%s)", "Fix the reported error, and run again."};
inline constexpr Cause kLibraryNoFile = {"library-no-file", Group::kLibrary, Severity::kRefused,
    ChainLink::kNone, "`Can't read file`", "its path is not a regular file, or the file is too "
    "large to read",
    "Find out who put it there, and install the package again."};
inline constexpr Cause kLibraryInPackage = {"library-in-package", Group::kLibrary,
    Severity::kAbsent, ChainLink::kNone, "`Can't open file`",
    "it stays inside the package (extractNativeLibs=\"false\")",
    "Nothing to do: it is loaded from the package."};
inline constexpr Cause kLibraryNotInstalled = {"library-not-installed", Group::kLibrary,
    Severity::kAbsent, ChainLink::kNone, "`Can't open file`",
    "no libraries for its ABI are beside the package", "If the phone does not use this ABI, "
    "there is nothing to do. To extract libraries for 32-bit and 64-bit Arm, use --install=all."};
inline constexpr Cause kLibraryNotLaidOut = {"library-not-laid-out", Group::kLibrary,
    Severity::kNothing, ChainLink::kNone, "`Can't open file`",
    "its ABI was not chosen (--install=all chooses one for 32-bit and one for 64-bit Arm)",
    "Nothing to do: phones install the libraries of one ABI."};
inline constexpr Cause kLibraryInSubdirectory = {"library-in-subdirectory", Group::kLibrary,
    Severity::kAbsent, ChainLink::kNone, "`Can't open file`",
    "it is in a subdirectory of its ABI: installers do not extract it to %s, where the tool looks",
    "Build the package again with its libraries as lib/ABI/NAME."};
inline constexpr Cause kLibraryMissing = {"library-missing", Group::kLibrary, Severity::kAbsent,
    ChainLink::kNone, "`Can't open file`", "it is not beside the package, but other libraries are",
    "Install the package again, unless the installer leaves this library out on purpose."};
inline constexpr Cause kLibraryOtherAbi = {"library-other-abi", Group::kLibrary, Severity::kNothing,
    ChainLink::kNone, "", "the tool knows no directory for its ABI", "Nothing to do."};
inline constexpr Cause kPackageRefused = {"package-refused", Group::kLibrary, Severity::kFollows,
    ChainLink::kNone, "`VeltSignJni: malformed apk`, `Apk archive is not valid`",
    "the package is refused", "First fix the reason why the package is refused."};
inline constexpr Cause kNotReached = {"not-reached", Group::kLibrary, Severity::kFollows,
    ChainLink::kEntries, "", "the tool did not reach it", "See why the tool ended early."};
inline constexpr Cause kLibraryLeased = {"library-leased", Group::kLibrary, Severity::kRefused,
    ChainLink::kNone, "`Can't open file`", "another process holds a lease on it",
    "Have that process close the file, and run again; /proc/locks shows its process ID."};
inline constexpr Cause kLibraryNotExtracted = {"library-not-extracted", Group::kLibrary,
    Severity::kRefused, ChainLink::kEntries, "", "it cannot be extracted from the package",
    "Copy or build the package again; unzip -t names the fault."};
inline constexpr Cause kLibraryBehindDamage = {"library-behind-damage", Group::kLibrary,
    Severity::kRefused, ChainLink::kNone, "",
    "the tool did not reach it: after a damaged entry, it reads no further libraries",
    "Copy or build the package again; unzip -t names the damaged entry."};

// ---- The key.
inline constexpr Cause kRegistrationRefused = {"registration-refused", Group::kKey,
    Severity::kRefused, ChainLink::kNone, "`ZuNewCertificate failed`", "libzu answered %s",
    "libzu defines the code. Files that were signed stay signed."};
inline constexpr Cause kRegistrationNoPath = {"registration-no-path", Group::kKey,
    Severity::kRefused, ChainLink::kNone, "`Can't get jar location`",
    "the kernel reports no path for the JAR", "Check that /proc is mounted and can be read."};

// ---- The tool itself.
inline constexpr Cause kToolKilled = {"tool-killed", Group::kTool, Severity::kRefused,
    ChainLink::kNone, "", "it was killed by signal %s", "Report it, with the file."};
inline constexpr Cause kToolFailed = {"tool-failed", Group::kTool, Severity::kRefused,
    ChainLink::kNone, "", "it ended with status %s",
    "Check --tool: apktoolkit ends with 0 for every file."};
inline constexpr Cause kToolError = {"tool-error", Group::kTool, Severity::kRefused,
    ChainLink::kEntries, "", "it logged an error: %s", "docs/messages.md has every message."};

// ---- The installer of the phones.
inline constexpr Cause kNotInstallable = {"not-installable", Group::kInstaller, Severity::kRefused,
    ChainLink::kNone, "", "phones do not install it: %s",
    "Sign the package again, as the last step that changes it. If you did not build it, do not "
    "trust it. apksigner verify --min-sdk-version 27 names every fault."};
inline constexpr Cause kNotInstallableOnSome = {"not-installable-on-some", Group::kInstaller,
    Severity::kRefused, ChainLink::kNone, "", "not all phones install it: %s",
    "Sign it so that all of these phones install it, as apksigner does by default. If the "
    "package is only for some of these phones, name their API levels with --api."};
inline constexpr Cause kInstallerGaveUp = {"installer-gave-up", Group::kInstaller,
    Severity::kRefused, ChainLink::kNone, "", "the installer's verifier gave up: %s", "If you "
    "did not build this package, do not trust it. A large package may need a larger --timeout; "
    "--installer=off judges without the installer."};

// ---- The gate (gate.h): demands that a file must meet even if the phone accepts it.
inline constexpr Cause kSignerUnexpected = {"signer-unexpected", Group::kGate, Severity::kRefused,
    ChainLink::kNone, "", "its signer is not one that --signer names: %s",
    "Sign it with the key that --signer names; a rotated key has to be named as well. If you did "
    "not build it, do not trust it."};
inline constexpr Cause kSignerNone = {"signer-none", Group::kGate, Severity::kRefused,
    ChainLink::kNone, "", "it has no signer: the kernel trusts the bytes of the JAR (%s)",
    "Run without --signer for JARs."};
inline constexpr Cause kSignerNotVerified = {"signer-not-verified", Group::kGate,
    Severity::kFollows, ChainLink::kNone, "", "its signer is not known: the tool verified no "
    "signature (%s)", "First fix the reason why the file is refused."};
inline constexpr Cause kSignerDiffers = {"signer-differs", Group::kGate, Severity::kRefused,
    ChainLink::kNone, "", "the files of a package must have one signer: %s",
    "Sign all files of the package with one key and certificate. Check other builds of the "
    "package in separate runs."};
inline constexpr Cause kWarningsRefused = {"warnings-refused", Group::kGate, Severity::kRefused,
    ChainLink::kNone, "", "a warning counts as a refusal (--werror): %s",
    "See what to do about each warning."};

// ---- Warnings: facts that the user should check, even if everything was signed.
inline constexpr Cause kOtherKey = {"other-key", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "%s is made with another key than the JAR signature: phones install the "
    "package as signed with that other key, but the kernel gets the JAR signature's key", "Sign "
    "all schemes with one key. A rotated key signs only the newer schemes. If you did not build "
    "it, do not trust it."};
inline constexpr Cause kSchemesStripped = {"schemes-stripped", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "the signature file says that the package is also signed with %s, but "
    "it is not: phones do not install the package",
    "Sign the package again, as the last step that changes it."};
inline constexpr Cause kSigningBlockDamaged = {"signing-block-damaged", Group::kWarning,
    Severity::kWarning, ChainLink::kNone, "", "its signing block (v2 and later) is damaged",
    "Sign the package again."};
inline constexpr Cause kSeveralSigners = {"several-signers", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "it has more than one signer; the kernel gets the key of %s alone",
    "Sign it with one key."};
inline constexpr Cause kForgeableKey = {"forgeable-key", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "the key has the public exponent %s: anyone can make its signatures",
    "Do not trust this package. Normal keys have the exponent 65537."};
inline constexpr Cause kEntriesChanged = {"entries-changed", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "the manifest does not match %s, which the tool does not check",
    "Sign the package again, as the last step that changes it. If you did not build it, do not "
    "trust it."};
inline constexpr Cause kEntriesMissing = {"entries-missing", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "%s: listed in the manifest, but missing in the package",
    "Sign the package again, as the last step that changes it. If you did not build it, do not "
    "trust it."};
inline constexpr Cause kEntriesNotCompared = {"entries-not-compared", Group::kWarning,
    Severity::kAlarm, ChainLink::kNone, "", "%s not compared with the manifest: unreadable, too "
    "long, without a SHA-1 or SHA-256 digest, or not reached before the time limit",
    "unzip -t names an unreadable entry. Run again with a larger --timeout. Entries above 512 "
    "MiB are not compared."};
inline constexpr Cause kWeakKey = {"weak-key", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "its RSA key has %s bits; fewer than 2048 bits are not safe",
    "Sign a new app with a key of 2048 bits or more. For a published app, a new key changes "
    "the signer."};
inline constexpr Cause kDebugKey = {"debug-key", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "it is signed with a debug certificate (CN=Android Debug); each "
    "workstation makes its own debug key", "Sign a release with a release key."};
inline constexpr Cause kWeakDigest = {"weak-digest", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "SHA-1 or MD5 is in use: %s",
    "Sign it again with SHA-256 (apksigner --min-sdk-version 18). Certify the key of a new app "
    "with SHA-256 as well; for a published app, a new certificate changes the signer."};
inline constexpr Cause kCertificateExpired = {"certificate-expired", Group::kWarning,
    Severity::kWarning, ChainLink::kNone, "", "its certificate expired on %s",
    "Phones still install it. A published app must keep its certificate: a new one changes the "
    "signer. For a new app, make a certificate that lasts: keytool -validity 10000."};
inline constexpr Cause kUnlistedEntries = {"unlisted-entries", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "the signature does not protect %s: no digest in the manifest",
    "Sign the package again, as the last step that changes it. --verbose lists these entries."};
inline constexpr Cause kNotLaidOut = {"not-laid-out", Group::kWarning, Severity::kWarning,
    ChainLink::kNone, "", "an installer leaves out %s",
    "Build the package again with its libraries as lib/ABI/NAME."};
inline constexpr Cause kCertificateOtherKey = {"certificate-other-key", Group::kWarning,
    Severity::kAlarm, ChainLink::kNone, "",
    "its certificate shows this tool a key that other programs do not find: they find %s",
    "If you did not build this package, do not trust it."};
inline constexpr Cause kBlockAmbiguous = {"block-ambiguous", Group::kWarning, Severity::kAlarm,
    ChainLink::kNone, "",
    "other programs may find a different signer in its signature block: %s",
    "Sign the package again with apksigner. If you did not build it, do not trust it."};
inline constexpr Cause kOtherPackageName = {"other-package-name", Group::kWarning, Severity::kAlarm,
    ChainLink::kNone, "", "phones install it as %s, but the tool reads another package name",
    "Build the package again with aapt or aapt2. If you did not build it, do not trust it."};
inline constexpr Cause kNotLookedInto = {"not-looked-into", Group::kWarning, Severity::kAlarm,
    ChainLink::kNone, "", "%s is too large and was not read, so this verdict does not consider it",
    "If you did not build this package, do not trust it: in real packages this part is small."};
inline constexpr Cause kEntriesEncrypted = {"entries-encrypted", Group::kWarning, Severity::kDoubt,
    ChainLink::kNone, "", "%s: encrypted, and no phone decrypts it",
    "Build the package again without a password."};
inline constexpr Cause kEntriesDamaged = {"entries-damaged", Group::kWarning, Severity::kDoubt,
    ChainLink::kNone, "", "the archive is damaged and cannot be read at %s",
    "Copy or build the package again; unzip -t names the fault."};

// clang-format on
}  // namespace cause

}  // namespace simulator
