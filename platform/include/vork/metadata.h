/**
 * \file
 * The hidden directories in which the system keeps data about files, "@eaDir".
 */
#ifndef VORK_METADATA_H
#define VORK_METADATA_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/** 1 when the single path component is the name of a hidden metadata directory, otherwise 0. */
int VORKEAIsHiddenDir(const char *szName);

/**
 * Makes the metadata directory `szPath` (absolute; its parent exists) if it is missing. 0 when it is there
 * afterwards; negative, with the platform error set, otherwise. `flags` is 0.
 *
 * The share around it may belong to its users, and services trust what they find here. So it is the superuser's:
 * the directory is made by him only, with mode 0755 whatever the umask, and one that is another's, or that others
 * may write to, becomes his with the same mode, together with the event queue and the database directory in it.
 * For everybody else the question only finds what is there, and fails with VORK_ERR_ACCESS when that is nothing.
 *
 * A link or a file in its place is an error (VORK_ERR_EXISTS), and nothing behind a link is touched: none is
 * followed in the share, whatever its users exchange meanwhile.
 */
int VORKEAMKDir(int flags, const char *szPath);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
