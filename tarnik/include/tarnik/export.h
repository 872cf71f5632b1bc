#ifndef TARNIK_EXPORT_H
#define TARNIK_EXPORT_H

/// Marks what libtarnik.so exports; everything else stays hidden.
#define TARNIK_EXPORT __attribute__((visibility("default")))

#endif
