// Finds the first controller that is present and opens and closes connections to its driver.

#include "morwick/connection.h"

#include <cstdio>

#include "morwick/controller.h"
#include "morwick/platform.h"

uint32_t findNandExporter(NandExporter **row) {
  if (row == nullptr) return 0;
  for (*row = nand_exporters; (*row)->className != nullptr; ++*row) {
    if (const uint32_t service = MorwickFindService(*row); service != 0) {
      std::printf("Morwick: findNandExporter: Controller found: %s\n", (*row)->className);
      return service;
    }
  }
  return 0;
}

int findNandExporterNew(NandExporter **row) {
  if (row == nullptr) return 0;
  for (*row = nand_exporters; (*row)->className != nullptr; ++*row) {
    const uint32_t service = MorwickFindService(*row);
    if (service == 0) continue;
    uint32_t connection = 0;
    if (OpenService(service, kNandConnectionType, &connection) == 0) {
      // The prefix differs, so that a log tells which of the two searches found the controller.
      std::printf("Morwick_drel: findNandExporterNew: Controller found: %s\n", (*row)->className);
      (*row)->connection = connection;
      (*row)->service = service;
      return 1;
    }
    // A driver that fails may still have set a handle. If not, CloseService refuses 0.
    CloseService(connection);
    ReleaseObject(service);
  }
  return 0;
}

void ReleaseIOInterfaces(NandExporter *row) {
  if (row == nullptr) return;
  if (row->connection != 0) CloseService(row->connection);
  if (row->service != 0) ReleaseObject(row->service);
}

uint32_t TolkConnect(NandExporter **row) {
  if (row == nullptr) return 0;
  const uint32_t service = findNandExporter(row);
  if (service == 0) {
    std::fputs("No class found", stderr);  // the caller's text continues the line
    return 0;
  }
  uint32_t connection = 0;
  const int32_t result = OpenService(service, kNandConnectionType, &connection);
  ReleaseObject(service);
  if (result != 0) {
    std::fprintf(stderr, "OpenService failed for class '%s', result 0x%x\n", (*row)->className,
                 static_cast<uint32_t>(result));
    return 0;
  }
  return connection;
}

void TolkDisconnect(uint32_t connection) {
  if (CloseService(connection) != 0) {
    std::fputs("closing connection to service failed\n", stderr);
  }
}

int openKVRConnection(KVRConnection *record) {
  if (record == nullptr) return 0;
  record->service = findNandExporter(&record->exporter);
  if (record->service == 0) {
    std::fputs("Can't get KVR Connection, no matching service!\n", stderr);
  } else {
    // TolkConnect searches again: the driver may have gone, or another one may now come first.
    record->connection = TolkConnect(&record->exporter);
    if (record->exporter->getStatsSelectors == KVRGetStatsSelectors && record->connection != 0) {
      return 1;
    }
    std::fputs("Can't get KVR Connection!\n", stderr);
  }
  closeKVRConnection(record);
  return 0;
}

void closeKVRConnection(KVRConnection *record) {
  if (record == nullptr) return;
  if (record->connection != 0) CloseService(record->connection);
  record->connection = 0;
  if (record->service != 0) ReleaseObject(record->service);
  record->service = 0;
}
