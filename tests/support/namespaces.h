// Linux namespaces, in which a command has another file system or other rights than the test.
#pragma once

#include <string>
#include <vector>

// True if user and mount namespaces can be made. The kernel can forbid namespaces. The container in
// which the test runs can forbid them as well. If the result is false, a test that needs namespaces
// is skipped with the reason kNoNamespaces.
bool CanMakeNamespaces();
inline constexpr char kNoNamespaces[] = "the kernel, or this container, allows no user namespaces";

// The words to put before a command. The command then finds a copy of `file` at
// `mount_point`/base.apk, on a separate file system with the mount options `options`.
std::vector<std::string> OnItsOwnFileSystem(const std::string& file, const std::string& mount_point,
                                            const std::string& options);
