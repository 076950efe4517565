#include "Filter/FilterProcessFactory.h"

#include <cstddef>
#include <new>

#include "Filter/AccountExpandFilterProcess.h"
#include "Filter/AccountFilterProcess.h"
#include "Filter/ContactIdExpandFilterProcess.h"
#include "Filter/FavouritesFilterProcess.h"
#include "Filter/GroupExpandFilterProcess.h"
#include "Filter/GroupFilterProcess.h"
#include "Filter/MailFilterProcess.h"
#include "Filter/OnlineFilterProcess.h"
#include "Filter/PhoneFilterProcess.h"
#include "Filter/PostalFilterProcess.h"

namespace
{

constexpr size_t PROCESS_NUM = 10;

using ProcessArray = FilterProcess* [PROCESS_NUM];

bool AreAllThere(const ProcessArray& apProcess)
{
    for (const FilterProcess* pProcess : apProcess)
    {
        if (pProcess == nullptr)
        {
            return false;
        }
    }
    return true;
}

void DeleteAll(const ProcessArray& apProcess)
{
    for (const FilterProcess* pProcess : apProcess)
    {
        delete pProcess;
    }
}

void Link(const ProcessArray& apProcess)
{
    for (size_t uIndex = 1; uIndex < PROCESS_NUM; ++uIndex)
    {
        apProcess[uIndex - 1]->m_pNext = apProcess[uIndex];
    }
}

} // namespace

FilterProcess* FilterProcessFactory::CreateFilterProcess()
{
    const ProcessArray apProcess = {
        new (std::nothrow) AccountFilterProcess,
        new (std::nothrow) AccountExpandFilterProcess,
        new (std::nothrow) GroupFilterProcess,
        new (std::nothrow) GroupExpandFilterProcess,
        new (std::nothrow) PhoneFilterProcess,
        new (std::nothrow) MailFilterProcess,
        new (std::nothrow) FavouritesFilterProcess,
        new (std::nothrow) PostalFilterProcess,
        new (std::nothrow) ContactIdExpandFilterProcess,
        new (std::nothrow) OnlineFilterProcess,
    };
    if (!AreAllThere(apProcess))
    {
        DeleteAll(apProcess);
        return nullptr;
    }
    Link(apProcess);
    return apProcess[0];
}
