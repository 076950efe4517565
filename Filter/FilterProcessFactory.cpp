#include "Filter/FilterProcessFactory.h"

#include "Filter/FilterKinds.h"

FilterProcess* FilterProcessFactory::CreateFilterProcess()
{
    FilterProcess* pFirst = nullptr;
    for (int k = FILTER_KIND_NUM - 1; k >= 0; --k)
    {
        FilterProcess* pProcess = FILTER_KINDS[k].pfnMakeProcess();
        if (pProcess == nullptr)
        {
            delete pFirst;
            return nullptr;
        }
        pProcess->m_pNext = pFirst;
        pFirst = pProcess;
    }
    return pFirst;
}
