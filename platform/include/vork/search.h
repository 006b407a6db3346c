/**
 * \file
 * The search setting of the file-sharing service: whether clients may search the index.
 */
#ifndef VORK_SEARCH_H
#define VORK_SEARCH_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/** Non-zero when the setting is on, 0 when it is off or cannot be read. */
int VORKSMBIsEnableSpotlight(void);

/** Stores the setting; it takes effect when the service is restarted. Negative on failure, with the platform
 * error set and the setting as it was. Waits two seconds at most for another writer (VORK_ERR_TIMEOUT). */
int VORKSMBSetSpotlight(int enable);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
