#include "support/namespaces.h"

#include <unistd.h>

#include "support/process.h"

namespace {

// Returns the options of unshare for a new mount namespace. Users other than root also need a user
// namespace.
const char* Namespaces() { return geteuid() == 0 ? "-m" : "-Urm"; }

}  // namespace

bool CanMakeNamespaces() {
  static const bool can = RunProcess({"unshare", "-U", "true"}).status == 0 &&
                          RunProcess({"unshare", Namespaces(), "true"}).status == 0;
  return can;
}

std::vector<std::string> OnItsOwnFileSystem(const std::string& file, const std::string& mount_point,
                                            const std::string& options) {
  const std::string script =
      "mount -t tmpfs apktoolkit \"$0\" && cp \"$1\" \"$0/base.apk\" &&"
      " mount -o remount,bind," +
      options + " \"$0\" && shift && exec \"$@\"";
  return {"unshare", Namespaces(), "sh", "-c", script, mount_point, file};
}
