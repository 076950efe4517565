#include "LocalizerImpl/FileStamp.h"

#include <algorithm>
#include <ctime>
#include <sys/stat.h>

namespace
{

constexpr int64_t SETTLED_AFTER_SECONDS = 2; // a step of the file times and what rounding hides

} // namespace

tag_FileStamp ReadFileStamp(const char* szPath)
{
    struct stat info = {};
    if (stat(szPath, &info) != 0)
    {
        return {};
    }
    tag_FileStamp stamp = {};
    stamp.uDevice = info.st_dev;
    stamp.uInode = info.st_ino;
    stamp.llSize = info.st_size;
    stamp.llModified = info.st_mtim.tv_sec;
    stamp.llChanged = info.st_ctim.tv_sec;
    stamp.iModifiedNs = static_cast<int32_t>(info.st_mtim.tv_nsec);
    stamp.iChangedNs = static_cast<int32_t>(info.st_ctim.tv_nsec);
    const int64_t llLatest = std::max(stamp.llModified, stamp.llChanged);
    stamp.bSettled = std::time(nullptr) - llLatest >= SETTLED_AFTER_SECONDS;
    return stamp;
}

bool IsSameStamp(const tag_FileStamp& a, const tag_FileStamp& b)
{
    return a.uDevice == b.uDevice && a.uInode == b.uInode && a.llSize == b.llSize &&
           a.llModified == b.llModified && a.llChanged == b.llChanged &&
           a.iModifiedNs == b.iModifiedNs && a.iChangedNs == b.iChangedNs;
}
