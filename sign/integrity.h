// The kernel's file-integrity feature (VELT): two private fcntl commands and the integrity value
// that the kernel publishes for each task under /proc. C linkage; nothing is logged here, callers
// print errno as the last system call left it. No state: any thread may call.
//
// Result code of all three: 0 is success, kVeltFailure is every failure, and there is no other.
#pragma once

#include <cstdint>

// What every failure returns, whatever its cause: 65536.
inline constexpr uint32_t kVeltFailure = 0x10000;

extern "C" {

// Asks the kernel to sign the open file `fd`.
//
// `payload` is borrowed for the call: an unsigned 16-bit length L in host byte order, then L bytes.
// L may be 0. Fails without calling the kernel when `payload` is null, and when the calling task's
// own integrity value cannot be read or is 0: such a task may not sign. Waits, without a bound,
// while that value is not settled yet. When the kernel refuses, errno is the kernel's.
uint32_t VeltSignFd(int fd, const void* payload);

// Asks the kernel whether it trusts the open file `fd`. The caller's own integrity value does not
// matter. When the kernel refuses, errno is the kernel's.
uint32_t VeltVerifyFd(int fd);

// Reads the integrity value of the task with process id `pid` (0: the calling task) into `*value`.
//
// With bit 0 of `wait` set, reads again every 10 ms for as long as the value is 0xFFFFFFFF (not
// settled yet); `*value` then shows each value read. Fails when `value` is null, when `pid` is
// negative, and when the task's file cannot be opened or does not hold a hexadecimal number;
// `*value` then keeps what it held, or the last value read while waiting.
uint32_t VeltTaskReadIntegrity(int pid, uint32_t wait, uint32_t* value);

}  // extern "C"
