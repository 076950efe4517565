#ifndef QV_MEMMANAGER_RESULTSET_H
#define QV_MEMMANAGER_RESULTSET_H

#include "Core/SearchRecords.h"

#include <memory>
#include <new>

// A set of iNum entries that are not filled yet; null for want of memory. *pbArrayFailed tells
// which allocation it was.
inline tag_LocalizerResult* NewSet(int iNum, bool* pbArrayFailed)
{
    *pbArrayFailed = false;
    std::unique_ptr<tag_LocalizerResult> pSet(new (std::nothrow) tag_LocalizerResult());
    if (pSet == nullptr || iNum <= 0)
    {
        return pSet.release();
    }
    pSet->pDetail = new (std::nothrow) tag_LocalizerDetail[static_cast<size_t>(iNum)];
    if (pSet->pDetail == nullptr)
    {
        *pbArrayFailed = true;
        return nullptr;
    }
    pSet->iResultNum = iNum;
    return pSet.release();
}

#endif
