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
 * afterwards; negative, with the platform error set, otherwise. A link in its place is an error. `flags` is 0.
 */
int VORKEAMKDir(int flags, const char *szPath);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
