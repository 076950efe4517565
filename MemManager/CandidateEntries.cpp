#include "MemManager/CandidateEntries.h"

#include "Common/Log.h"
#include "Filter/FilterChain.h"
#include "Filter/FilterProcess.h"
#include "Filter/FilterProcessFactory.h"
#include "Filter/RecordTest.h"

#include <algorithm>
#include <memory>
#include <new>

namespace
{

// An entry's field of this text is one unit shorter than the record's.
constexpr int ENTRY_MAX_RESERVED = 4;
static_assert(sizeof(tag_LocalizerDetail::szReserved) / sizeof(wchar_t) == ENTRY_MAX_RESERVED + 1,
              "room for a terminator");

// Copies up to the terminator, at most iMax units: a damaged record may have none. The target is
// zero-filled.
void CopyText(wchar_t* szTarget, const wchar_t* szSource, int iMax)
{
    for (int i = 0; i < iMax && szSource[i] != 0; ++i)
    {
        szTarget[i] = szSource[i];
    }
}

void FillEntry(const tag_ContactsStruct& record, tag_LocalizerDetail* pEntry)
{
    *pEntry = {};
    pEntry->iContactID = record.iContactID;
    pEntry->iSortIndex = record.iSortIndex;
    CopyText(pEntry->szLocalizerKey, record.szLocalizerKey, CONTACT_MAX_KEY);
    CopyText(pEntry->szReserved, record.szReserved, ENTRY_MAX_RESERVED);
    pEntry->llLastTimeContacted = record.llLastTimeContacted;
}

bool IsEmptySlot(const tag_ContactsStruct& record)
{
    return record.iContactID == 0;
}

// Of each record a few fields are read, too far apart for the processor to see a pattern: it is
// told ahead where they are.
constexpr int PREFETCH_AHEAD = 12;

void Prefetch(const tag_ContactsStruct& record)
{
    __builtin_prefetch(&record);
    __builtin_prefetch(&record.iFlags);
    __builtin_prefetch(&record.szLocalizerKey);
    __builtin_prefetch(&record.szReserved[5]);
}

} // namespace

CCandidateEntries::Counts CCandidateEntries::Select(const tag_ContactsStruct* pRecords, int iCount,
                                                    bool bEmptySlots, CFilterChain& chain,
                                                    CCandidateTest* pTest,
                                                    tag_LocalizerDetail* pEntries)
{
    const CRecordTest test(chain);
    const bool bAll = chain.GetFilterNum() == 0;
    Counts counts = {0, 0};
    for (int i = 0; i < iCount; ++i)
    {
        Prefetch(pRecords[std::min(i + PREFETCH_AHEAD, iCount - 1)]);
        if ((bEmptySlots && IsEmptySlot(pRecords[i])) || (!bAll && !test.Keeps(pRecords[i])))
        {
            continue;
        }
        ++counts.iKept;
        if (pTest == nullptr || pTest->MayMatch(pRecords[i].szLocalizerKey))
        {
            FillEntry(pRecords[i], &pEntries[counts.iWritten++]);
        }
    }
    return counts;
}

void CCandidateEntries::DropEmptySlots(tag_ContactsInfo* pCopy)
{
    tag_ContactsStruct* pEnd =
        std::remove_if(pCopy->pContacts, pCopy->pContacts + pCopy->RecordNum, IsEmptySlot);
    pCopy->RecordNum = static_cast<int32_t>(pEnd - pCopy->pContacts);
}

void CCandidateEntries::NarrowCopy(tag_ContactsInfo* pCopy, CFilterChain& chain,
                                   tag_LocalizerResult* pResult)
{
    const std::unique_ptr<FilterProcess> pPipeline(FilterProcessFactory::CreateFilterProcess());
    if (pPipeline == nullptr || pPipeline->FilterRecord(pCopy, chain) != 0)
    {
        return;
    }
    const int iNum = pCopy->RecordNum;
    LogFilterResult(iNum);
    if (iNum == 0)
    {
        return;
    }
    pResult->pDetail = new (std::nothrow) tag_LocalizerDetail[static_cast<size_t>(iNum)];
    if (pResult->pDetail == nullptr)
    {
        return;
    }
    pResult->iResultNum = iNum;
    for (int i = 0; i < iNum; ++i)
    {
        FillEntry(pCopy->pContacts[i], &pResult->pDetail[i]);
    }
}

void CCandidateEntries::LogFilterResult(int iNum)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: CopyContactsResult Filter Result Num = %d\n", iNum);
}
