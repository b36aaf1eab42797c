/*
 * Finding the first storage controller that is present and connecting to its driver.
 *
 * Handles are unsigned numbers, 0 meaning none. Messages go to standard output (controller found)
 * and standard error (failures), never to the system log. A null pointer where a record or a row
 * pointer is due gets 0, or nothing done, without a message.
 *
 * Threads: no function here takes a lock. findNandExporterNew writes to the shared table and must
 * not run on two threads at once; the others change only what the caller passes in.
 */
#ifndef MORWICK_CONNECTION_H
#define MORWICK_CONNECTION_H

#include <stdint.h>

#include "morwick/export.h"
#include "morwick/exporter.h"

#ifdef __cplusplus
extern "C" {
#endif

/* The type of every connection that library and daemon open; OpenService (platform.h) takes it. */
enum { kNandConnectionType = 0 };

/*
 * Filled by openKVRConnection. The record is the caller's, who fills it with zeros before its first
 * use; closeKVRConnection gives its handles back.
 */
typedef struct KVRConnection {
  uint32_t service;
  uint32_t connection;
  NandExporter *exporter;
} KVRConnection;

/*
 * Finds the first row whose driver is registered, sets `*row` to it and says so on standard output.
 * Returns the service handle, which the caller gives back with ReleaseObject (platform.h).
 * Returns 0 in silence when no driver is registered; `*row` is then the terminating row.
 */
MORWICK_EXPORT uint32_t findNandExporter(NandExporter **row);

/*
 * Finds the first row whose driver is registered and can be opened; a driver that refuses is passed
 * over for the next row. Returns 1 with `*row` set and both handles stored in the row, to be given
 * back with ReleaseIOInterfaces; returns 0 in silence with `*row` at the terminating row otherwise.
 * A driver that reports success but gives no handle is accepted: the row's connection is then 0.
 */
MORWICK_EXPORT int findNandExporterNew(NandExporter **row);

/*
 * Closes and releases the row's handles where they are not 0. The fields are not cleared: release a
 * row once for each successful findNandExporterNew.
 */
MORWICK_EXPORT void ReleaseIOInterfaces(NandExporter *row);

/*
 * Finds as findNandExporter does and opens a connection. Returns the connection handle, to be given
 * back with TolkDisconnect, or 0 after a message on standard error: "No class found", without a
 * line end, when there is no driver, and a line with the result code when the driver refuses. When
 * a driver reports success but gives no handle, returns 0 in silence. `*row` is always set.
 */
MORWICK_EXPORT uint32_t TolkConnect(NandExporter **row);

/* Closes the connection; a failure is one line on standard error. */
MORWICK_EXPORT void TolkDisconnect(uint32_t connection);

/*
 * Fills the record with the first controller's service and connection, by two searches: one as
 * findNandExporter does, for the service, and one as TolkConnect does, for the connection. Each
 * prints its line on standard output, and where a driver comes or goes in between they find two
 * different controllers; `exporter` is then the row of the second, which the connection is to.
 * Returns 1, or 0 after a message on standard error; the record's handles are then 0 and everything
 * obtained was given back. Close a record before it is opened again: its handles are overwritten,
 * except that a connection which it still holds is closed when no driver is found.
 */
MORWICK_EXPORT int openKVRConnection(KVRConnection *record);

/* Closes and releases the handles that are not 0 and sets them to 0; `exporter` stays as it is. */
MORWICK_EXPORT void closeKVRConnection(KVRConnection *record);

#ifdef __cplusplus
}
#endif

#endif
