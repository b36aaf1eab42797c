// The fields of snapshots, and the names that differ.

#include <gtest/gtest.h>

#include <cstring>
#include <sstream>

#include "morwick/morwick.h"
#include "tests/heap.h"

namespace {

using Descriptors = std::vector<SnapshotFieldDescriptor>;

std::string Header(uint32_t recordSize, const Descriptors &descriptors) {
  const uint32_t words[] = {9, 6, recordSize, 9, 9, 9, 37, 9, 9};
  std::string header(reinterpret_cast<const char *>(words), sizeof words);
  const uint32_t table[] = {static_cast<uint32_t>(descriptors.size()), 9};
  header.append(1, '\0').append(reinterpret_cast<const char *>(table), sizeof table);
  return header.append(reinterpret_cast<const char *>(descriptors.data()),
                       descriptors.size() * sizeof(SnapshotFieldDescriptor));
}

// Each field: kind, offset, priorities, and its names, with the column where it differs.
std::string FieldsOf(const void *header) {
  std::ostringstream text;
  MorwickSnapshotField field;
  RefuseAllocation(0);
  size_t allocations = 0;
  for (uint32_t i = 0; MorwickSnapshotFieldAt(header, i, &field) == 1; ++i, RefuseAllocation(0)) {
    allocations += AllocationCount();
    text << field.kind << ' ' << field.offset << ' ' << field.priorities;
    for (const auto &[label, column] : field.names) {
      if (*label != '\0') text << ' ' << label;
      if (std::strcmp(label, column) != 0) text << '=' << column;
    }
    text << '\n';
  }
  EXPECT_EQ(allocations, 0U) << "heap was used";
  return text.str();
}

std::string FieldsOf(uint32_t recordSize, const Descriptors &descriptors) {
  return FieldsOf(Unaligned(Header(recordSize, descriptors)).data() + 1);
}

constexpr char kFixedLayout[] = R"(1 0 0 T
1 104 0 E
1 108 0 HR
1 112 0 HW
1 116 0 NR
1 120 0 NW
2 156 0 TH=TH_us
1 124 0 GC
1 132 0 W
1 144 0 BI
1 148 0 BU
1 180 0 V
1 188 0 BF=BF_fragments
1 192 0 at_192=BF_high_water
1 4 0 P
1 164 0 H=H_normal
1 160 0 at_160=H_extreme
1 200 0 X=X_succeeded
1 204 0 at_204=X_failed
1 172 0 L=L_age
1 176 0 at_176=L_interval
1 212 0 C=C_min
1 216 0 at_216=C_max
1 168 0 S
1 208 0 U
3 56 4 RO RL RM
3 8 4 WO WL WM
)";

TEST(SnapshotFieldsTest, NamesTheFixedLayoutAndOthersAfterIt) {
  EXPECT_EQ(FieldsOf(nullptr), kFixedLayout);
  // Where the numbers lie does not matter; what stands before them does.
  EXPECT_EQ(FieldsOf(64, {{1, 9, 60, 0, "BF: %u"},
                          {0, 9, 8, 0, "/%3x"},
                          {0, 9, 12, 0, "/%u"},
                          {2, 9, 16, 0, "TH%u"},
                          {0, 9, 20, 0, " P%u"},
                          {0, 9, 24, 0, "/%u"},
                          {2, 9, 24, 0, "H=%u"},
                          {0, 9, 24, 0, "L%u"},
                          {2, 9, 44, 0, "/%u.%u"},
                          {0, 9, 28, 0, "C%u"},
                          {0, 9, 32, 0, " %u"},
                          {0, 9, 32, 0, "%sBF"},
                          {0, 9, 36, 0, "/%u"}}),
            "1 60 0 BF=BF_fragments\n1 8 0 at_8=BF_high_water\n1 12 0 at_12\n2 16 0 TH=TH_us\n"
            "1 20 0 P\n1 24 0 at_24\n2 24 0 H\n1 24 0 L=L_age\n2 44 0 at_44\n1 28 0 C=C_min\n1 "
            "32 0 at_32\n"
            "0 32 0\n1 36 0 at_36\n");
}

TEST(SnapshotFieldsTest, ReadsDescriptorsAsTheRenderingDoes) {
  EXPECT_EQ(FieldsOf(36, {{4, 9, 0xfffffffd, 0, "A%u"},
                          {0, 9, 33, 0, "A%u"},
                          {0, 9, 32, 0, "A"},
                          {2, 9, 32, 0, ""},
                          {3, 9, 32, 11, "A%s"},
                          {3, 9, 13, 24, "A%s"},
                          {0, 9, 32, 0, "A%n"},
                          {0, 9, 32, 0, "0123456789abcd%"},
                          {3, 9, 12, 35, " =A %% b%s c= "},
                          {3, 9, 8, 12, "+"},
                          {3, 9, 20, 12, "A_=%.0s"},
                          {0, 9, 0, 0, "=\xc3\xa4,\"%d"}}),
            "0 4294967293 0\n0 33 0\n0 32 0\n0 32 0\n0 32 0\n0 13 0\n0 32 0\n0 32 0\n"
            "3 12 2 A % bO c A % bL c A % bM c\n3 8 1 at_8 at_12 at_16\n"
            "3 20 1 A_=O A_=L A_=M\n1 0 0 \xc3\xa4\n");
  EXPECT_EQ(FieldsOf(36, {}), "");
  MorwickSnapshotField field = {};
  field.offset = 7;
  EXPECT_EQ(MorwickSnapshotFieldAt(nullptr, 27, &field) +
                MorwickSnapshotFieldAt(nullptr, 0xffffffff, &field) +
                MorwickSnapshotFieldAt(nullptr, 0, nullptr),
            0);
  EXPECT_EQ(field.offset, 7U);
}

TEST(SnapshotFieldsTest, GivesNoLabelTwice) {
  EXPECT_EQ(FieldsOf(64, {{0, 9, 4, 0, "X=%u"},
                          {0, 9, 8, 0, "X=%u"},
                          {0, 9, 60, 0, "/%u"},
                          {3, 9, 12, 12, "X"},
                          {0, 9, 24, 0, "Y%u"},
                          {0, 9, 24, 0, "Y_9%u"},
                          {0, 9, 24, 0, "Y%u"},
                          {0, 9, 24, 0, "Y_9%u"},
                          {0, 9, 24, 0, "Y_12x%u"},
                          {0, 9, 24, 0, "Y%u"},
                          {2, 9, 28, 0, "%u"},
                          {0, 9, 28, 0, "at_28=%u"},
                          {0, 9, 28, 0, "Y123%u"}}),
            "1 4 0 X=X_succeeded\n1 8 0 X_2\n1 60 0 at_60\n3 12 1 X_3 X_4 X_5\n1 24 0 Y\n1 24 0 "
            "Y_9\n1 24 0 Y_10\n"
            "1 24 0 Y_9_2\n1 24 0 Y_12x\n1 24 0 Y_11\n2 28 0 at_28\n1 28 0 at_28_2\n1 28 0 Y123\n");
}

}  // namespace
