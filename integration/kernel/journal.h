/* SPDX-License-Identifier: GPL-2.0-only OR Apache-2.0 */
/*
 * Writes each call to the module and its result as a line of the journal (docs/journal.md), to the
 * file that the parameter `journal` names. Without the parameter nothing is written.
 */
#include <linux/types.h>

struct file;

/* Opens the file for appending. Returns 0 or a negative error number. */
int journal_open(void);

/* file: the file that is open as fd, or NULL. payload: the two bytes of the payload's length, and
 * the payload; together `size` bytes. `size` is 0 if the payload was not read. error: 0 or a
 * negative error number. */
void journal_sign(int fd, struct file *file, const void *payload, size_t size, int error);
void journal_verify(int fd, struct file *file, int error);

/* value: the integrity file that is opened. text: its contents without the line end, or NULL if the
 * file counts as missing. */
void journal_integrity(struct file *value, const char *text);
