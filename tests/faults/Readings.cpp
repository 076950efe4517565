#include "tests/faults/Readings.h"

#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "tests/Support/WideText.h"

#include <algorithm>
#include <cwchar>

namespace
{

void Search(CLocalizerLogic& logic, tag_Answer& answer, const wchar_t* szTyped,
            IME_SEARCH_TYPE eType, int iFilter = 0, tag_LocalizerResult* pLast = nullptr)
{
    wchar_t szInput[16] = {};
    std::wcscpy(szInput, szTyped);
    QVLong32 lId = 3;
    CFilterChain* pChain = nullptr;
    answer.iRet = logic.CreateFilterChain(&iFilter, &lId, iFilter == 0 ? 0 : 1, &pChain);
    if (answer.iRet == 0)
    {
        answer.iRet = logic.Search(pLast, szInput, eType, pChain, 0, &answer.pResult, &answer.lMask,
                                   answer.szText);
    }
    delete pChain;
}

} // namespace

const std::vector<tag_Reading>& AllReadings()
{
    static const std::vector<tag_Reading> vReadings = {
        {"Everybody", [](CLocalizerLogic& logic, tag_Answer& answer)
         { Search(logic, answer, L"", IME_SEARCH_WORD); }},
        {"Letters", [](CLocalizerLogic& logic, tag_Answer& answer)
         { Search(logic, answer, L"za", IME_SEARCH_WORD); }},
        {"Digits", [](CLocalizerLogic& logic, tag_Answer& answer)
         { Search(logic, answer, L"9", IME_SEARCH_NUM, FILTER_GROUP_EXPAND); }},
        {"LoggingFilter", [](CLocalizerLogic& logic, tag_Answer& answer)
         { Search(logic, answer, L"", IME_SEARCH_NUM, FILTER_CONTACT_ID_EXPAND); }},
        {"Special", [](CLocalizerLogic& logic, tag_Answer& answer)
         { Search(logic, answer, L"z", IME_SEARCH_SPECIAL); }},
        {"Narrowed",
         [](CLocalizerLogic& logic, tag_Answer& answer)
         {
             tag_LocalizerDetail allDetails[2] = {};
             allDetails[0].szLocalizerKey[0] = allDetails[1].szLocalizerKey[1] = LOC_ALPHA_BASE + 3;
             tag_LocalizerResult last = {2, allDetails};
             Search(logic, answer, L"d", IME_SEARCH_WORD, 0, &last);
         }},
        {"Keys",
         [](CLocalizerLogic& logic, tag_Answer& answer)
         {
             wchar_t szName[] = L"张 Tom 7";
             answer.iRet = logic.GetLocalizer(szName, answer.szText);
         }},
        {"KeyBatch",
         [](CLocalizerLogic& logic, tag_Answer& answer)
         {
             tag_ContactsStruct record = {};
             std::wcscpy(record.szName, L"李Lee");
             tag_ContactsInfo info = {1, &record};
             answer.iRet = logic.GetLocalizerBatch(&info);
             std::copy_n(record.szLocalizerKey, CONTACT_MAX_KEY, answer.szText);
         }},
        {"Picked",
         [](CLocalizerLogic& logic, tag_Answer& answer)
         {
             wchar_t szInput[16] = L"zhang";
             wchar_t szWord[] = L"张";
             answer.iRet = logic.GetLocalizerString(szInput, 5, szWord, answer.szText);
         }},
        {"Mapping",
         [](CLocalizerLogic& logic, tag_Answer& answer)
         {
             const long hMap = logic.CreatePinYinFileMapping();
             wchar_t szName[] = L"重庆";
             answer.iRet = hMap == -1 ? -1 : logic.GetLocalizerString(hMap, szName, answer.szText);
             logic.ReleasePinYinFileMapping(hMap);
         }},
        {"Start",
         [](CLocalizerLogic& logic, tag_Answer& answer) { answer.iRet = logic.MemInit(false); }},
    };
    return vReadings;
}

std::string TextOf(CLocalizerLogic& logic, const tag_Answer& answer)
{
    std::string strText = std::to_string(answer.iRet);
    if (answer.pResult == nullptr)
    {
        return answer.iRet == 0 ? strText + Narrow(answer.szText) : strText;
    }
    for (int i = 0; i < answer.pResult->iResultNum; ++i)
    {
        strText += " " + std::to_string(answer.pResult->pDetail[i].iContactID);
    }
    const bool bNobody = answer.pResult->iResultNum == 0;
    logic.FreeSearchResult(answer.pResult);
    return bNobody ? "0 nobody" : strText + " keys " + std::to_string(answer.lMask);
}
