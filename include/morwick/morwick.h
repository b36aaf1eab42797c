/* Everything that libmorwick offers. */
#ifndef MORWICK_MORWICK_H
#define MORWICK_MORWICK_H

#include "morwick/connection.h"
#include "morwick/exporter.h"

#endif
