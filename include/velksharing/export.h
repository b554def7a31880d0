#ifndef VELKSHARING_EXPORT_H
#define VELKSHARING_EXPORT_H

/// Marks what libvelksharing offers; everything else stays hidden.
#define VELK_EXPORT __attribute__((visibility("default")))

#endif
