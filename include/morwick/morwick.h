/* Everything that libmorwick offers. */
#ifndef MORWICK_MORWICK_H
#define MORWICK_MORWICK_H

#include "morwick/capacity.h"
#include "morwick/connection.h"
#include "morwick/error_message.h"
#include "morwick/exporter.h"
#include "morwick/ftl_stats.h"
#include "morwick/kvr_stats.h"
#include "morwick/msp_stats.h"
#include "morwick/parser_context.h"
#include "morwick/platform.h"
#include "morwick/snapshot.h"

#endif
