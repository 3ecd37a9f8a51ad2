// Tests describe the events of one run of the tool on a phone as a timeline: a text with one line
// for each event, in order. Timelines are joined with `+`. GoogleTest shows line by line how two
// timelines differ. Each function from Log to Exit returns the line of one event. The line has
// every member that the event has in the journal (docs/journal.md).
#pragma once

#include <initializer_list>
#include <string>

#include "support/bytes.h"

// A record of the tool's log: priority 4 is information, 6 an error.
std::string Log(int priority, const std::string& text);
// The tool read its own integrity value and found `text`.
std::string Integrity(const std::string& text);
// The tool tried to read its own integrity value, but /proc/self/integrity/value did not exist.
std::string IntegrityMissing();
// The tool asked the kernel to sign the open file `fd`. `refusal` is the errno of the kernel's
// refusal; 0: the kernel signed.
std::string Sign(int fd, const std::string& path, const Bytes& payload, int refusal = 0);
// The tool asked the kernel to verify the open file `fd`. `refusal` is the errno of the kernel's
// refusal; 0: the kernel trusts the file.
std::string Verify(int fd, const std::string& path, int refusal = 0);
// The tool asked libzu to register `data` under `name`.
std::string Register(int fd, const std::string& path, const std::string& name, const Bytes& data,
                     int result = 0);
std::string StandardOutput(const std::string& text);
std::string Exit(int status);

std::string Timeline(std::initializer_list<std::string> parts);

// The payload for a package that is signed with the RSA test key `key`: the length 32 as two bytes,
// low byte first, and the SHA-256 digest of the modulus. The payload is computed without the tool's
// code.
Bytes PackagePayload(const std::string& key = "rsa-2048");

// Parts of timelines that many tests share.

// The events of VeltSignJni, the step that signs the libraries: its first log record, the events of
// each library, and its last log record.
std::string LibraryStep(std::initializer_list<std::string> libraries = {});
// The events of a library that matched the manifest and was signed.
std::string SignedLibrary(const std::string& path, const Bytes& payload = PackagePayload());
// The events of VeltSign, the step that signs the package file, for a good package.
std::string PackageStep(const std::string& path, const Bytes& payload = PackagePayload());
// The events of VeltSignJni and VeltSign for a package that the tool refused before. Both steps run
// nevertheless.
std::string NothingSigned(const std::string& path);
