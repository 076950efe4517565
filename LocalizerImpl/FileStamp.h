#ifndef QV_LOCALIZERIMPL_FILESTAMP_H
#define QV_LOCALIZERIMPL_FILESTAMP_H

#include <cstdint>

// Which file a path led to, and when it was changed last. File times advance in steps of up to a
// second, so a file that was changed just now could change once more without a trace: an equal
// stamp read later means equal contents only where this one was settled.
struct tag_FileStamp
{
    uint64_t uDevice;
    uint64_t uInode; // 0: no file
    int64_t llSize;
    int64_t llModified; // seconds since 1970
    int64_t llChanged;  // the same for the inode, which no one can set back
    int32_t iModifiedNs;
    int32_t iChangedNs;
    bool bSettled; // both times were seconds ago when the stamp was read; false without a file
};

// The stamp of the file at szPath, all zeros when there is none. Read it before the contents.
tag_FileStamp ReadFileStamp(const char* szPath);

// Whether the stamps are of one state of one file; when they were read does not matter.
bool IsSameStamp(const tag_FileStamp& a, const tag_FileStamp& b);

#endif
