// Runs a command with another file system or with other rights than those of the test.
#pragma once

#include <string>
#include <vector>

// True if the kernel allows namespaces. If the test runs in a container, the container must allow
// them as well. Otherwise a test that needs them is skipped with the reason kNoNamespaces.
bool CanMakeNamespaces();
inline constexpr char kNoNamespaces[] = "the kernel, or this container, allows no user namespaces";

// The words to put before a command. The command then finds a copy of `file` at
// `mount_point`/base.apk, on a separate file system with the mount options `options`.
std::vector<std::string> OnItsOwnFileSystem(const std::string& file, const std::string& mount_point,
                                            const std::string& options);
