// SPDX-License-Identifier: GPL-2.0-only OR Apache-2.0
#include "journal.h"

#include <linux/fs.h>
#include <linux/kernel.h>
#include <linux/module.h>
#include <linux/sched.h>
#include <linux/slab.h>

static char *journal;
module_param(journal, charp, 0444);
MODULE_PARM_DESC(journal, "a file that gets a line for each event");

static struct file *journal_file;

int journal_open(void)
{
	if (!journal)
		return 0;
	journal_file = filp_open(journal, O_WRONLY | O_CREAT | O_APPEND, 0600);
	return PTR_ERR_OR_ZERO(journal_file);
}

static __printf(1, 2) void write_line(const char *format, ...)
{
	loff_t end = 0; /* ignored: O_APPEND writes at the end of the file */
	va_list arguments;
	char *line;

	if (!journal_file)
		return;
	va_start(arguments, format);
	line = kvasprintf(GFP_KERNEL, format, arguments);
	va_end(arguments);
	if (line)
		kernel_write(journal_file, line, strlen(line), &end);
	kfree(line);
}

/* The path is not escaped, because the paths of the tests need no escapes. */
static void write_answer(const char *event, int fd, struct file *file, const char *payload,
			 int error)
{
	char *buffer = kmalloc(PATH_MAX, GFP_KERNEL);
	const char *path = file && buffer ? d_path(&file->f_path, buffer, PATH_MAX) : "";

	write_line("{\"event\":\"%s\",\"fd\":%d,\"path\":\"%s\",%s%s%s\"result\":%d,\"errno\":%d}\n",
		   event, fd, IS_ERR(path) ? "" : path, payload ? "\"payload\":\"" : "",
		   payload ? payload : "", payload ? "\"," : "", error ? -1 : 0, -error);
	kfree(buffer);
}

void journal_sign(int fd, struct file *file, const void *payload, size_t size, int error)
{
	char *digits = kvzalloc(2 * size + 1, GFP_KERNEL);

	if (digits)
		bin2hex(digits, payload, size);
	write_answer("sign", fd, file, digits ? digits : "", error);
	kvfree(digits);
}

void journal_verify(int fd, struct file *file, int error)
{
	write_answer("verify", fd, file, NULL, error);
}

void journal_integrity(struct file *value, const char *text)
{
	const char *task = value->f_path.dentry->d_parent->d_parent->d_name.name;
	const char *quote = text ? "\"" : "";
	int pid = 0;

	/* The line has pid 0 if a task opens its own integrity file. The path that the kernel
	 * resolved is the same for /proc/self and for the task's own /proc/PID, so the module
	 * cannot distinguish them. The simulator writes 0 only for /proc/self. */
	if (kstrtoint(task, 10, &pid) || pid == task_tgid_vnr(current))
		pid = 0;
	write_line("{\"event\":\"integrity\",\"pid\":%d,\"text\":%s%s%s}\n", pid, quote,
		   text ? text : "null", quote);
}
