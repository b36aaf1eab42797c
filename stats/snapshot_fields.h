// The fields of snapshot records, read from descriptors: those of a header, or those of the fixed
// layout, which stand here.
#ifndef STATS_SNAPSHOT_FIELDS_H
#define STATS_SNAPSHOT_FIELDS_H

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <optional>
#include <string_view>

#include "morwick/little_endian.h"
#include "morwick/snapshot.h"
#include "stats/print_format.h"

namespace morwick {

constexpr uint32_t kNumberSize = sizeof(uint32_t);
constexpr uint32_t kTripleSize = sizeof(SnapshotOperations);
static_assert(kFormatRoom == sizeof SnapshotFieldDescriptor::format);

// One field of the records.
struct Field {
  enum Kind : uint8_t { kNumber, kThousandths, kPriorities, kNothing };

  Kind kind = kNothing;
  uint64_t offset = 0;
  uint32_t priorities = 0;  // kPriorities only
  PrintFormat format;
};

// A number of a triple, in print order. The label has the letter in place of %s.
struct TriplePart {
  const char *letter;
  uint32_t offset;  // in the triple
  uint32_t width;   // the fewest characters
};
inline constexpr TriplePart kTripleParts[] = {
    {"O", offsetof(SnapshotOperations, count), 4},
    {"L", offsetof(SnapshotOperations, totalLatency), 7},
    {"M", offsetof(SnapshotOperations, maxLatency), 5},
};

// The arguments that the format of such a field may use.
constexpr Arguments ArgumentsOf(Field::Kind kind) {
  if (kind == Field::kThousandths) return Arguments::kTwoNumbers;
  if (kind == Field::kPriorities) return Arguments::kOneText;
  return Arguments::kOneNumber;
}

// The field of a descriptor. Its kind is kNothing when the descriptor has an unknown kind, a field
// outside the record, or a bad format.
constexpr Field ReadField(const SnapshotFieldDescriptor &descriptor, uint32_t recordSize) {
  constexpr Field::Kind kKinds[] = {Field::kNumber, Field::kNumber, Field::kThousandths,
                                    Field::kPriorities};
  Field field;
  field.kind = descriptor.kind < std::size(kKinds) ? kKinds[descriptor.kind] : Field::kNothing;
  field.offset = descriptor.fieldOffset;
  field.priorities = descriptor.fieldSize / kTripleSize;
  // Labels alone: nothing is read, wherever the offset points.
  if (field.kind == Field::kPriorities && field.priorities == 0) field.offset = 0;

  const uint64_t size =
      field.kind == Field::kPriorities ? uint64_t{field.priorities} * kTripleSize : kNumberSize;
  const std::string_view room(descriptor.format, kFormatRoom);
  const std::string_view format = room.substr(0, room.find('\0'));
  if (field.offset + size > recordSize || format.size() == kFormatRoom) return {};
  const std::optional<PrintFormat> read = ReadPrintFormat(format, ArgumentsOf(field.kind));
  if (!read) return {};
  field.format = *read;
  return field;
}

// The text before the numbers of that part: the format with the letter in place of %s.
constexpr FormatText TripleLabel(const Field &field, const TriplePart &part) {
  FormatText label = field.format.texts[0];
  if (field.format.conversionCount == 0) return label;
  label.characters[label.length++] = part.letter[0];
  const FormatText &rest = field.format.texts[1];
  label.length += rest.view().copy(&label.characters[label.length], rest.length);
  return label;
}

// The descriptors of a header, which must be whole.
class DescriptorTable {
 public:
  explicit DescriptorTable(const uint8_t *header)
      : DescriptorTable(
            header + LoadLittleEndian32(header + offsetof(SnapshotHeader, descriptorTableOffset)),
            LoadLittleEndian32(header + offsetof(SnapshotHeader, recordSize))) {}

  uint32_t count() const { return count_; }
  uint32_t OffsetAt(uint32_t index) const {
    return LoadLittleEndian32(At(index) + offsetof(SnapshotFieldDescriptor, fieldOffset));
  }

  Field Read(uint32_t index) const {
    const uint8_t *bytes = At(index);
    SnapshotFieldDescriptor descriptor = {};
    descriptor.kind = LoadLittleEndian16(bytes);
    descriptor.fieldOffset = OffsetAt(index);
    descriptor.fieldSize = LoadLittleEndian32(bytes + offsetof(SnapshotFieldDescriptor, fieldSize));
    std::copy_n(bytes + offsetof(SnapshotFieldDescriptor, format), kFormatRoom, descriptor.format);
    return ReadField(descriptor, recordSize_);
  }

  // Whether the field that tells an empty record lies in the records at all.
  bool TellsEmptyRecords() const {
    return count_ > 0 && uint64_t{OffsetAt(0)} + kNumberSize <= recordSize_;
  }

  // A record is empty when its first described field is 0, whatever the kind of that field.
  bool IsEmpty(const uint8_t *record) const {
    return LoadLittleEndian32(record + OffsetAt(0)) == 0;
  }

 private:
  DescriptorTable(const uint8_t *table, uint32_t recordSize)
      : descriptors_(table + sizeof(SnapshotDescriptorTable)),
        count_(LoadLittleEndian32(table)),
        recordSize_(recordSize) {}

  const uint8_t *At(uint32_t index) const {
    return descriptors_ + sizeof(SnapshotFieldDescriptor) * size_t{index};
  }

  const uint8_t *descriptors_;
  uint32_t count_;
  uint32_t recordSize_;
};

// A field of the fixed layout, and its column where that name says more than the label.
struct FixedField {
  SnapshotFieldDescriptor descriptor;
  std::string_view column = {};
};

// The fixed layout, in print order. Its text and the columns of all tools are made from it.
#define FIELD(name) offsetof(SnapshotRecord, name), sizeof(SnapshotRecord::name)
inline constexpr FixedField kFixedFields[] = {
    {{0, 0, FIELD(timestamp), "T=%04u"}},
    {{0, 0, FIELD(erasedBands), " E=%02u"}},
    {{0, 0, FIELD(hostReads), " HR=%4u"}},
    {{0, 0, FIELD(hostWrites), " HW=%4u"}},
    {{0, 0, FIELD(nandReads), " NR=%4u"}},
    {{0, 0, FIELD(nandWrites), " NW=%4u"}},
    {{2, 0, FIELD(hysteresisTime), " TH=%8u.%02u"}, "TH_us"},  // the text has milliseconds
    {{0, 0, FIELD(collectedSectors), " GC=%4u"}},
    {{0, 0, FIELD(wearLevelBands), " W=%2u"}},
    {{0, 0, FIELD(intermediatePendingErase), " BI=%3u"}},
    {{0, 0, FIELD(userPendingErase), " BU=%3u"}},
    {{0, 0, FIELD(freeNodes), " V=%5u"}},
    {{0, 0, FIELD(bufferFragments), " BF=%2u"}, "BF_fragments"},
    {{0, 0, FIELD(bufferHighWater), "/%2u"}, "BF_high_water"},
    {{0, 0, FIELD(preemptPercent), " P=%2u"}},
    {{0, 0, FIELD(qosDelaysNormal), " H=%2u"}, "H_normal"},
    {{0, 0, FIELD(qosDelaysExtreme), "/%2u"}, "H_extreme"},
    {{0, 0, FIELD(expeditesSucceeded), " X=%2u"}, "X_succeeded"},
    {{0, 0, FIELD(expeditesFailed), "/%2u"}, "X_failed"},
    {{0, 0, FIELD(oldestCommandAge), " L=%3u"}, "L_age"},
    {{0, 0, FIELD(qosInterval), "/%3u"}, "L_interval"},
    {{0, 0, FIELD(commandTagsMin), " C=%2u"}, "C_min"},
    {{0, 0, FIELD(commandTagsMax), "/%2u"}, "C_max"},
    {{0, 0, FIELD(freeSegments), " S=%4u"}},
    {{0, 0, FIELD(hostUnmaps), " U=%8u"}},
    {{3, 0, FIELD(reads), " R%s="}},
    {{3, 0, FIELD(writes), " W%s="}},
};
#undef FIELD

constexpr size_t kUnprinted =
    sizeof(SnapshotRecord::unprinted1) + sizeof(SnapshotRecord::unprinted2) +
    sizeof(SnapshotRecord::unprinted3) + sizeof(SnapshotRecord::unprinted4) +
    sizeof(SnapshotRecord::unprinted5) + sizeof(SnapshotRecord::unprinted6);
static_assert(
    [] {
      size_t size = kUnprinted;
      for (const FixedField &field : kFixedFields) size += field.descriptor.fieldSize;
      return size == sizeof(SnapshotRecord);
    }(),
    "a member of SnapshotRecord has no row");

constexpr Field FixedFieldAt(size_t index) {
  // A copy: with UndefinedBehaviorSanitizer GCC cannot compare a global's address at compile time.
  const SnapshotFieldDescriptor descriptor = kFixedFields[index].descriptor;
  return ReadField(descriptor, sizeof(SnapshotRecord));
}

}  // namespace morwick

#endif
