// Appends to the two entry lists at the beginning of each parser context, and frees them. `Context`
// is GenericParserCxt or KVRStatsCxt.
#ifndef STATS_ENTRY_LIST_H
#define STATS_ENTRY_LIST_H

#include <cstdlib>
#include <cstring>
#include <new>
#include <string_view>

#include "morwick/little_endian.h"
#include "morwick/parser_context.h"
#include "stats/decimal.h"

namespace morwick {

constexpr size_t kLongestText = 98;  // as parser_context.h promises
static_assert(sizeof(ContextNode::text) >= kLongestText + 1);
static_assert(sizeof(ContextNode::text) >= kDecimalRoom);

// All zeros. It is defined in another file, so that the compiler copies it with eight stores. Where
// the compiler sees zeros it uses `rep stos`, which takes longer than both allocations.
extern const ContextNode kEmptyNode;

// A name node that is in no list. The name node of each entry starts as a copy of it, which costs
// less than clearing a node and copying a text of varying length into it.
class EntryName {
 public:
  // A name that is too long for a node is cut.
  explicit EntryName(std::string_view name) { Append(name); }

  EntryName(std::string_view prefix, std::string_view name) : EntryName(prefix) { Append(name); }

  const ContextNode &node() const { return node_; }

  // Appends an element's index to the name in a copy of the node. Most arrays have fewer than a
  // hundred elements: writing two digits by hand saves a twentieth of an entry's time.
  void AppendIndex(ContextNode *copy, uint32_t index) const {
    char *end = copy->text + length_;
    if (index >= 100 || length_ > kLongestText - 2) {
      char digits[8];
      const char *digitsEnd = WriteShortDecimal(digits, index);
      std::string_view(digits, digitsEnd).copy(end, kLongestText - length_);
    } else if (index >= 10) {
      end[0] = static_cast<char>('0' + index / 10);
      end[1] = static_cast<char>('0' + index % 10);
    } else {
      end[0] = static_cast<char>('0' + index);
    }
  }

 private:
  void Append(std::string_view text) {
    length_ += text.copy(node_.text + length_, kLongestText - length_);
  }

  ContextNode node_ = kEmptyNode;
  size_t length_ = 0;
};

// Appends one entry and returns its name node. Without a context, or without memory for both nodes,
// it adds nothing and returns null.
template <typename Context>
ContextNode *AppendEntry(Context *ctx, const EntryName &name, uint64_t value) {
  if (ctx == nullptr) return nullptr;
  void *valueMemory = std::malloc(sizeof(ContextNode));
  void *nameMemory = std::malloc(sizeof(ContextNode));
  if (valueMemory == nullptr || nameMemory == nullptr) {
    std::free(valueMemory);
    std::free(nameMemory);
    return nullptr;
  }
  auto *valueNode = new (valueMemory) ContextNode(kEmptyNode);
  auto *nameNode = new (nameMemory) ContextNode(name.node());
  WriteDecimal(valueNode->text, value);
  valueNode->value = value;

  if (ctx->namesTail != nullptr && ctx->valuesTail != nullptr) {
    ctx->namesTail->next = nameNode;
    ctx->valuesTail->next = valueNode;
  } else {
    ctx->namesHead = nameNode;
    ctx->valuesHead = valueNode;
  }
  ctx->namesTail = nameNode;
  ctx->valuesTail = valueNode;
  return nameNode;
}

// An unsigned little-endian integer of up to 8 bytes, zero-extended.
inline uint64_t LoadElement(const uint8_t *bytes, uint32_t width) {
  if (width == 8) return LoadLittleEndian64(bytes);
  if (width == 4) return LoadLittleEndian32(bytes);
  uint8_t padded[8] = {};
  std::memcpy(padded, bytes, width);
  return LoadLittleEndian64(padded);
}

// Appends one entry for each element of at most 8 bytes. Its name is `name` and the index, or
// `name` alone when there is only one element. False when memory was refused for an element; the
// others are still added.
template <typename Context>
bool AppendElements(Context *ctx, const EntryName &name, const uint8_t *bytes, uint32_t width,
                    uint32_t count) {
  bool allAdded = true;
  for (uint32_t index = 0; index < count; ++index, bytes += width) {
    ContextNode *node = AppendEntry(ctx, name, LoadElement(bytes, width));
    if (node == nullptr) {
      allAdded = false;
    } else if (count > 1) {
      name.AppendIndex(node, index);
    }
  }
  return allAdded;
}

// Frees the node and returns the next one. Null: returns null.
inline ContextNode *FreeNode(ContextNode *node) {
  if (node == nullptr) return nullptr;
  ContextNode *next = node->next;
  // Fetched early, because it is often not in the cache: saves a tenth of the time of large parses.
  if (next != nullptr) __builtin_prefetch(&next->next);
  std::free(node);
  return next;
}

// Frees the two lists side by side, in the order in which their nodes were allocated. If they were
// freed one after the other, the heap would scatter the nodes of later parses: large ones would
// take six times as long.
template <typename Context>
void FreeEntries(Context *ctx) {
  ContextNode *names = ctx->namesHead;
  ContextNode *values = ctx->valuesHead;
  while (names != nullptr || values != nullptr) {
    values = FreeNode(values);
    names = FreeNode(names);
  }
}

}  // namespace morwick

#endif
