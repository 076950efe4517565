#ifndef QV_COMMON_EXPORT_H
#define QV_COMMON_EXPORT_H

// Marks what programs that link the library may use; everything else stays inside it.
#define QV_EXPORT __attribute__((visibility("default")))

// Marks members of such classes that only the library's own sources call.
#define QV_INTERNAL __attribute__((visibility("hidden")))

#endif
