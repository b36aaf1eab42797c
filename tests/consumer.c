/*
 * A tool in C, or in C++, that names nothing but the table: prints each row and what parses through
 * it, then what the controller that is found reports.
 */

#include <inttypes.h>
#include <stdio.h>

#include "morwick/morwick.h"

static void PrintSelectors(SelectorGetter getter) {
  if (getter != NULL) printf(" %" PRIu32 "/%" PRIu32, getter()->first, getter()->second);
}

static void PrintEntries(const ContextNode *name, const ContextNode *value) {
  for (; name != NULL; name = name->next, value = value->next) {
    printf(" %s=%" PRIu64, name->text, value->value);
  }
}

static void PrintRow(const NandExporter *row) {
  static const unsigned char words[] = {50, 0, 0, 0, 1, 0, 0, 0, 7, 0, 0, 0, 0, 0, 0, 0};
  static const unsigned char msp[] = {0, 16, 4, 0, 6, 0, 0, 0};
  printf("%s: %" PRId32 " %" PRIu32 " %" PRIu32 " %s:", row->className, row->exporterParamA,
         row->methodSelector, row->exporterParamB, row->matchKey);
  PrintSelectors(row->getStatsSelectors);
  PrintSelectors(row->getMSPStatsSelectors);
  PrintSelectors(row->getDefectsListSelectors);
  PrintSelectors(row->getTelemetryListSelectors);
  PrintSelectors(row->getTaskSchedulerSelectors);
  PrintSelectors(row->getSnapshotSelectors);
  PrintSelectors(row->getSnapshotHeaderSelectors);
  PrintSelectors(row->getBandStatsSelectors);
  KVRStatsCxt statistics = {0};
  row->parseBufferToCxt(&statistics, words, sizeof words);
  PrintEntries(statistics.namesHead, statistics.valuesHead);
  row->releaseContext(&statistics);
  GenericParserCxt context = {0};
  row->ftlParseBufferToCxt(&context, words, sizeof words);
  if (row->mspParseBufferToCxt != NULL) row->mspParseBufferToCxt(&context, msp, sizeof msp);
  PrintEntries(context.namesHead, context.valuesHead);
  row->releaseGenericParserCxt(&context);
  printf("\n");
}

static int PrintController(void) {
  static unsigned char buffer[64 * 1024];
  KVRConnection controller = {0};
  if (openKVRConnection(&controller) == 0) return 1;
  const NandExporter *row = controller.exporter;
  const uint32_t command = row->getStatsSelectors()->second;
  unsigned char request[24] = {0};
  for (int i = 0; i < 4; ++i) request[i] = (unsigned char)(command >> (8 * i));
  size_t size = sizeof buffer;
  const int32_t failure = CallStructMethod(controller.connection, row->methodSelector, request,
                                           sizeof request, buffer, &size);
  KVRStatsCxt statistics = {0};
  const int parsed = failure == 0 ? row->parseBufferToCxt(&statistics, buffer, (uint32_t)size) : 0;
  printf("%s: result %d, version %" PRIu32 ", host reads %" PRIu64 ", band erases %" PRIu64 "\n",
         row->className, parsed, statistics.exportVersion, statistics.hostReads,
         statistics.bandErases);
  row->releaseContext(&statistics);
  closeKVRConnection(&controller);
  return parsed == 1 ? 0 : 1;
}

int main(void) {
  printf("morwick %d.%d.%d %s\n", MORWICK_VERSION_MAJOR, MORWICK_VERSION_MINOR,
         MORWICK_VERSION_PATCH, MORWICK_VERSION_TEXT);
  for (const NandExporter *row = nand_exporters; row->className != NULL; ++row) PrintRow(row);
  return PrintController();
}
