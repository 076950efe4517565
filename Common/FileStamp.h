#ifndef QV_COMMON_FILESTAMP_H
#define QV_COMMON_FILESTAMP_H

#include <cstdint>

// Which file a path led to, and when it was changed last. Two equal stamps mean equal contents
// where the later one was settled when it was read.
struct tag_FileStamp
{
    uint64_t uDevice;
    uint64_t uInode; // 0: no file
    int64_t llSize;
    int64_t llModified; // seconds since 1970
    int64_t llChanged;  // the same for the inode, which no one can set back
    int32_t iModifiedNs;
    int32_t iChangedNs;
};

// The stamp of the file at szPath, all zeros when there is none. Read it before the contents.
tag_FileStamp ReadFileStamp(const char* szPath);

bool IsSameStamp(const tag_FileStamp& a, const tag_FileStamp& b);

// Whether any change from now on will show in the stamp: file times advance in steps, of up to a
// second, so a file changed just now could change once more without a trace. False without a file.
bool IsSettled(const tag_FileStamp& stamp);

#endif
