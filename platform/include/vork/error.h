/**
 * \file
 * The platform's last error: code, file and line of the place that set it. Kept per thread.
 */
#ifndef VORK_ERROR_H
#define VORK_ERROR_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/** Codes. The library knows the first three by value; the others are this platform's. */
enum {
    VORK_ERR_BAD_PARAMETER = 0x0D00,
    VORK_ERR_NO_SPACE = 0x2900,
    VORK_ERR_QUOTA = 0x2400,

    VORK_ERR_NOT_FOUND = 0x0700,
    VORK_ERR_EXISTS = 0x0701, /**< something else stands in the place */
    VORK_ERR_ACCESS = 0x0800,
    VORK_ERR_IO = 0x0900,
    VORK_ERR_TIMEOUT = 0x0A00,
    VORK_ERR_MALFORMED = 0x0B00,
    VORK_ERR_REGISTRATIONS = 0x0B01, /**< what the notification daemon's registrations are kept in is malformed */
    VORK_ERR_NO_SUCH_SHARE = 0x1400,
    VORK_ERR_SHARE_DIRECTORY_NAME = 0x1401, /**< a share whose directory does not bear its name */
    VORK_ERR_NO_SUCH_SERVICE = 0x1500,
    VORK_ERR_SERVICE = 0x1501,
    VORK_ERR_UNIT_FAILED = 0x1502,  /**< systemd refused, or the unit failed: its journal tells */
    VORK_ERR_UNIT_MASKED = 0x1503,  /**< the administrator has masked the unit */
    VORK_ERR_UNIT_TIMEOUT = 0x1504, /**< systemd has not done it in time, and may still do it */
    VORK_ERR_EXEC = 0x1600
};

/** The code last set in this thread; 0 before the first. Success does not reset it. */
int VLIBCErrGet(void);

/** Sets the code, and where: `szFile` is not copied and has to live for ever (a literal). */
void VLIBCErrSetEx(int code, const char *szFile, int line);

/** The file in which the code was set; never null. */
const char *VLIBCErrorGetFile(void);

/** The line in which the code was set. */
int VLIBCErrorGetLine(void);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
