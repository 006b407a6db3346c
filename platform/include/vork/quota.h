/**
 * \file
 * Room on a volume.
 */
#ifndef VORK_QUOTA_H
#define VORK_QUOTA_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/**
 * Non-zero when the user may still write `cbRequired` bytes below the path. 0 when not, with the platform error
 * VORK_ERR_NO_SPACE or VORK_ERR_QUOTA, or when it cannot be told, with any other error.
 */
int VORKQuotaIsEnough(unsigned int uid, const char *szPath, unsigned long long cbRequired);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
