/* SPDX-License-Identifier: GPL-2.0-only OR Apache-2.0 */
/*
 * Writes the journal of the kernel module (docs/journal.md). The module's parameter `journal` names
 * the file of the journal. With this parameter, each call of journal_sign, journal_verify or
 * journal_integrity appends one line. Without it, these functions write nothing.
 */
#include <linux/types.h>

struct file;

/* Opens the file of the journal for appending, if the parameter names one. Returns 0 or a negative
 * error number. */
int journal_open(void);

/* file: the file that is open as fd, or NULL. payload: the whole payload of `size` bytes. The first
 * two bytes are the length of the data after them, in host byte order. `size` is 0 if the payload
 * was not read. error: 0 or a negative error number. */
void journal_sign(int fd, struct file *file, const void *payload, size_t size, int error);
void journal_verify(int fd, struct file *file, int error);

/* value: the integrity file that a task opens. text: the file's contents without the line end, or
 * NULL if the module lets this opening fail with ENOENT. */
void journal_integrity(struct file *value, const char *text);
