/*
 * The library's one error message. The first message of the process is stored, for good; later ones
 * change nothing.
 *
 * Threads: both functions may be called from any thread. When several report at once, one whole
 * message is stored.
 */
#ifndef MORWICK_ERROR_MESSAGE_H
#define MORWICK_ERROR_MESSAGE_H

#include "morwick/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/*
 * The stored message, or null before there is one. Read it through GetAPIErrorMessage, and never
 * change it: the message is set once and never freed or cleared. A tool that wants to know what is
 * wrong with each of many buffers asks the walk over their records (records.h).
 */
MORWICK_EXPORT extern char *GlobalAPIErrorMessage;

/*
 * Formats as printf does and stores at most 1023 characters. Without memory for them, or with a
 * null format, nothing is stored. If formatting fails, the text before the failure is stored.
 */
MORWICK_EXPORT void SetAPIErrorMessage(const char *format, ...)
    __attribute__((format(printf, 1, 2)));

/* The stored message, or "NA". The text is the library's; it lives until the process ends. */
MORWICK_EXPORT const char *GetAPIErrorMessage(void);

#ifdef __cplusplus
}
#endif

#endif
