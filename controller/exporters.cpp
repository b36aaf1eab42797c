// The exporter table and the request numbers, which all driver classes share.

#include <cstddef>

#include "morwick/exporter.h"
#include "morwick/ftl_stats.h"
#include "morwick/kvr_stats.h"
#include "morwick/msp_stats.h"
#include "morwick/platform.h"

SelectorPair statsSelector = {13, 13};
SelectorPair mspStatsSelector = {221, 221};
SelectorPair bandStatsSelector = {11, 11};
SelectorPair defectsListSelector = {15, 15};
SelectorPair telemetryListSelectors = {17, 17};
SelectorPair taskSchedulerSelectors = {39, 39};
SelectorPair snapshotSelectors = {22, 22};
SelectorPair snapshotHeaderSelectors = {145, 145};

SelectorPair *KVRGetStatsSelectors() { return &statsSelector; }
SelectorPair *KVRMSPGetStatsSelectors() { return &mspStatsSelector; }
SelectorPair *KVRGetBandStatsSelectors() { return &bandStatsSelector; }
SelectorPair *KVRGetDefectsListSelectors() { return &defectsListSelector; }
SelectorPair *KVRGetTelemetryListSelectors() { return &telemetryListSelectors; }
SelectorPair *KVRGetTaskSchedulerSelectors() { return &taskSchedulerSelectors; }
SelectorPair *KVRGetSnapshotSelectors() { return &snapshotSelectors; }
SelectorPair *KVRGetSnapshotHeaderSelectors() { return &snapshotHeaderSelectors; }

namespace {

// A row; the parameters are what differs between classes.
constexpr NandExporter Row(const char *className, const char *matchKey, int32_t exporterParamA,
                           uint32_t methodSelector, bool hasMSPStatistics = false) {
  return {
      .className = className,
      .matchKey = matchKey,
      .connection = 0,
      .service = 0,
      .exporterParamA = exporterParamA,
      .methodSelector = methodSelector,
      .exporterParamB = methodSelector,  // equal in every class so far
      .getStatsSelectors = KVRGetStatsSelectors,
      .getMSPStatsSelectors = hasMSPStatistics ? KVRMSPGetStatsSelectors : nullptr,
      .getDefectsListSelectors = KVRGetDefectsListSelectors,
      .getTelemetryListSelectors = KVRGetTelemetryListSelectors,
      .getTaskSchedulerSelectors = KVRGetTaskSchedulerSelectors,
      .getSnapshotSelectors = KVRGetSnapshotSelectors,
      .getSnapshotHeaderSelectors = KVRGetSnapshotHeaderSelectors,
      .getBandStatsSelectors = KVRGetBandStatsSelectors,
      .parseBufferToCxt = KVRParseBufferToCxt,
      .releaseContext = KVRReleaseContext,
      .mspParseBufferToCxt = hasMSPStatistics ? KVRMSPParseBufferToCxt : nullptr,
      .ftlParseBufferToCxt = KVRFTLParseBufferToCxt,
      .releaseGenericParserCxt = ReleaseGenericParserCxt,
  };
}

constexpr const char *kNVMeMatchKey = "Controller Characteristics";

}  // namespace

// Tools in other languages read rows by offset.
static_assert(offsetof(NandExporter, connection) == 2 * sizeof(void *));
static_assert(offsetof(NandExporter, methodSelector) == 2 * sizeof(void *) + 12);
static_assert(offsetof(NandExporter, releaseGenericParserCxt) + sizeof(void *) ==
              sizeof(NandExporter));

// In search order. constinit: the table must be whole before any code runs.
constinit NandExporter nand_exporters[16] = {
    Row("VeltoQRN3NVMeController", kNVMeMatchKey, -1, 9, /*hasMSPStatistics=*/true),
    Row("VeltoEmbeddedNVMeController", kNVMeMatchKey, -1, 9),
    Row("KVRStorage", PLATFORM_PROPERTY_MATCH_KEY, 5, 8),
};
