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

#ifdef _WIN32
/* On Windows the host passes two of its application framework's
 * reference-counted string objects by value, and the export destroys them
 * (see src/entry/framework_string.h). As the callee sees them: on x86 each
 * argument is the object itself, a pointer to its UTF-16 characters; on x64
 * each is the address of the caller's temporary object, whose one member is
 * that pointer. A null pointer reads as the empty text. */
#if defined(_WIN64)
typedef wchar_t* const* AlertSummaryHostString;
#else
typedef wchar_t* AlertSummaryHostString;
#endif
ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _GetAlertCount(AlertSummaryHostString filter, AlertSummaryHostString range);
#else
/* Linux: zero-terminated wide texts (UTF-32), owned by the caller; null reads
 * as the empty text. */
ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _GetAlertCount(const wchar_t* filter, const wchar_t* range);
#endif
ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _RunRetentionProc(void);

#ifdef __cplusplus
}
#endif

#endif /* ALERTSUMMARY_H_ */
