#ifndef WEBAPI_APIEXPORT_H
#define WEBAPI_APIEXPORT_H

/// Marks what the library shows to its users. Everything else is hidden.
#define WEBAPI_EXPORT __attribute__((visibility("default")))

/// Marks the two functions that an API library exports to the framework.
#define WEBAPI_LIBRARY_EXPORT extern "C" __attribute__((visibility("default")))

#endif
