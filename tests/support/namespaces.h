// Runs a command with another file system or other rights than the test's own.
#pragma once

#include <string>
#include <vector>

// True if this kernel, and the container that this may run in, allow that. Otherwise a test that
// needs it is skipped, with this reason.
bool CanMakeNamespaces();
inline constexpr char kNoNamespaces[] = "the kernel, or this container, allows no user namespaces";

// The words that run a command with `file` copied to `mount_point`/base.apk, on a separate file
// system with `options`.
std::vector<std::string> OnItsOwnFileSystem(const std::string& file, const std::string& mount_point,
                                            const std::string& options);
