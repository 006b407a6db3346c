/**
 * \file
 * Comparing names as people do.
 */
#ifndef VORK_TEXT_H
#define VORK_TEXT_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/**
 * Compares two NUL-terminated texts with case folded over Unicode: below 0, 0 or above 0. A strict weak order for
 * any bytes: text that is not UTF-8 has its place too.
 */
int VLIBCUnicodeUTF8StrCaseCmp(const char *a, const char *b);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
