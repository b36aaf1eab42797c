/* A tool in C that names nothing but the table: prints each row and what parses through it. */

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

int main(void) {
  static const unsigned char words[] = {50, 0, 0, 0, 1, 0, 0, 0, 7, 0, 0, 0, 0, 0, 0, 0};
  static const unsigned char msp[] = {0, 16, 4, 0, 6, 0, 0, 0};
  for (const NandExporter *row = nand_exporters; row->className != NULL; ++row) {
    printf("%s:", row->className);
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
  return 0;
}
