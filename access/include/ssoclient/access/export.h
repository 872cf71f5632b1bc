#ifndef SSOCLIENT_ACCESS_EXPORT_H
#define SSOCLIENT_ACCESS_EXPORT_H

/// Marks what libssoclient-access.so exports; everything else is hidden.
#define SSOCLIENT_ACCESS_EXPORT __attribute__((visibility("default")))

#endif
