#ifndef VELK_EXPORT_H
#define VELK_EXPORT_H

/// Marks what a shared library of the platform offers; everything else stays hidden.
#define VELK_PLATFORM_API __attribute__((visibility("default")))

#endif
