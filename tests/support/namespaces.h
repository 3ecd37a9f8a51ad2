// Running a command where the file system or the rights are other than the test's own.
#pragma once

#include <string>
#include <vector>

// Whether this kernel, and whatever container this runs in, allow that. A test that needs it is
// skipped where not, with this reason.
bool CanMakeNamespaces();
inline constexpr char kNoNamespaces[] = "the kernel, or this container, allows no user namespaces";

// The words that run a command with `file` copied to `mount_point`/base.apk, on a file system of
// its own that takes `options`.
std::vector<std::string> OnItsOwnFileSystem(const std::string& file, const std::string& mount_point,
                                            const std::string& options);
