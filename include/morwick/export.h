/* Marks what the shared library exports; everything without the mark stays inside it. */
#ifndef MORWICK_EXPORT_H
#define MORWICK_EXPORT_H

#define MORWICK_EXPORT __attribute__((visibility("default")))

#endif
