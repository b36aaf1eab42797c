/*
 * The platform contract: the driver registry, driver connections, the background-activity scheduler
 * and the system log. Library and daemon are written against it, tools call the driver through it,
 * and a port to another system implements it.
 *
 * PORTING. A platform is a folder under platform/ whose CMakeLists.txt makes the library target
 * `morwick-platform`, which defines every function below with C linkage. Configure with
 * -DMORWICK_PLATFORM=FOLDER; no other code of the tree names a platform. Of the tree a platform
 * includes this header and its own files. A folder's CMakeLists.txt that calls morwick_plain_cxx
 * builds it without exceptions and without run-time type information; in any case no exception may
 * leave a function. These tests run for any platform: the unit tests (they bring a platform of
 * their own), the header and export checks, the package tests, and the tests in tests/FOLDER/ if
 * there is one. platform/none/ is the smallest platform, without controllers; platform/simulated/
 * has some that are made up.
 *
 * THREADS. Driver calls and SystemLog may come from any thread, several at once. The comment of
 * each function of the activity says who calls it. No function may call back into the library but
 * through the handler that RegisterActivity was given.
 *
 * MEMORY. A function that is refused memory returns its failure and sets errno to ENOMEM; no other
 * failure does. Only SystemLog, RegisterActivity and RunMainQueue may end the process or change how
 * it handles signals: a tool must survive its search for a controller.
 */
#ifndef MORWICK_PLATFORM_H
#define MORWICK_PLATFORM_H

#include <stdbool.h>
#include <stddef.h>
#include <stdint.h>

#include "morwick/export.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef struct MatchingRequest MatchingRequest;
typedef struct Activity Activity;
typedef void (*ActivityHandler)(Activity *activity);
typedef enum ActivityCriteria { kActivityCheckIn } ActivityCriteria;

/* States of an activity that the daemon knows by number; a platform has others of its own. */
enum { kActivityStateRun = 2, kActivityStateDefer = 3 };

/*
 * The platform's own text for matching a service by property. It stands in the exporter table as
 * the `matchKey` of some classes, for tools to read: the library itself searches by class name
 * only. A platform with another text defines this macro in the build.
 */
#ifndef PLATFORM_PROPERTY_MATCH_KEY
#define PLATFORM_PROPERTY_MATCH_KEY "PropertyMatch"
#endif

/*
 * Drivers. Service and connection handles are unsigned numbers, 0 meaning none. Results are 0 for
 * success, anything else is the platform's own code. A handle that is not open, 0 included, is
 * refused with a result, never followed.
 */

/*
 * Builds a request for registered services of the driver class, a NUL-terminated text that is not
 * kept. Null when it cannot, or for a null pointer. The request belongs to the caller until
 * GetMatchingService takes it over.
 */
MORWICK_EXPORT MatchingRequest *ServiceMatching(const char *className);

/*
 * Consumes the request, whatever the result, and returns a handle of the first service that
 * matches, or 0. The caller gives it back with ReleaseObject. Null gets 0.
 */
MORWICK_EXPORT uint32_t GetMatchingService(MatchingRequest *request);

/*
 * Opens a connection of the given type (the library and the daemon know type 0 only) and stores its
 * handle, or 0 on failure, in `*connection`; the pointer is not null. The connection outlives the
 * service handle; the caller gives it back with CloseService.
 */
MORWICK_EXPORT int32_t OpenService(uint32_t service, uint32_t type, uint32_t *connection);

/* Closes the connection. A failure is reported, but the handle is closed in any case. */
MORWICK_EXPORT int32_t CloseService(uint32_t connection);

/* Gives back a service handle. */
MORWICK_EXPORT int32_t ReleaseObject(uint32_t service);

/*
 * Calls the driver method `selector` with `inputSize` bytes at `input`. The driver writes at most
 * `*replySize` bytes to `reply`, which is the caller's, and sets `*replySize` to what it wrote; a
 * reply that is longer is cut. A call that fails writes nothing to `reply` and sets `*replySize` to
 * 0, also when the handle is not open. Blocks until the controller has answered.
 *
 * The requests of the daemon and of tools are 24 bytes: two 32-bit numbers in the controller's byte
 * order, little-endian, and 16 zero bytes. The first number says what is asked for: it is `second`
 * of the SelectorPair (exporter.h). The second number is 1025 in a task-scheduler request, whose
 * reply is a 32-bit word, and 0 in a request for a buffer, whose reply is the buffer.
 */
MORWICK_EXPORT int32_t CallStructMethod(uint32_t connection, uint32_t selector, const void *input,
                                        size_t inputSize, void *reply, size_t *replySize);

/*
 * The background activity. The daemon registers one, on its main thread, before RunMainQueue; the
 * identifier is not kept beyond the call unless it is copied. The handler is called on one thread
 * of the platform's choosing at a time, not the main thread: once at check-in, in a state other
 * than run, then in the run state each time the activity is due. The platform decides when it is
 * due; the daemon has no schedule of its own.
 */
MORWICK_EXPORT void RegisterActivity(const char *identifier, ActivityCriteria criteria,
                                     ActivityHandler handler);

/* The activity's state. Called from its handler. */
MORWICK_EXPORT int GetActivityState(Activity *activity);

/* Whether the scheduler wants the running activity to yield now. Called from its handler. */
MORWICK_EXPORT bool ActivityShouldDefer(Activity *activity);

/*
 * Sets the activity's state. The daemon sets kActivityStateDefer in a run; the platform then runs
 * the activity again later. True when the platform accepted the state. Called from its handler.
 */
MORWICK_EXPORT bool SetActivityState(Activity *activity, int state);

/*
 * Tells the platform that the process may exit once it is idle; returns to the caller. Called from
 * the handler at the end of every run.
 */
MORWICK_EXPORT void ExitTransactionClean(void);

/* Gives the main thread to the platform, which runs the activity from then on; never returns. */
MORWICK_EXPORT void RunMainQueue(void) __attribute__((noreturn));

/*
 * Writes one message, formatted as printf does, to the system log at the default level. With that
 * level masked nothing is formatted. The text may bring a line end of its own. Never waits for a
 * reader of the log: a message without room is lost, and a later line tells how many were lost.
 */
MORWICK_EXPORT void SystemLog(const char *format, ...) __attribute__((format(printf, 1, 2)));

#ifdef __cplusplus
}
#endif

#endif
