/*
 * What the library and the daemon need from the platform they run on: the driver registry, driver
 * connections, the background-activity scheduler and the system log. Each folder beside this file
 * implements it for one platform; which one is linked in is a build option, and nothing outside
 * this folder knows.
 */
#ifndef PLATFORM_PLATFORM_H
#define PLATFORM_PLATFORM_H

#include <stdbool.h>
#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#define PLATFORM_EXPORT __attribute__((visibility("default")))

typedef struct MatchingRequest MatchingRequest;
typedef struct Activity Activity;
typedef void (*ActivityHandler)(Activity *activity);
typedef enum ActivityCriteria { kActivityCheckIn } ActivityCriteria;
enum { kActivityStateRun = 2, kActivityStateDefer = 3 };

/* The platform's own text for matching a service by property. */
#define PLATFORM_PROPERTY_MATCH_KEY "PropertyMatch"

/*
 * Drivers. Handles are unsigned numbers, 0 meaning none; results are 0 for success.
 */

/* Builds a request for services of the class, or null. GetMatchingService takes it over. */
PLATFORM_EXPORT MatchingRequest *ServiceMatching(const char *className);

/* Consumes the request; returns the first matching service, to be given to ReleaseObject, or 0. */
PLATFORM_EXPORT uint32_t GetMatchingService(MatchingRequest *request);

/* Opens a connection that outlives the service handle. On failure `*connection` is 0. */
PLATFORM_EXPORT int32_t OpenService(uint32_t service, uint32_t type, uint32_t *connection);
PLATFORM_EXPORT int32_t CloseService(uint32_t connection);
PLATFORM_EXPORT int32_t ReleaseObject(uint32_t service);

/* Writes at most `*replySize` bytes to `reply` and sets `*replySize` to what was written. */
PLATFORM_EXPORT int32_t CallStructMethod(uint32_t connection, uint32_t selector, const void *input,
                                         size_t inputSize, void *reply, size_t *replySize);

/*
 * The background activity. The handler is called on a thread of the platform's choosing: once at
 * check-in, in a state other than run, then in the run state each time the activity is due.
 */
PLATFORM_EXPORT void RegisterActivity(const char *identifier, ActivityCriteria criteria,
                                      ActivityHandler handler);
PLATFORM_EXPORT int GetActivityState(Activity *activity);

/* True when the scheduler wants the running activity to yield now. */
PLATFORM_EXPORT bool ActivityShouldDefer(Activity *activity);

/* With kActivityStateDefer: hands the activity back, to be run again later. */
PLATFORM_EXPORT bool SetActivityState(Activity *activity, int state);

/* Tells the platform that the process may exit once it is idle; returns to the caller. */
PLATFORM_EXPORT void ExitTransactionClean(void);

/* Gives the main thread to the platform; never returns. */
PLATFORM_EXPORT void RunMainQueue(void) __attribute__((noreturn));

/* One message at the default level. With that level masked nothing is formatted. */
PLATFORM_EXPORT void SystemLog(const char *format, ...) __attribute__((format(printf, 1, 2)));

#ifdef __cplusplus
}
#endif

#endif
