/*
 * The exporter table: one row for each storage-controller driver class that the library knows, with
 * the numbers and functions that suit the class. A tool finds its row once (connection.h) and calls
 * everything else through it, so that the rest of the tool does not depend on the controller.
 */
#ifndef MORWICK_EXPORTER_H
#define MORWICK_EXPORTER_H

#include <stdint.h>

#include "morwick/export.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef struct GenericParserCxt GenericParserCxt;
typedef struct KVRStatsCxt KVRStatsCxt;

/* The numbers of one kind of controller request. In each pair of the library the two are equal. */
typedef struct SelectorPair {
  uint32_t first;
  uint32_t second;
} SelectorPair;

/* Returns the address of one of the global pairs below, the same one on every call. */
typedef SelectorPair *(*SelectorGetter)(void);

/*
 * Parsers append to a zero-filled context that the caller owns and hands to the release function of
 * the same row afterwards. `size` is the buffer's size in bytes.
 */
typedef int (*KVRStatsParser)(KVRStatsCxt *ctx, const void *buffer, uint32_t size);
typedef void (*KVRStatsRelease)(KVRStatsCxt *ctx);
typedef uint64_t (*MSPStatsParser)(GenericParserCxt *ctx, const void *buffer, uint64_t size);
typedef uint32_t (*FTLStatsParser)(GenericParserCxt *ctx, const void *buffer, uint32_t size);
typedef void (*GenericParserRelease)(GenericParserCxt *ctx);

/*
 * One row. A function pointer is null where the class lacks the function: test it before a call. In
 * the terminating row every field is zero or null.
 */
typedef struct NandExporter {
  const char *className;   /* the driver class that searches look for; null in the last row only */
  const char *matchKey;    /* for tools; no search in the library reads it */
  uint32_t connection;     /* written by findNandExporterNew only */
  uint32_t service;        /* written by findNandExporterNew only */
  int32_t exporterParamA;  /* for tools, as is exporterParamB; the library reads neither */
  uint32_t methodSelector; /* driver method of the task-scheduler request */
  uint32_t exporterParamB;

  SelectorGetter getStatsSelectors;
  SelectorGetter getMSPStatsSelectors; /* of classes that have MSP statistics */
  SelectorGetter getDefectsListSelectors;
  SelectorGetter getTelemetryListSelectors;
  SelectorGetter getTaskSchedulerSelectors;
  SelectorGetter getSnapshotSelectors;
  SelectorGetter getSnapshotHeaderSelectors;
  SelectorGetter getBandStatsSelectors;

  KVRStatsParser parseBufferToCxt;
  KVRStatsRelease releaseContext; /* frees what parseBufferToCxt added */
  MSPStatsParser mspParseBufferToCxt;
  FTLStatsParser ftlParseBufferToCxt;
  GenericParserRelease releaseGenericParserCxt; /* frees what the MSP and FTL parsers added */
} NandExporter;

/*
 * The rows in search order, then the terminating row, then room for classes to come: the linker may
 * give a program its own copy of the table, so the size must never change. Reading needs no lock;
 * only findNandExporterNew writes to it (two handle fields), and it must not run on two threads at
 * once.
 */
MORWICK_EXPORT extern NandExporter nand_exporters[16];

/* The request numbers, initialised statically and never written by the library. */
MORWICK_EXPORT extern SelectorPair statsSelector;
MORWICK_EXPORT extern SelectorPair mspStatsSelector;
MORWICK_EXPORT extern SelectorPair bandStatsSelector;
MORWICK_EXPORT extern SelectorPair defectsListSelector;
MORWICK_EXPORT extern SelectorPair telemetryListSelectors;
MORWICK_EXPORT extern SelectorPair taskSchedulerSelectors;
MORWICK_EXPORT extern SelectorPair snapshotSelectors;
MORWICK_EXPORT extern SelectorPair snapshotHeaderSelectors;

/* Each returns the address of its global pair. Callable from any thread. */
MORWICK_EXPORT SelectorPair *KVRGetStatsSelectors(void);
MORWICK_EXPORT SelectorPair *KVRMSPGetStatsSelectors(void);
MORWICK_EXPORT SelectorPair *KVRGetBandStatsSelectors(void);
MORWICK_EXPORT SelectorPair *KVRGetDefectsListSelectors(void);
MORWICK_EXPORT SelectorPair *KVRGetTelemetryListSelectors(void);
MORWICK_EXPORT SelectorPair *KVRGetTaskSchedulerSelectors(void);
MORWICK_EXPORT SelectorPair *KVRGetSnapshotSelectors(void);
MORWICK_EXPORT SelectorPair *KVRGetSnapshotHeaderSelectors(void);

#ifdef __cplusplus
}
#endif

#endif
