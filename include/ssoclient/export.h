#ifndef SSOCLIENT_EXPORT_H
#define SSOCLIENT_EXPORT_H

/// Marks what libssoclient.so exports; everything else is hidden.
#define SSOCLIENT_EXPORT __attribute__((visibility("default")))

#endif
