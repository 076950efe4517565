// The C++ class as languages.py measures it: SearchLoop DATA_DIRECTORY TEXT... searches for the
// texts in turn, one line of input asking for that many searches and one line of output telling the
// nanoseconds that they took. Each search looks at its first contacts.

#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "Filter/FilterChain.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tools/Utf8Text.h"

#include <chrono>
#include <cstdio>
#include <string>
#include <vector>

namespace
{

constexpr int FIRST_PAGE = 20;

// The ids of the first contacts found, added up; -1 for a search that fails.
long SearchOnce(CLocalizerLogic& logic, CFilterChain& chain, std::wstring strText)
{
    wchar_t szWords[CN_WORD_MAX + 1] = {};
    long lMask = 0;
    tag_LocalizerResult* pResult = nullptr;
    if (logic.Search(nullptr, strText.data(), IME_SEARCH_WORD, &chain, 0, &pResult, &lMask,
                     szWords) != 0)
    {
        return -1;
    }
    long lSum = 0;
    for (int i = 0; i < pResult->iResultNum && i < FIRST_PAGE; ++i)
    {
        lSum += pResult->pDetail[i].iContactID;
    }
    logic.FreeSearchResult(pResult);
    return lSum;
}

} // namespace

int main(int argc, char** argv)
{
    if (argc < 3 || CDataPaths::SetRoot(argv[1]) != 0)
    {
        return 2;
    }
    std::vector<std::wstring> vTexts;
    for (int i = 2; i < argc; ++i)
    {
        vTexts.push_back(WideText(argv[i]));
    }
    CLocalizerLogic logic;
    CFilterChain chain;
    int iSearches = 0;
    while (std::scanf("%d", &iSearches) == 1)
    {
        long lSum = 0;
        const auto begin = std::chrono::steady_clock::now();
        for (int i = 0; i < iSearches; ++i)
        {
            const long lFound =
                SearchOnce(logic, chain, vTexts[static_cast<size_t>(i) % vTexts.size()]);
            if (lFound < 0)
            {
                return 1;
            }
            lSum += lFound;
        }
        const std::chrono::nanoseconds taken = std::chrono::steady_clock::now() - begin;
        std::printf("%lld %ld\n", static_cast<long long>(taken.count()), lSum);
        std::fflush(stdout);
    }
    return 0;
}
