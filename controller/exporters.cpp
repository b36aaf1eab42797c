// The exporter table and the request numbers: what the library knows of each driver class.

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

// What all classes share; a row states only what is its own.
constexpr NandExporter Row(const char *className, const char *matchKey, int32_t paramA,
                           uint32_t methodSelector, SelectorGetter getMSPStatsSelectors,
                           MSPStatsParser mspParseBufferToCxt) {
  return {
      .className = className,
      .matchKey = matchKey,
      .connection = 0,
      .service = 0,
      .exporterParamA = paramA,
      .methodSelector = methodSelector,
      .exporterParamB = methodSelector,
      .getStatsSelectors = KVRGetStatsSelectors,
      .getMSPStatsSelectors = getMSPStatsSelectors,
      .getDefectsListSelectors = KVRGetDefectsListSelectors,
      .getTelemetryListSelectors = KVRGetTelemetryListSelectors,
      .getTaskSchedulerSelectors = KVRGetTaskSchedulerSelectors,
      .getSnapshotSelectors = KVRGetSnapshotSelectors,
      .getSnapshotHeaderSelectors = KVRGetSnapshotHeaderSelectors,
      .getBandStatsSelectors = KVRGetBandStatsSelectors,
      .parseBufferToCxt = KVRParseBufferToCxt,
      .releaseContext = KVRReleaseContext,
      .mspParseBufferToCxt = mspParseBufferToCxt,
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

// constinit: the table must be whole before any code runs.
constinit NandExporter nand_exporters[4] = {
    Row("VeltoQRN3NVMeController", kNVMeMatchKey, -1, 9, KVRMSPGetStatsSelectors,
        KVRMSPParseBufferToCxt),
    Row("VeltoEmbeddedNVMeController", kNVMeMatchKey, -1, 9, nullptr, nullptr),
    Row("KVRStorage", PLATFORM_PROPERTY_MATCH_KEY, 5, 8, nullptr, nullptr),
    {},
};
