// The kernel's file-integrity feature (VELT): two private fcntl commands, and the integrity value
// that the kernel publishes for each task under /proc. C linkage. The functions log nothing and
// leave errno as the last system call set it. They keep no state, and any thread may call them.
//
// All three functions return 0 for success and kVeltFailure for every failure.
#pragma once

#include <cstdint>

// The result of every failure: 65536.
inline constexpr uint32_t kVeltFailure = 0x10000;

extern "C" {

// Asks the kernel to sign the open file `fd`.
//
// `payload` is an unsigned 16-bit length L in host byte order, then L bytes. L may be 0. The
// function keeps no pointer to `payload`. The function fails without the fcntl call if `payload` is
// null, or if the integrity value of the calling task cannot be read or is 0. A task with the value
// 0 must not sign. While the value is 0xFFFFFFFF (not settled yet), the function waits, without a
// limit. If the kernel refuses, errno is the kernel's error number.
uint32_t VeltSignFd(int fd, const void* payload);

// Asks the kernel whether it trusts the open file `fd`. The caller's own integrity value does not
// matter. If the kernel refuses, errno is the kernel's error number.
uint32_t VeltVerifyFd(int fd);

// Reads the integrity value of the task with process id `pid` (0: the calling task) into `*value`.
//
// If bit 0 of `wait` is set, reads again every 10 ms while the value is 0xFFFFFFFF (not settled
// yet), and stores each value in `*value`. Fails if `value` is null, if `pid` is negative, or if
// the task's file under /proc cannot be opened or does not begin with a hexadecimal number. After a
// failure, `*value` has its former value, or the last value that was read while waiting.
uint32_t VeltTaskReadIntegrity(int pid, uint32_t wait, uint32_t* value);

}  // extern "C"
