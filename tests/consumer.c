/* A tool in C: parses a buffer through a row of the table and prints the entries. */

#include <inttypes.h>
#include <stdio.h>

#include "morwick/morwick.h"

int main(void) {
  static const unsigned char buffer[] = {
      4,  0, 0, 0, 1, 0, 0, 0, 0xe8, 3, 0, 0, 0, 0, 0, 0, /* key 4, one word: 1000 */
      50, 0, 0, 0, 1, 0, 0, 0, 7,    0, 0, 0, 0, 0, 0, 0, /* key 50, one word: 7 */
  };
  KVRStatsCxt context = {0};
  const NandExporter *row = &nand_exporters[2];
  if (row->parseBufferToCxt(&context, buffer, sizeof buffer) != 1) return 1;
  printf("%s\n", row->className);
  const ContextNode *value = context.valuesHead;
  for (const ContextNode *name = context.namesHead; name != NULL; name = name->next) {
    printf("%s = %" PRIu64 "\n", name->text, value->value);
    value = value->next;
  }
  printf("%" PRIu32 " pages\n", context.pagesPerVirtualBlock);
  row->releaseContext(&context);
  return context.namesHead == NULL ? 0 : 1;
}
