// SPDX-License-Identifier: GPL-2.0-only OR Apache-2.0
/*
 * The file-integrity feature on an ordinary kernel, only for tests. It is the smallest feature that
 * apktoolkit works with. It is NOT for a product: a task that can read a regular file can make the
 * kernel sign it, and a parameter sets the integrity value of every task (docs/porting.md explains
 * what a product needs).
 *
 *   fcntl(fd, 1124, payload)   signs: keeps the payload, and the SHA-256 digest of the file's
 *                              bytes, in an extended attribute of the file
 *   fcntl(fd, 1125)            verifies: returns 0 if the file has the bytes that were signed
 *   /proc/PID/integrity/value  the integrity value of a task, in hexadecimal
 *
 * The kernel itself is not changed. Kprobes redirect these two commands, and the look-up of
 * "integrity" in /proc/PID, to functions of this file. All other calls work as before. /proc keeps
 * inodes whose operations are in the module. The module therefore has no exit function, and cannot
 * be unloaded.
 */
#include <crypto/sha2.h>
#include <linux/file.h>
#include <linux/fs.h>
#include <linux/kprobes.h>
#include <linux/mm.h>
#include <linux/module.h>
#include <linux/mount.h>
#include <linux/slab.h>
#include <linux/uaccess.h>
#include <linux/version.h>
#include <linux/xattr.h>
#include <asm/syscall.h>

#include "journal.h"

MODULE_DESCRIPTION("Stand-in for a phone's file-integrity feature, for tests alone");
MODULE_LICENSE("GPL");

#define SIGN_COMMAND 1124
#define VERIFY_COMMAND 1125

/* Only the kernel and the administrator can set attributes of this class. */
#define ATTRIBUTE XATTR_SECURITY_PREFIX "integrity_stand_in"

static char integrity[64] = "1f";
module_param_string(integrity, integrity, sizeof(integrity), 0644);
MODULE_PARM_DESC(integrity, "contents of the integrity file, one for each opening, separated by commas; the last one repeats");

static int sign_errno;
module_param(sign_errno, int, 0644);
MODULE_PARM_DESC(sign_errno, "errno of a valid request to sign; 0: the module tries to sign the file");

static int verify_errno = ENOKEY;
module_param(verify_errno, int, 0644);
MODULE_PARM_DESC(verify_errno, "errno for a file that is not trusted");

/* ---- The two commands. A result of type int is 0 or a negative error number. */

/* False if there is no file, or if the descriptor only names a file (O_PATH). */
static bool is_open(const struct file *file)
{
	return file && !(file->f_mode & FMODE_PATH);
}

/* The contents of the attribute: a digest, and then the payload as the task passed it. */
struct signature {
	u8 digest[SHA256_DIGEST_SIZE]; /* of the file's bytes */
	u16 length; /* of the data, in host byte order */
	u8 data[];
} __packed;

/* Returns a signature whose digest is not set, or an error pointer. The caller must free the
 * signature. Each byte of the payload is read only once, because the task can change the byte
 * between two reads. */
static struct signature *copy_payload(const u8 __user *payload)
{
	struct signature *signature;
	u16 length;

	if (copy_from_user(&length, payload, sizeof(length)))
		return ERR_PTR(-EFAULT);
	signature = kvmalloc(sizeof(*signature) + length, GFP_KERNEL);
	if (!signature)
		return ERR_PTR(-ENOMEM);
	signature->length = length;
	if (!copy_from_user(signature->data, payload + sizeof(length), length))
		return signature;
	kvfree(signature);
	return ERR_PTR(-EFAULT);
}

/* A product must prevent changes of a signed file. This module does not. */
static int digest_file(struct file *file, u8 digest[SHA256_DIGEST_SIZE])
{
	struct sha256_state state;
	loff_t position = 0;
	ssize_t count;
	u8 *part;

	if (!S_ISREG(file_inode(file)->i_mode))
		return -EINVAL;
	if (!(file->f_mode & FMODE_READ))
		return -EBADF;
	part = kmalloc(PAGE_SIZE, GFP_KERNEL);
	if (!part)
		return -ENOMEM;
	sha256_init(&state);
	while ((count = kernel_read(file, part, PAGE_SIZE, &position)) > 0)
		sha256_update(&state, part, count);
	sha256_final(&state, digest);
	kfree(part);
	return count;
}

static int keep(struct file *file, const struct signature *signature)
{
#if LINUX_VERSION_CODE >= KERNEL_VERSION(6, 3, 0)
	struct mnt_idmap *owners = mnt_idmap(file->f_path.mnt);
#else
	struct user_namespace *owners = mnt_user_ns(file->f_path.mnt);
#endif
	struct inode *inode = file_inode(file);
	int error = mnt_want_write_file(file);

	if (error)
		return error;
	inode_lock(inode);
	error = __vfs_setxattr(owners, file_dentry(file), inode, ATTRIBUTE, signature,
			       sizeof(*signature) + signature->length, 0);
	inode_unlock(inode);
	mnt_drop_write_file(file);
	return error;
}

static int sign(int fd, struct file *file, const u8 __user *payload)
{
	struct signature *signature = is_open(file) ? copy_payload(payload) : ERR_PTR(-EBADF);
	int error = PTR_ERR_OR_ZERO(signature);

	if (error) {
		journal_sign(fd, file, NULL, 0, error);
		return error;
	}
	error = -sign_errno;
	if (!error)
		error = digest_file(file, signature->digest);
	if (!error)
		error = keep(file, signature);
	journal_sign(fd, file, &signature->length, sizeof(u16) + signature->length, error);
	kvfree(signature);
	return error;
}

static bool has_signed_bytes(struct file *file)
{
	struct dentry *dentry = file_dentry(file);
	struct inode *inode = file_inode(file);
	ssize_t size = __vfs_getxattr(dentry, inode, ATTRIBUTE, NULL, 0);
	u8 digest[SHA256_DIGEST_SIZE];
	struct signature *signature;
	bool same;

	if (size < (ssize_t)sizeof(*signature) || digest_file(file, digest))
		return false;
	signature = kvmalloc(size, GFP_KERNEL);
	same = signature && __vfs_getxattr(dentry, inode, ATTRIBUTE, signature, size) == size &&
	       !memcmp(signature->digest, digest, sizeof(digest));
	kvfree(signature);
	return same;
}

static int verify(int fd, struct file *file)
{
	int error = -EBADF;

	if (is_open(file))
		error = has_signed_bytes(file) ? 0 : -verify_errno;
	journal_verify(fd, file, error);
	return error;
}

/* Replaces the system call fcntl, only for SIGN_COMMAND and VERIFY_COMMAND. */
static asmlinkage long integrity_fcntl(struct pt_regs *call)
{
	unsigned long arguments[6];
	struct file *file;
	long result;

	syscall_get_arguments(current, call, arguments);
	file = fget_raw(arguments[0]);
	if ((u32)arguments[1] == SIGN_COMMAND)
		result = sign(arguments[0], file, (const u8 __user *)arguments[2]);
	else
		result = verify(arguments[0], file);
	if (file)
		fput(file);
	return result;
}

/* ---- /proc/PID/integrity/value */

/* Returns a copy of the first text in the list `integrity`, or NULL if memory runs out. The caller
 * must free the copy. Removes the first text from the list if other texts follow. */
static char *take_text(void)
{
	char *text, *comma;

	kernel_param_lock(THIS_MODULE);
	strim(integrity); /* echo writes a line end */
	comma = strchrnul(integrity, ',');
	text = kmemdup_nul(integrity, comma - integrity, GFP_KERNEL);
	if (*comma)
		memmove(integrity, comma + 1, strlen(comma));
	kernel_param_unlock(THIS_MODULE);
	return text;
}

static int value_open(struct inode *inode, struct file *file)
{
	char *text;

	if (file->f_mode & FMODE_WRITE)
		return -EACCES;
	text = take_text();
	if (!text)
		return -ENOMEM;
	if (!strcmp(text, "missing")) {
		journal_integrity(file, NULL);
		kfree(text);
		return -ENOENT;
	}
	journal_integrity(file, text);
	file->private_data = kasprintf(GFP_KERNEL, "%s\n", text);
	kfree(text);
	return file->private_data ? 0 : -ENOMEM;
}

static ssize_t value_read(struct file *file, char __user *to, size_t size, loff_t *position)
{
	const char *text = file->private_data;

	return simple_read_from_buffer(to, size, position, text, strlen(text));
}

static int value_release(struct inode *inode, struct file *file)
{
	kfree(file->private_data);
	return 0;
}

static const struct file_operations value_operations = {
	.open = value_open,
	.read = value_read,
	.release = value_release,
};

/* Returns a new inode, which the caller must pass on or release, or an error pointer. */
static struct inode *new_node(struct inode *directory, umode_t mode)
{
	struct inode *inode = new_inode(directory->i_sb);

	if (!inode)
		return ERR_PTR(-ENOMEM);
	inode->i_ino = get_next_ino();
	inode->i_mode = mode;
	return inode;
}

static struct dentry *look_up_value(struct inode *directory, struct dentry *dentry,
				    unsigned int flags)
{
	struct inode *inode;

	if (strcmp(dentry->d_name.name, "value"))
		return ERR_PTR(-ENOENT);
	inode = new_node(directory, S_IFREG | 0444);
	if (!IS_ERR(inode))
		inode->i_fop = &value_operations;
	return d_splice_alias(inode, dentry);
}

static const struct inode_operations directory_operations = { .lookup = look_up_value };

/* Replaces the look-up below /proc/PID, for the name "integrity" alone. */
static struct dentry *look_up_integrity(struct inode *directory, struct dentry *dentry,
					unsigned int flags)
{
	struct inode *inode = new_node(directory, S_IFDIR | 0555);

	if (!IS_ERR(inode)) {
		inode->i_op = &directory_operations;
		inode->i_fop = &simple_dir_operations;
	}
	return d_splice_alias(inode, dentry); /* returns the error if inode is an error pointer */
}

/* ---- The handlers of the two probes. They redirect a kernel function to a function above. */

static int fcntl_entered(struct kprobe *probe, struct pt_regs *registers)
{
	unsigned long arguments[6];

	syscall_get_arguments(current, (void *)regs_get_kernel_argument(registers, 0), arguments);
	if ((u32)arguments[1] != SIGN_COMMAND && (u32)arguments[1] != VERIFY_COMMAND)
		return 0;
	instruction_pointer_set(registers, (unsigned long)integrity_fcntl);
	return 1;
}

static int look_up_entered(struct kprobe *probe, struct pt_regs *registers)
{
	const struct dentry *dentry = (void *)regs_get_kernel_argument(registers, 1);

	if (strcmp(dentry->d_name.name, "integrity"))
		return 0;
	instruction_pointer_set(registers, (unsigned long)look_up_integrity);
	return 1;
}

/* Does nothing, but must exist: the kernel can replace the breakpoint of a probe by a jump if the
 * probe has no post handler. A pre-handler that is reached by this jump cannot redirect the call.
 */
static void after(struct kprobe *probe, struct pt_regs *registers, unsigned long flags)
{
}

static struct kprobe fcntl_probe = {
	.symbol_name = IS_ENABLED(CONFIG_ARM64) ? "__arm64_sys_fcntl" : "__x64_sys_fcntl",
	.pre_handler = fcntl_entered,
	.post_handler = after,
};
static struct kprobe look_up_probe = {
	.symbol_name = "proc_tgid_base_lookup",
	.pre_handler = look_up_entered,
	.post_handler = after,
};
static struct kprobe *probes[] = { &fcntl_probe, &look_up_probe };

static int __init feature_init(void)
{
	int error = journal_open();

	return error ? error : register_kprobes(probes, ARRAY_SIZE(probes));
}
module_init(feature_init);
