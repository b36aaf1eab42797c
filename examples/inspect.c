/*
 * Reads the statistics and the snapshot header of the first controller. Prints the values of the
 * statistics and how they end, and whether the header is whole. The status is 1 when one of them
 * cannot be read or trusted.
 *
 *     cc inspect.c $(pkg-config --cflags --libs morwick) -o inspect
 */
#include <inttypes.h>
#include <stdio.h>

#include "morwick/morwick.h"

/* By MorwickStep. */
static const char *const kEnds[] = {"",
                                    "right after a record",
                                    "at an end record",
                                    "at a key that cannot be",
                                    "at a record that is cut",
                                    "in a header that is cut"};

/* Prints the values and returns 0 when the records end well. */
static int InspectStatistics(const MorwickBuffer *dump) {
  MorwickRecordReader reader;
  MorwickRecord record;
  MorwickStartRecords(&reader, kMorwickKVR, dump->bytes, dump->size);
  while (MorwickNextRecord(&reader, &record)) {
    for (uint32_t i = 0; i < record.valueCount; ++i) {
      char name[kMorwickNameRoom];
      MorwickValueName(reader.stream, record.key, record.valueCount, i, name);
      printf("%s %" PRIu64 "\n", name, MorwickValue(&record, i));
    }
  }
  printf("%" PRIu64 " bytes of statistics, which end %s\n", record.offset, kEnds[record.step]);
  return record.step == kMorwickEndOfBuffer ? 0 : 1;
}

static int InspectHeader(const MorwickBuffer *header) {
  char wrong[kMorwickHeaderTextRoom];
  const MorwickHeaderFault fault = MorwickCheckSnapshotHeader(header->bytes, header->size, wrong);
  printf("the snapshot header is %s\n", fault == kMorwickHeaderIsWhole ? "whole" : wrong);
  return fault == kMorwickHeaderIsWhole ? 0 : 1;
}

/* Reads a buffer, if the class has it, and inspects it. Returns 0 when all is well. */
static int Inspect(const KVRConnection *controller, SelectorGetter getSelectors,
                   int (*inspect)(const MorwickBuffer *buffer)) {
  MorwickBuffer buffer;
  if (getSelectors == NULL) return 0;
  const MorwickReadResult result =
      MorwickReadBuffer(controller->connection, controller->exporter, getSelectors(), &buffer);
  if (result != kMorwickRead) {
    fprintf(stderr, "reading failed (%d), result 0x%" PRIx32 "\n", (int)result,
            (uint32_t)buffer.result);
  }
  const int status = result == kMorwickRead ? inspect(&buffer) : 1;
  MorwickFreeBuffer(&buffer);
  return status;
}

int main(void) {
  KVRConnection controller = {0};
  if (!openKVRConnection(&controller)) return 1;
  int status = Inspect(&controller, controller.exporter->getStatsSelectors, InspectStatistics);
  status |= Inspect(&controller, controller.exporter->getSnapshotHeaderSelectors, InspectHeader);
  closeKVRConnection(&controller);
  return status;
}
