// The generic parser context.

#include "morwick/parser_context.h"

#include "stats/entry_list.h"

namespace {

constexpr uint32_t kWidestElement = 8;  // bytes
constexpr uint32_t kMostElements = 65535;

}  // namespace

int AddSingleValueToGenericContext(GenericParserCxt *ctx, const char *prefix, const char *name,
                                   uint64_t value) {
  if (prefix == nullptr || name == nullptr) return 0;
  return morwick::AppendEntry(ctx, {prefix, name}, value) != nullptr ? 1 : 0;
}

int AddMultipleFieldsToGenericContext(GenericParserCxt *ctx, const char *fieldName, const void *src,
                                      uint32_t width, uint32_t count) {
  if (width == 0 || count == 0) return 1;
  if (fieldName == nullptr || src == nullptr) return 0;
  if (width > kWidestElement || count > kMostElements) return 0;
  const bool allAdded = morwick::AppendElements(ctx, morwick::EntryName(fieldName),
                                                static_cast<const uint8_t *>(src), width, count);
  return allAdded ? 1 : 0;
}

void ReleaseGenericParserCxt(GenericParserCxt *ctx) {
  if (ctx == nullptr) return;
  morwick::FreeEntries(ctx);
  *ctx = {};
}
