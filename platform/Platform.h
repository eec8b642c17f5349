#ifndef TALO_PLATFORM_PLATFORM_H
#define TALO_PLATFORM_PLATFORM_H

// Marks an operation that the platform library supplies. A port compiles with
// hidden visibility and exports exactly what these headers declare.
#define TALO_PLATFORM __attribute__((visibility("default")))

#endif
