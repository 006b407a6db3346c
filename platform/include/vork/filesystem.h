/**
 * \file
 * File systems: type, mount points, snapshots. None of these may hang on a dead network server: below a network
 * mount nothing is looked at, so a path there is taken to exist and its links are not followed. Above it, links
 * are followed and automounts are not triggered.
 */
#ifndef VORK_FILESYSTEM_H
#define VORK_FILESYSTEM_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/** The code that the library treats as never indexable: kernel pseudo file systems (proc, sysfs, cgroup, ...). */
#define VORK_FS_TYPE_PSEUDO 12

/**
 * The type code of the file system that holds the path, -1 when it cannot be told (the path does not exist, for
 * one, or its type is not in the platform's table). The codes are the platform's own; `flags` is 0.
 */
int VORKGetFSType(const char *szPath, int flags);

/** Non-zero for the codes of network file systems. */
int VORKFSIsRemoteFS(int type);

/** Non-zero for the codes of image file systems: read-only images and loop mounts of files kept in a share. */
int VORKFSIsImageFS(int type);

/**
 * 1 when the path is the root of a mount, 0 when not, negative on failure. 0 also for the directory of a share: a
 * disk of its own is what many shares have, and no reason to leave one out.
 */
int VORKFSDirIsMntPoint(const char *szPath);

/**
 * 0 with `*pInSnapshot` 1 or 0; negative when it cannot be told. The path need not be a directory. A share whose
 * own directory lies in a writable snapshot (after a restore) is live.
 */
int VLIBFhsPathInSnapshot(const char *szPath, int *pInSnapshot);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
