/**
 * \file
 * Shared folders: what the library asks of the platform about them.
 *
 * A share is known by its name, unique and compared byte for byte, and its directory, which bears the share's
 * name: the library builds full paths from the directory above it and the share path. A platform that allows
 * other directories refuses such shares here.
 */
#ifndef VORK_SHARE_H
#define VORK_SHARE_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/** A share's record. The library reads the name and the path. */
typedef struct _tag_VORKSHARE {
    const char *szName;   /**< the share's name */
    unsigned int fStatus; /**< the platform's flags */
    const char *szPath;   /**< the share's directory, absolute, without a trailing "/" */
    /* a platform may append fields */
} VORKSHARE;

/**
 * Looks a share up by name. 0, with a record in `*ppShare` that the caller releases with VORKShareFree; negative,
 * with `*ppShare` untouched and the platform error set, when there is no such share (VORK_ERR_NO_SUCH_SHARE), its
 * directory has another name (VORK_ERR_SHARE_DIRECTORY_NAME), its record is damaged (VORK_ERR_MALFORMED) or the
 * name cannot be one component of a path (VORK_ERR_BAD_PARAMETER).
 *
 * When the platform's configuration cannot be read, lookups answer from what it was last, and the platform error
 * tells, also beside a success.
 *
 * Called once for each folder of each loaded configuration: it has to be quick (microseconds) with a thousand
 * shares.
 */
int VORKShareGet(const char *szName, struct _tag_VORKSHARE **ppShare);

/** Releases a record. Null is allowed. */
void VORKShareFree(struct _tag_VORKSHARE *pShare);

/**
 * Finds the share that holds a full path (the innermost, where shares are nested) and writes its name and its
 * directory, NUL-terminated. The path need not exist; it is compared byte for byte on component boundaries, so
 * links and ".." are not looked through. Negative when no share holds it or a buffer is too short.
 */
int VORKShareNamePathGet(const char *szFullPath, char *szName, int cbName, char *szPath, int cbPath);

/** Non-zero when the full path is a share's recycle bin or lies in one; 0 otherwise and on any failure. */
int VORKShareIsShareRecycle(const char *szFullPath);

/** 0 with `*pEncrypted` 1 when the share is encrypted and locked now, 0 when its files can be read. */
int VLIBShareIsEncryptedGet(const struct _tag_VORKSHARE *pShare, int *pEncrypted);

/** 0 with `*pEncryption` 1 when the share is of the encrypted kind, locked or not. */
int VLIBShareIsEncryptionGet(const struct _tag_VORKSHARE *pShare, int *pEncryption);

/** 0 with `*pReadOnly` 1 when index data cannot be written in the share's directory. */
int VLIBShareIsReadOnlyGet(const struct _tag_VORKSHARE *pShare, int *pReadOnly);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
