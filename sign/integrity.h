// The kernel's file-integrity feature (VELT): two private fcntl commands, and the integrity value
// that the kernel publishes for each task under /proc. C linkage. The functions log nothing and
// leave errno as the last system call set it. They keep no state: any thread may call.
//
// All three return 0 for success and kVeltFailure for every failure.
#pragma once

#include <cstdint>

// The result of every failure: 65536.
inline constexpr uint32_t kVeltFailure = 0x10000;

extern "C" {

// Asks the kernel to sign the open file `fd`.
//
// `payload` is borrowed for the call: an unsigned 16-bit length L in host byte order, then L bytes.
// L may be 0. Fails without calling the kernel if `payload` is null, or if the calling task's own
// integrity value cannot be read or is 0: a task with 0 may not sign. Waits, without a limit, while
// that value is not settled yet. If the kernel refuses, errno is the kernel's.
uint32_t VeltSignFd(int fd, const void* payload);

// Asks the kernel whether it trusts the open file `fd`. The caller's own integrity value does not
// matter. If the kernel refuses, errno is the kernel's.
uint32_t VeltVerifyFd(int fd);

// Reads the integrity value of the task with process id `pid` (0: the calling task) into `*value`.
//
// With bit 0 of `wait` set, reads again every 10 ms while the value is 0xFFFFFFFF (not settled
// yet); `*value` then holds each value in turn. Fails if `value` is null, if `pid` is negative, or
// if the task's file cannot be opened or does not hold a hexadecimal number; `*value` then keeps
// its former value, or the last value read while waiting.
uint32_t VeltTaskReadIntegrity(int pid, uint32_t wait, uint32_t* value);

}  // extern "C"
