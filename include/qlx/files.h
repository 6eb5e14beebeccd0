/**
 * @file
 * Files, paths and directories.
 *
 * Operations answer a CxStatus as those of qlx/system.h do: {'-', 0} for success, 22 for a null or
 * unfit argument, otherwise the system's error number of the call that failed. Two path functions
 * answer the bare error number. A name may use the backslash as separator where a comment says
 * "localized": each backslash then reads as "/", and of the name the first 256 characters count.
 * Pointers are borrowed for the call; an operation that fails leaves what it would have filled as
 * it was, unless its comment says otherwise. Nothing here takes a lock.
 */
#ifndef QLX_FILES_H
#define QLX_FILES_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/* ---- Open files: every operation takes the descriptor's address -------------------------- */

/**
 * Opens a file, with permission 0600 where that makes it. The descriptor is closed in a program
 * that the process starts.
 *
 * @param file   receives the descriptor, -1 on failure; null: 22
 * @param name   localized. Deliberate: null is tried as the empty name, which fails with 2
 * @param flags  as for open()
 */
QLX_API CxStatus CxFileOpen(CxFile *file, const char *name, int32_t flags);

/** As CxFileOpen(), with the caller's permission bits, less the process's file-creation mask. */
QLX_API CxStatus CxFileOpenMode(CxFile *file, const char *name, int32_t flags, uint32_t mode);

/**
 * Reads at most `length` bytes.
 *
 * @param count  receives the bytes read: 0 at the end of the file, -1 on failure
 */
QLX_API CxStatus CxFileRead(CxFile *file, void *buffer, uint32_t length, int32_t *count);

/**
 * Writes at most `length` bytes.
 *
 * @param count  receives the bytes written, which may be fewer than `length`; -1 on failure
 */
QLX_API CxStatus CxFileWrite(CxFile *file, const void *buffer, uint32_t length, int32_t *count);

/**
 * Goes to the start of the file. Deliberate: it moves to any place, but every place other than 0 is
 * reported as a failure, with the errno of the moment; of the offset the low 32 bits count, signed.
 *
 * @param origin  SEEK_SET, SEEK_CUR or SEEK_END
 */
QLX_API CxStatus CxFileSeek(CxFile *file, int64_t offset, int32_t origin);

/** Goes to the start and cuts the file to no bytes; 22 when it has some all the same. */
QLX_API CxStatus CxFileTrunc(CxFile *file);

/** @param size  receives the file's size in bytes */
QLX_API CxStatus CxFileGetSize(CxFile *file, int64_t *size);

/** Brings the data to the disk. */
QLX_API CxStatus CxFileFlush(CxFile *file);

/** Closes the file and sets the descriptor to -1, also when closing fails. */
QLX_API CxStatus CxFileClose(CxFile *file);

/* ---- Files by name ----------------------------------------------------------------------- */

/** @param name  not localized */
QLX_API CxStatus CxFileNameGetSize(const char *name, int64_t *size);

/** @param name  not localized; empty: 22 */
QLX_API CxStatus CxFileNameGetInfo(CxFileInfo *info, const char *name);

/** Removes a file or an empty directory. @param name  localized */
QLX_API CxStatus CxFileNameRemove(const char *name);

/** Renames; a file of the new name is replaced. Both names are localized. */
QLX_API CxStatus CxFileNameRename(const char *oldName, const char *newName);

/**
 * Copies a name with each backslash as "/": `length` bytes are written, the rest of them zero; a
 * name of `length` bytes or more leaves NO terminator.
 *
 * @return 1, or 0 for a null argument or a length of 0
 */
QLX_API uint8_t CxFileNameLocalize(const char *source, char *destination, uint32_t length);

/** As CxFileNameLocalize(), but a length of 0 is fine. */
QLX_API uint8_t CxFileNameGetNative(const char *source, char *destination, uint32_t length);

/* ---- Paths ------------------------------------------------------------------------------- */

/**
 * Fills a path from a text, which is localized.
 *
 * @return 1; 0 for a null record, a null text and one longer than 255 characters (the length is -1
 *         then)
 */
QLX_API uint8_t CxInitFilePath(CxFilePath *path, const char *text);

/**
 * @return an error number: 0 for a directory, 20 for anything else that exists, 22 for a null,
 * empty or invalid path, otherwise why it cannot be looked at (2: it does not exist)
 */
QLX_API int32_t CxFilePathIsDir(const CxFilePath *path);

/** @return an error number: 0 when the path exists; otherwise as CxFilePathIsDir() */
QLX_API int32_t CxFilePathExists(const CxFilePath *path);

/**
 * Fills a path with what stands before the last "/" of another, or of itself.
 *
 * @return 1; 0 when either is null, the source is invalid or has no "/" (the parent is untouched
 *         then)
 */
QLX_API uint8_t CxFilePathParent(const CxFilePath *path, CxFilePath *parent);

/**
 * Makes a directory and its missing parents.
 *
 * Deliberate: each gets exactly the permission bits `mode`, whatever the process's file-creation
 * mask; also one that another process made in the meantime. A missing directory directly under "/"
 * gives 22, because its parent is the empty path.
 *
 * @return an error number: 0 when the directory exists now, 20 when a file is in the way
 */
QLX_API int32_t CxFilePathMkdirs(const CxFilePath *path, uint32_t mode);

/* ---- Directories: every operation takes the handle's address ----------------------------- */

/**
 * Opens a directory for reading its names.
 *
 * @param directory  receives the handle, null on failure; null: 22
 * @param path       localized; 22 when null, longer than 255 characters or no existing directory
 */
QLX_API CxStatus CxDirectoryOpen(CxDirectory *directory, const char *path);

/**
 * Reads the next name, in no order; "." and ".." are among them.
 *
 * @param name    `length` + 1 bytes: receives at most `length` bytes of the name and a terminator;
 *                empty at the end, which is a success, and on every failure
 * @param length  bytes
 */
QLX_API CxStatus CxDirectoryGetNext(CxDirectory *directory, char *name, uint32_t length);

/** Closes the directory and sets the handle to null, also when closing fails. */
QLX_API CxStatus CxDirectoryClose(CxDirectory *directory);

QLX_END_DECLS

#endif
