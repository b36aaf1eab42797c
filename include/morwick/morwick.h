/* Everything that libmorwick offers. */
#ifndef MORWICK_MORWICK_H
#define MORWICK_MORWICK_H

#include "morwick/capacity.h"
#include "morwick/connection.h"
#include "morwick/controller.h"
#include "morwick/error_message.h"
#include "morwick/exporter.h"
#include "morwick/ftl_stats.h"
#include "morwick/kvr_stats.h"
#include "morwick/little_endian.h"
#include "morwick/msp_stats.h"
#include "morwick/parser_context.h"
#include "morwick/platform.h"
#include "morwick/records.h"
#include "morwick/snapshot.h"
#include "morwick/snapshot_fields.h"
#include "morwick/snapshot_header.h"
#include "morwick/summary.h"

/*
 * The version of the library that these headers belong to. Programs that were built with it also
 * run with each later version of the same major number.
 */
#define MORWICK_VERSION_MAJOR 1
#define MORWICK_VERSION_MINOR 0
#define MORWICK_VERSION_PATCH 0
#define MORWICK_VERSION_TEXT "1.0.0"

#endif
