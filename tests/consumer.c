/*
 * A tool, in C or C++, made of the examples in the public headers, which tests/install_test.sh
 * extracts. Reads a snapshot, a dump and a snapshot header, one after the other, from standard
 * input. Prints the exporter table, what the examples make of the three, and what the controller
 * reports.
 */

#include <inttypes.h>
#include <stdio.h>
#include <stdlib.h>

#include "morwick/morwick.h"

static void PrintRecords(const char *dump, uint64_t size) {
#include "records.example"
}

static void PrintFields(const char *header, const char *record) {
#include "snapshot_fields.example"
}

#ifndef __cplusplus  // where malloc's result needs a cast
static void PrintSnapshot(const char *header, const char *snapshot, uint64_t snapshotSize) {
#include "snapshot.example"
}
#endif

static int PrintController(void) {
  KVRStatsCxt statistics = {0};
#include "controller.example"
  printf("%s: version %" PRIu32 ", host reads %" PRIu64 ", band erases %" PRIu64 "\n",
         row->className, statistics.exportVersion, statistics.hostReads, statistics.bandErases);
  row->releaseContext(&statistics);
  return 0;
}

int main(void) {
  // The sizes of the example files; the header may be smaller.
  static char snapshot[120 * sizeof(SnapshotRecord)], dump[256], header[4096];
  fread(snapshot, 1, sizeof snapshot, stdin);
  const uint64_t size = fread(dump, 1, sizeof dump, stdin);
  fread(header, 1, sizeof header, stdin);
  for (const NandExporter *row = nand_exporters; row->className != NULL; ++row) {
    printf("%s %" PRId32 " %" PRIu32 " %" PRIu32 " %s\n", row->className, row->exporterParamA,
           row->methodSelector, row->exporterParamB, row->matchKey);
  }
  PrintRecords(dump, size);
  PrintFields(header, snapshot);
#ifndef __cplusplus
  PrintSnapshot(header, snapshot, sizeof snapshot);
#endif
  // The platform is a library of its own, which a tool may call too.
  if (GetMatchingService(ServiceMatching("NoSuchController")) != 0) return 1;
  return PrintController();
}
