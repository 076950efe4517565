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

    // Whether a set is there whose array has room for exactly the entries it holds.
    bool IsExact() const { return m_pResult != nullptr && m_bExact; }
    void SetExact(bool bExact) { m_bExact = bExact; }

private:
    CMemManger& m_manager;
    tag_LocalizerResult* m_pResult = nullptr;
    bool m_bExact = false;
};

#endif
