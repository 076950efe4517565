#ifndef QV_MEMMANAGER_RESULTSET_H
#define QV_MEMMANAGER_RESULTSET_H

#include "Core/Records/SearchRecords.h"
#include "MemManager/MemManger.h"

#include <memory>
#include <new>

// A set of iNum entries that are not filled yet; null if an allocation fails. *pbArrayFailed tells
// whether it was the array's.
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

// A result set of the store manager, released with the scope unless it was handed on.
class CResultOwner
{
public:
    explicit CResultOwner(CMemManger& manager) : m_manager(manager) {}
    ~CResultOwner()
    {
        if (m_pResult != nullptr)
        {
            m_manager.FreeSearchResult(m_pResult);
        }
    }
    CResultOwner(const CResultOwner&) = delete;
    CResultOwner& operator=(const CResultOwner&) = delete;

    tag_LocalizerResult* Get() const { return m_pResult; }
    tag_LocalizerResult** Receive() { return &m_pResult; }
    tag_LocalizerResult* Detach()
    {
        tag_LocalizerResult* pResult = m_pResult;
        m_pResult = nullptr;
        return pResult;
    }

    // Whether there is a set and at least half of its array is used: worth handing on as it is.
    bool IsDense() const { return m_pResult != nullptr && m_bDense; }
    void SetDense(bool bDense) { m_bDense = bDense; }

private:
    CMemManger& m_manager;
    tag_LocalizerResult* m_pResult = nullptr;
    bool m_bDense = false;
};

#endif
