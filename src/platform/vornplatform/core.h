/**
 * The core platform library, libvorncore: programs, key=value files, locks, containers, services.
 * Strings are NUL-terminated bytes. No function throws.
 */
#ifndef VORNPLATFORM_CORE_H
#define VORNPLATFORM_CORE_H

#include <cstdio>

extern "C" {

/* Programs. No shell is involved; variable arguments end with a null pointer. */

/**
 * Runs a program to completion. The program name is not repeated among the arguments.
 * @return 0 the program exited with 0; negative it failed, died or could not be run.
 */
int VLIBCExec(const char* path, ...) __attribute__((sentinel));

/**
 * Runs a system script and waits for it.
 * @param options  option word of the platform's standard way of running a script, 0xBB.
 * @return 0 success; anything else failure.
 */
int VLIBCExecl(const char* path, int options, ...) __attribute__((sentinel));

/**
 * Runs a program with an argument vector whose first element is the program path.
 * @param wait  1: wait for the program.
 * @return 0 success; anything else failure (a null path or vector included).
 */
int VLIBCExecv(const char* path, const char* const argv[], int wait);

/**
 * Starts a program with its standard output readable through the stream.
 * @param mode  "r" or "rB".
 * @return a stream for VLIBCPclose(), or null.
 */
FILE* VLIBCPopen(const char* path, const char* mode, ...) __attribute__((sentinel));

/** Closes the stream and waits. @return 0 or the program's wait status. */
int VLIBCPclose(FILE* stream);

/* Files of key=value lines. */

/** Copies a value, without enclosing double quotes. @return negative: no file or no such key. */
int VLIBCFileGetKeyValue(const char* path, const char* key, char* value, int size, int flags);

/** Replaces the key's line or appends one; makes the file when missing. @return negative: failed.
 */
int VLIBCFileSetKeyValue(const char* path, const char* key, const char* value, int flags);

struct VLIBCSzHash;

/**
 * Writes every key of one hash and deletes every key of another in one edit.
 * @param remove  may be null.
 * @param format  line format, "%s=%s\n".
 * @return negative: failed, the file is as it was.
 */
int VLIBCFileSetKeys(const char* path, VLIBCSzHash* set, VLIBCSzHash* remove, const char* format);

/** Deletes the key's line. @return negative: failed. */
int VLIBCFileRemoveKey(const char* path, const char* key);

/** @return 1 the key holds exactly that value; anything else: it does not. */
int VLIBCFileCheckKeyValue(const char* path, const char* key, const char* value, int flags);

/** @return 1 the path exists, 0 it does not. */
int VLIBCFileExist(const char* path);

/** @return non-zero: an existing directory. */
int VLIBCFileCheckDir(const char* path);

/* Locks and errors. */

/**
 * Takes the lock on a file.
 * @param mode     1 exclusive.
 * @param seconds  how long to wait for it.
 * @param handle   set to -1 by the caller; receives the handle to unlock with.
 * @return negative: not taken.
 */
int VLIBCFileLockTimeByFile(const char* path, int mode, int seconds, int* handle);

/** Releases the lock. @return negative: failed. */
int VLIBCFileUnlockByFile(int handle);

/** Takes the platform's file lock of that word, waiting up to the seconds. @return -1: not taken.
 */
int VLIBCFileLock(int lockWord, int seconds);

/** Releases what VLIBCFileLock() took. @return -1: failed. */
int VLIBCFileUnlock(int lockWord);

/** Records the platform's last error for the caller's caller. */
void VLIBCErrSetEx(int code, const char* file, int line);

/* Strings and containers. */

/** A string list; its item count comes first and is read directly. */
struct VLIBCSzList {
    int nItem;
};

VLIBCSzHash* VLIBCSzHashAlloc(int size);
/** Copies key and value into the hash, which may move. @return negative: failed. */
int VLIBCSzHashSetValue(VLIBCSzHash** hash, const char* key, const char* value);
void VLIBCSzHashFree(VLIBCSzHash* hash);

VLIBCSzList* VLIBCSzListAlloc(int size);
/** @return the item, owned by the list, or null past its end. */
const char* VLIBCSzListGet(VLIBCSzList* list, int index);
void VLIBCSzListFree(VLIBCSzList* list);

/** Appends the pieces of the text between separators to the list, which may move. */
int VLIBCStrSep(const char* text, const char* separator, VLIBCSzList** list);
/** Copies the source without leading and trailing white space. */
int VLIBCStrTrimSpace(const char* source, char* destination);

/* Services. */

/** @return 1 the service runs, 0 it does not. */
int VLIBServiceIsRunning(const char* name);
/** @return negative: failed. */
int VLIBServiceStart(const char* name, int flags);
/** @return negative: failed. */
int VLIBServiceStop(const char* name, int flags);
/** @return negative: failed. */
int VLIBServiceRestart(const char* name);
}

#endif
