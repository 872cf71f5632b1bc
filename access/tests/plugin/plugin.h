#ifndef SSOCLIENT_ACCESS_TESTS_PLUGIN_PLUGIN_H
#define SSOCLIENT_ACCESS_TESTS_PLUGIN_PLUGIN_H

/// The only function that the plug-in exports. Gets tokens at `url` from a source whose functions,
/// callbacks and listener are code of the plug-in, stops the source while calls and refreshes are
/// under way, and releases it. Returns null, or what went wrong.
extern "C" __attribute__((visibility("default"))) const char* UseTokenSource(
    const char* url, const char* caPem, const char* signingPem);

#endif
