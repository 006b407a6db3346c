/**
 * \file
 * System services, by the library's names for them: "fileindexd" and "samba" (the file-sharing service). A
 * platform maps the names to its own.
 *
 * The library holds a lock for which others wait no more than 30 ms: every call is bounded to ten seconds,
 * whatever the service does. Negative on failure, with the platform error set: VORK_ERR_NO_SUCH_SERVICE for an
 * unknown service, VORK_ERR_TIMEOUT for one that took longer (its start may still succeed), VORK_ERR_SERVICE for
 * one that refused. Under systemd, which writes down why, these two are VORK_ERR_UNIT_TIMEOUT and
 * VORK_ERR_UNIT_FAILED, or VORK_ERR_UNIT_MASKED for a unit that is masked.
 */
#ifndef VORK_SERVICE_H
#define VORK_SERVICE_H

#pragma GCC visibility push(default)
#ifdef __cplusplus
extern "C" {
#endif

/** Starts the service and enables it at boot (`flag` 1). One that runs already is no failure. */
int VLIBServiceStart(const char *szName, int flag);

/** Asks the service to stop, without waiting for it (an init script is waited for), and disables it at boot
 * (`flag` 1). One that does not run is no failure. */
int VLIBServiceStop(const char *szName, int flag);

/** Makes the service read its settings anew by restarting it. "samba" is left alone when it does not run, where
 * that can be told. */
int VLIBServiceRestart(const char *szName);

#ifdef __cplusplus
}
#endif
#pragma GCC visibility pop

#endif
