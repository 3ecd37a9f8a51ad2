// A library to be loaded before all others. It makes one call of one C library function fail. Calls
// are counted from the start of main().
//
//   APKTOOLKIT_FAULT         the function's name, ":", and the number of its call, from 1
//   APKTOOLKIT_FAULT_REPORT  a file that is made at that call
//
// Calls from the simulated phone's own libraries are passed on and not counted, except requests for
// memory. Calls of fstat from the platform's libraries are not counted either.
//
// The functions are malloc, open, read, fstat, fopen, readlink, fgetxattr, fstatvfs and fcntl. A
// function with several names (open, open64 and the checked __open_2) counts as one function.
// malloc, calloc and realloc also count as one function.
#include <dlfcn.h>
#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <sys/syscall.h>
#include <sys/types.h>
#include <ucontext.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "simulator/phone/next_function.h"

using simulator::NextFunction;

extern "C" {
void* __libc_malloc(size_t size);
void* __libc_calloc(size_t count, size_t size);
void* __libc_realloc(void* block, size_t size);
}

namespace {

char function[32];
long calls_left = -1;  // up to and including the call that fails; 0 or less: no call fails
const char* report = nullptr;

// True if the code at `address` is part of the shared library whose path contains `name`.
bool IsIn(const char* name, const void* address) {
  Dl_info info;
  return dladdr(address, &info) != 0 && info.dli_fname != nullptr &&
         strstr(info.dli_fname, name) != nullptr;
}

// If an allocation fails, the platform's String8 crashes on a null pointer, while the platform's
// other containers abort. The code of String8 is in libutils.so. This handler turns a crash in
// libutils.so into an abort, so that a test can distinguish this crash from crashes in other code.
void AbortForString8(int, siginfo_t*, void* context) {
#ifdef __x86_64__
  const auto address = static_cast<ucontext_t*>(context)->uc_mcontext.gregs[REG_RIP];
#else
  const auto address = static_cast<ucontext_t*>(context)->uc_mcontext.pc;
#endif
  if (IsIn("/android/libutils.so", reinterpret_cast<void*>(address))) abort();
  signal(SIGSEGV, SIG_DFL);
}

void Arm() {
  const char* const fault = getenv("APKTOOLKIT_FAULT");
  const char* const colon = fault == nullptr ? nullptr : strchr(fault, ':');
  if (colon == nullptr || colon - fault >= static_cast<long>(sizeof(function))) return;
  memcpy(function, fault, static_cast<size_t>(colon - fault));
  report = getenv("APKTOOLKIT_FAULT_REPORT");
  calls_left = strtol(colon + 1, nullptr, 10);
  if (strcmp(function, "malloc") != 0) return;
  struct sigaction action = {};
  action.sa_sigaction = AbortForString8;
  action.sa_flags = SA_SIGINFO;
  sigaction(SIGSEGV, &action, nullptr);
}

// True if this is the call that must fail. The function itself uses none of the functions
// that this library replaces.
bool Fails(const char* name, int error, const void* caller = nullptr) {
  if (calls_left <= 0 || strcmp(name, function) != 0) return false;
  if (caller != nullptr && IsIn("/lib/apktoolkit/", caller)) return false;
  if (--calls_left != 0) return false;
  const long file = syscall(SYS_openat, AT_FDCWD, report, O_WRONLY | O_CREAT, 0600);
  syscall(SYS_close, file);
  errno = error;
  return true;
}

using Main = int(int, char**, char**);
Main* real_main = nullptr;

int ArmAndStart(int argc, char** argv, char** environment) {
  Arm();
  const int status = real_main(argc, argv, environment);
  calls_left = 0;  // calls after main() do not fail
  return status;
}

using StartMain = int(Main*, int, char**, void (*)(), void (*)(), void (*)(), void*);

}  // namespace

extern "C" int __libc_start_main(Main* program, int argc, char** argv, void (*init)(),
                                 void (*fini)(), void (*rtld_fini)(), void* stack_end) {
  real_main = program;
  return NextFunction<StartMain>("__libc_start_main")(ArmAndStart, argc, argv, init, fini,
                                                      rtld_fini, stack_end);
}

extern "C" void* malloc(size_t size) {
  return Fails("malloc", ENOMEM) ? nullptr : __libc_malloc(size);
}
extern "C" void* calloc(size_t count, size_t size) {
  return Fails("malloc", ENOMEM) ? nullptr : __libc_calloc(count, size);
}
extern "C" void* realloc(void* block, size_t size) {
  return Fails("malloc", ENOMEM) ? nullptr : __libc_realloc(block, size);
}

extern "C" ssize_t read(int fd, void* buffer, size_t size) {
  static auto* const next = NextFunction<ssize_t(int, void*, size_t)>("read");
  return Fails("read", EIO, __builtin_return_address(0)) ? -1 : next(fd, buffer, size);
}
extern "C" ssize_t __read_chk(int fd, void* buffer, size_t size, size_t room) {
  static auto* const next = NextFunction<ssize_t(int, void*, size_t, size_t)>("__read_chk");
  return Fails("read", EIO, __builtin_return_address(0)) ? -1 : next(fd, buffer, size, room);
}
extern "C" ssize_t readlink(const char* path, char* buffer, size_t size) {
  static auto* const next = NextFunction<ssize_t(const char*, char*, size_t)>("readlink");
  return Fails("readlink", EIO, __builtin_return_address(0)) ? -1 : next(path, buffer, size);
}
extern "C" ssize_t __readlink_chk(const char* path, char* buffer, size_t size, size_t room) {
  static auto* const next =
      NextFunction<ssize_t(const char*, char*, size_t, size_t)>("__readlink_chk");
  return Fails("readlink", EIO, __builtin_return_address(0)) ? -1 : next(path, buffer, size, room);
}
extern "C" ssize_t fgetxattr(int fd, const char* name, void* value, size_t size) {
  static auto* const next = NextFunction<ssize_t(int, const char*, void*, size_t)>("fgetxattr");
  return Fails("fgetxattr", EIO, __builtin_return_address(0)) ? -1 : next(fd, name, value, size);
}
// Calls of fstat from the platform's libraries are passed on and not counted, because the number of
// these calls depends on the release of the libraries.
extern "C" int fstat(int fd, struct stat* state) {
  static auto* const next = NextFunction<int(int, struct stat*)>("fstat");
  const void* const caller = __builtin_return_address(0);
  const bool is_counted = !IsIn("/android/", caller);
  return is_counted && Fails("fstat", EIO, caller) ? -1 : next(fd, state);
}

extern "C" int fstatvfs(int fd, struct statvfs* state) {
  static auto* const next = NextFunction<int(int, struct statvfs*)>("fstatvfs");
  return Fails("fstatvfs", EIO, __builtin_return_address(0)) ? -1 : next(fd, state);
}

extern "C" int fstatvfs64(int fd, struct statvfs64* state) {
  static auto* const next = NextFunction<int(int, struct statvfs64*)>("fstatvfs64");
  return Fails("fstatvfs", EIO, __builtin_return_address(0)) ? -1 : next(fd, state);
}

extern "C" FILE* fopen(const char* path, const char* mode) {
  static auto* const next = NextFunction<FILE*(const char*, const char*)>("fopen");
  return Fails("fopen", EMFILE, __builtin_return_address(0)) ? nullptr : next(path, mode);
}
extern "C" FILE* fopen64(const char* path, const char* mode) {
  static auto* const next = NextFunction<FILE*(const char*, const char*)>("fopen64");
  return Fails("fopen", EMFILE, __builtin_return_address(0)) ? nullptr : next(path, mode);
}

// Reads a mode even if the caller passed none. The mode is then not used.
extern "C" int open(const char* path, int flags, ...) {
  static auto* const next = NextFunction<int(const char*, int, ...)>("open");
  va_list arguments;
  va_start(arguments, flags);
  const auto mode = va_arg(arguments, mode_t);
  va_end(arguments);
  return Fails("open", EMFILE, __builtin_return_address(0)) ? -1 : next(path, flags, mode);
}
extern "C" int open64(const char* path, int flags, ...) {
  static auto* const next = NextFunction<int(const char*, int, ...)>("open64");
  va_list arguments;
  va_start(arguments, flags);
  const auto mode = va_arg(arguments, mode_t);
  va_end(arguments);
  return Fails("open", EMFILE, __builtin_return_address(0)) ? -1 : next(path, flags, mode);
}
extern "C" int __open_2(const char* path, int flags) {
  static auto* const next = NextFunction<int(const char*, int)>("__open_2");
  return Fails("open", EMFILE, __builtin_return_address(0)) ? -1 : next(path, flags);
}

extern "C" int fcntl(int fd, int command, ...) {
  static auto* const next = NextFunction<int(int, int, ...)>("fcntl");
  va_list arguments;
  va_start(arguments, command);
  void* const argument = va_arg(arguments, void*);
  va_end(arguments);
  return Fails("fcntl", EIO, __builtin_return_address(0)) ? -1 : next(fd, command, argument);
}
extern "C" int fcntl64(int fd, int command, ...) {
  static auto* const next = NextFunction<int(int, int, ...)>("fcntl64");
  va_list arguments;
  va_start(arguments, command);
  void* const argument = va_arg(arguments, void*);
  va_end(arguments);
  return Fails("fcntl", EIO, __builtin_return_address(0)) ? -1 : next(fd, command, argument);
}
