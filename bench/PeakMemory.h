#ifndef QV_BENCH_PEAKMEMORY_H
#define QV_BENCH_PEAKMEMORY_H

#include <cstddef>

// Counts what the program holds at the allocator (malloc and new alike), mappings aside.
class CPeakMemory
{
public:
    // Starts counting from what is held now.
    static void Restart();
    // The most that was held at one time since Restart, above what was held then.
    static size_t PeakBytes();
};

#endif
