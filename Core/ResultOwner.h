#ifndef QV_CORE_RESULTOWNER_H
#define QV_CORE_RESULTOWNER_H

#include "Core/SearchRecords.h"
#include "MemManager/MemManger.h"

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

    // Whether a set is there whose array is worth handing on, little of it being spare.
    bool IsDense() const { return m_pResult != nullptr && m_bDense; }
    void SetDense(bool bDense) { m_bDense = bDense; }

private:
    CMemManger& m_manager;
    tag_LocalizerResult* m_pResult = nullptr;
    bool m_bDense = false;
};

#endif
