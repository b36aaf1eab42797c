/* A tool in C that names nothing but the table: prints each row and what parses through it. */

#include <inttypes.h>
#include <stdio.h>

#include "morwick/morwick.h"

static void PrintEntries(const ContextNode *name, const ContextNode *value) {
  for (; name != NULL; name = name->next, value = value->next) {
    printf(" %s=%" PRIu64, name->text, value->value);
  }
}

int main(void) {
  static const unsigned char words[] = {50, 0, 0, 0, 1, 0, 0, 0, 7, 0, 0, 0, 0, 0, 0, 0};
  static const unsigned char msp[] = {0, 16, 4, 0, 6, 0, 0, 0};
  for (const NandExporter *row = nand_exporters; row->className != NULL; ++row) {
    const SelectorGetter getters[] = {
        row->getStatsSelectors,          row->getMSPStatsSelectors,
        row->getDefectsListSelectors,    row->getTelemetryListSelectors,
        row->getTaskSchedulerSelectors,  row->getSnapshotSelectors,
        row->getSnapshotHeaderSelectors, row->getBandStatsSelectors};
    printf("%s:", row->className);
    for (int i = 0; i < 8; ++i) {
      if (getters[i] != NULL)
        printf(" %" PRIu32 "/%" PRIu32, getters[i]()->first, getters[i]()->second);
    }
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
