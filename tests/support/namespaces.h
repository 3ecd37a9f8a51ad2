// Runs a command with another file system or with other rights than those of the test.
#pragma once

#include <string>
#include <vector>

// True if the kernel allows namespaces, and the container too if the test runs in one. Otherwise a
// test that needs them is skipped with the reason kNoNamespaces.
bool CanMakeNamespaces();
inline constexpr char kNoNamespaces[] = "the kernel, or this container, allows no user namespaces";

// The words that run a command with `file` copied to `mount_point`/base.apk, on a separate file
// system with `options`.
std::vector<std::string> OnItsOwnFileSystem(const std::string& file, const std::string& mount_point,
                                            const std::string& options);
