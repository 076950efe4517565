// A program with functions of its own under names that the library exports too. It ends with 0
// when the library nevertheless called its own ones.

#include "Common/DataPaths.h"
#include "Filter/FilterChain.h"
#include "MemManager/MemManger.h"

#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>

namespace
{

int g_iForeignCalls = 0;

} // namespace

extern "C"
{
    __attribute__((visibility("default"))) void Sleep(unsigned int /*uMilliseconds*/)
    {
        ++g_iForeignCalls;
    }
    __attribute__((visibility("default"))) char* itoa(int /*iValue*/, char* szBuffer,
                                                      int /*iRadix*/)
    {
        ++g_iForeignCalls;
        return szBuffer;
    }
    __attribute__((visibility("default"))) void* OpenReadShareMemory(const char* /*szPath*/,
                                                                     size_t /*uSize*/)
    {
        ++g_iForeignCalls;
        return nullptr;
    }
}

// A search that finds the store locked pauses and tries again, which takes the library through
// its lock, its pauses and its mapping calls.
int main()
{
    char szRoot[] = "/tmp/qv_own_calls_XXXXXX";
    if (mkdtemp(szRoot) == nullptr || CDataPaths::SetRoot(szRoot) != 0)
    {
        return 2;
    }
    const std::string strFiles = std::string(szRoot) + "/files";
    if (std::system(("mkdir " + strFiles).c_str()) != 0)
    {
        return 2;
    }
    CMemManger holder;
    CMemManger seeker;
    tag_LocalizerResult* pResult = nullptr;
    CFilterChain chain;
    const bool bHeld = holder.LockMemo() == 1;
    seeker.CopyContactsResult(chain, &pResult);
    holder.UnlockMemo();
    tag_ContactsInfo noContacts = {};
    const int iRet = seeker.InitContactRecord(&noContacts);
    seeker.GetMemSize(nullptr);
    static_cast<void>(std::system(("rm -r " + std::string(szRoot)).c_str()) == 0);
    seeker.FreeSearchResult(pResult);
    std::printf("%d calls went to the program instead of the library\n", g_iForeignCalls);
    return bHeld && iRet == 0 && g_iForeignCalls == 0 ? 0 : 1;
}
