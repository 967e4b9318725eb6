/* The library's exported interface, as a host loads it at run time.
 *
 * All three functions have C linkage and the cdecl calling convention, may be
 * called from any thread, and never throw or end the calling thread.
 *
 *   _Run               starts the background processing thread (once; later
 *                      calls return the running thread's reference).
 *   _GetAlertCount     counts stored alerts matching a filter and a range.
 *   _RunRetentionProc  deletes alerts older than the configured retention.
 */
#ifndef ALERTSUMMARY_H_
#define ALERTSUMMARY_H_

#include <stddef.h> /* wchar_t for C hosts */

#ifdef _WIN32
#define ALERTSUMMARY_EXPORT __declspec(dllexport)
#define ALERTSUMMARY_CALL __cdecl
#else
#define ALERTSUMMARY_EXPORT __attribute__((visibility("default")))
#define ALERTSUMMARY_CALL
#endif

#ifdef __cplusplus
extern "C" {
#endif

ALERTSUMMARY_EXPORT void* ALERTSUMMARY_CALL _Run(void);
/* filter and range are zero-terminated wide texts; null reads as empty. */
ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _GetAlertCount(const wchar_t* filter, const wchar_t* range);
ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _RunRetentionProc(void);

#ifdef __cplusplus
}
#endif

#endif /* ALERTSUMMARY_H_ */
