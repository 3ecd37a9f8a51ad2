/* SPDX-License-Identifier: GPL-2.0-only OR Apache-2.0 */
/*
 * Each question to the module and its answer: lines of the journal that docs/journal.md
 * describes, in the file that the parameter `journal` names. Without one nothing is written.
 */
#include <linux/types.h>

struct file;

/* Opens the file for appending. Returns 0 or a negative error number. */
int journal_open(void);

/* file: what fd is open on, or NULL; payload: its bytes from the length on, none where it could
 * not be read; error: 0 or negative. */
void journal_sign(int fd, struct file *file, const void *payload, size_t size, int error);
void journal_verify(int fd, struct file *file, int error);

/* value: the file of some task that is opened; text: what it holds, or NULL for no such file. */
void journal_integrity(struct file *value, const char *text);
