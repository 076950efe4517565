#include "Common/Log.h"
#include "Filter/FilterChainBuilder.h"
#include "MemManager/ContactSelection.h"
#include "MemManager/MemManger.h"
#include "MemManager/ResultSet.h"
#include "MemManager/SpecialNumbers.h"

#include <cstring>
#include <new>

namespace
{

// Counters of GetFirstWordInfo; the last one of each order counts all other entries.
constexpr int FIRST_TIME_SECTION = '1';
constexpr int TIME_SECTIONS = 5;
constexpr int FIRST_NAME_SECTION = 'A';
constexpr int NAME_SECTIONS = 26;

size_t EntryBytes(int iNum)
{
    return static_cast<size_t>(iNum) * sizeof(tag_LocalizerDetail);
}

// Counts each entry in the counter of its section, of which there are iSections from iFirst on, or
// in the counter after them.
void CountSections(const tag_LocalizerResult& set, int iFirst, int iSections, int* piCounts)
{
    for (int i = 0; i < set.iResultNum; ++i)
    {
        const int iWord = set.pDetail[i].iFirstWord;
        const bool bInside = iWord >= iFirst && iWord < iFirst + iSections;
        ++piCounts[bInside ? iWord - iFirst : iSections];
    }
}

} // namespace

void CMemManger::CopyContactsResult(CFilterChain& chain, tag_LocalizerResult** ppResult)
{
    bool bDense = false;
    CContactSelection::Copy(chain, nullptr, ppResult, &bDense);
}

void CMemManger::CopySpecialNumberRecord(tag_LocalizerResult** ppResult)
{
    if (ppResult == nullptr)
    {
        return;
    }
    auto* pSet = new (std::nothrow) tag_LocalizerResult();
    *ppResult = pSet;
    if (pSet == nullptr)
    {
        return;
    }
    pSet->pDetail = new (std::nothrow) tag_LocalizerDetail[SPECIAL_NUMBER_COUNT];
    if (pSet->pDetail != nullptr)
    {
        pSet->iResultNum = SPECIAL_NUMBER_COUNT;
        std::memcpy(pSet->pDetail, g_specialNumberRecords, sizeof(g_specialNumberRecords));
    }
}

int CMemManger::NewSearchResult(tag_LocalizerResult* pSrc, tag_LocalizerResult** ppNew)
{
    if (pSrc == nullptr || ppNew == nullptr)
    {
        return -1;
    }
    bool bArrayFailed = false;
    *ppNew = NewSet(pSrc->iResultNum, &bArrayFailed);
    if (*ppNew == nullptr)
    {
        return -1;
    }
    if ((*ppNew)->pDetail != nullptr)
    {
        std::memset((*ppNew)->pDetail, 0, EntryBytes(pSrc->iResultNum));
    }
    return 0;
}

int CMemManger::CopySearchResult(tag_LocalizerResult* pSrc, tag_LocalizerResult** ppOut)
{
    if (pSrc == nullptr || ppOut == nullptr)
    {
        return -1;
    }
    bool bArrayFailed = false;
    *ppOut = NewSet(pSrc->iResultNum, &bArrayFailed);
    if (bArrayFailed)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CopySearchResult malloc mem error");
    }
    if (*ppOut == nullptr)
    {
        return -1;
    }
    if ((*ppOut)->pDetail != nullptr)
    {
        std::memcpy((*ppOut)->pDetail, pSrc->pDetail, EntryBytes(pSrc->iResultNum));
    }
    return 0;
}

int CMemManger::GetSearchRecord(tag_LocalizerResult* pSrc, int iStart, int iCount,
                                tag_LocalizerResult* pPage)
{
    if (pSrc == nullptr || pPage == nullptr || iStart < 0 || iCount < 0)
    {
        return -1;
    }
    if (iStart >= pSrc->iResultNum || iCount > pSrc->iResultNum - iStart)
    {
        return -1;
    }
    pPage->iResultNum = iCount;
    pPage->pDetail = pSrc->pDetail + iStart;
    return 0;
}

int CMemManger::GetIndexByContactsId(tag_LocalizerResult* pSrc, long iContactID)
{
    if (pSrc == nullptr)
    {
        return -1;
    }
    for (int i = 0; i < pSrc->iResultNum; ++i)
    {
        if (pSrc->pDetail[i].iContactID == iContactID)
        {
            return i;
        }
    }
    return 0;
}

int CMemManger::GetFirstWordInfo(tag_LocalizerResult* pSrc, int* piCounts)
{
    if (pSrc == nullptr || piCounts == nullptr)
    {
        return -1;
    }
    if (GetSortType() == STORE_ORDER_TIME)
    {
        CountSections(*pSrc, FIRST_TIME_SECTION, TIME_SECTIONS, piCounts);
    }
    else
    {
        CountSections(*pSrc, FIRST_NAME_SECTION, NAME_SECTIONS, piCounts);
    }
    return 0;
}

int CMemManger::FreeSearchResult(tag_LocalizerResult* pSrc)
{
    if (pSrc == nullptr)
    {
        return -1;
    }
    delete[] pSrc->pDetail;
    delete pSrc;
    return 0;
}

int CMemManger::CreateFilterChain(int* piType, QVLong32* plID, int iNum, CFilterChain** ppChain)
{
    return BuildFilterChain(piType, plID, iNum, ppChain);
}
