/**
 * \file
 * Running programs and waiting for them: by argument vector, never through a shell. Programs are given by
 * absolute path. The child gets default signal dispositions (the library ignores SIGPIPE in its host), /dev/null
 * as its input and no descriptor but the standard three.
 *
 * A host that ignores SIGCHLD, or collects any child that ends, leaves no exit status to return: 0 then means
 * that the program ran to its end. A thread that is cancelled meanwhile ends after the program has.
 */
#ifndef VORK_PROCESS_H
#define VORK_PROCESS_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/**
 * Runs `szProgram` with up to four arguments (unused ones null; the first null ends the list) and waits for it.
 * Its exit status (0 is success), negative with VORK_ERR_EXEC when it could not be run or was ended by a signal.
 *
 * "/bin/rm" takes options and one absolute path, and works in shares only: the superuser removes there what users
 * could exchange for a link to something else in the meantime. The directory that holds the path's last name is
 * opened without following a link from the share's own directory downwards, must be the superuser's, and is rm's
 * working directory. Where that cannot be had, or the directory does not exist, nothing is run and the result
 * is 1.
 */
int VLIBCExec(const char *szProgram, const char *arg1, const char *arg2, const char *arg3, const char *arg4);

/**
 * Runs the program at `szPath` with the null-terminated vector `argv` (argv[0] included) and waits for it.
 * Result as VLIBCExec. `a` 1 sends the program's output to /dev/null, `b` is reserved and 0.
 */
int VLIBCExecv(const char *szPath, const char *const argv[], int a, int b);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
