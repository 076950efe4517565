#include "Common/CommonQsort.h"

#include "Common/NameOrder.h"
#include "Common/SortSteps.h"
#include "Core/ContactRecords.h"
#include "Core/LocalizerCodes.h"

#include <cstddef>
#include <cstdlib>
#include <cstring>

namespace
{

int RecordSize(Common_Sort_enum type)
{
    switch (type)
    {
    case SORT_NAME:
    case SORT_TIME:
        return static_cast<int>(sizeof(tag_ContactsStruct));
    case SORT_PYWORD:
        return PY_RECORD_SIZE;
    }
    return 0;
}

const tag_ContactsStruct& AsContact(const char* pRecord)
{
    return *reinterpret_cast<const tag_ContactsStruct*>(pRecord);
}

// Bounded by the record: a damaged table may hold no terminator.
int CompareWords(const char* a, const char* b)
{
    return std::strncmp(a, b, PY_RECORD_SIZE);
}

// The records of an array, moved whole.
class CRecordArray
{
public:
    CRecordArray(Common_Qsort& sorter, char* pBase, size_t uSize, char* pHeld, char* pSwap)
        : m_sorter(sorter), m_pBase(pBase), m_uSize(uSize), m_pHeld(pHeld), m_pSwap(pSwap)
    {
    }

    bool Greater(int a, int b) { return m_sorter.QSORT_GT(At(a), At(b)) == 1; }
    bool LessThanHeld(int a) { return m_sorter.QSORT_LT(At(a), m_pHeld) == 1; }
    bool GreaterThanHeld(int a) { return m_sorter.QSORT_GT(At(a), m_pHeld) == 1; }
    void Hold(int a) { std::memcpy(m_pHeld, At(a), m_uSize); }
    void Release(int a) { std::memcpy(At(a), m_pHeld, m_uSize); }
    void Move(int from, int to) { std::memcpy(At(to), At(from), m_uSize); }
    void Swap(int a, int b)
    {
        if (a != b)
        {
            std::memcpy(m_pSwap, At(a), m_uSize);
            std::memcpy(At(a), At(b), m_uSize);
            std::memcpy(At(b), m_pSwap, m_uSize);
        }
    }

private:
    char* At(int a) const { return m_pBase + static_cast<size_t>(a) * m_uSize; }

    Common_Qsort& m_sorter;
    char* m_pBase;
    size_t m_uSize;
    char* m_pHeld;
    char* m_pSwap;
};

} // namespace

Common_Qsort::Common_Qsort() = default;

Common_Qsort::~Common_Qsort()
{
    FreeBuffers();
}

void Common_Qsort::FreeBuffers()
{
    std::free(m_pKeyBuf);
    std::free(m_pSwapBuf);
    m_pKeyBuf = nullptr;
    m_pSwapBuf = nullptr;
}

void Common_Qsort::InitInterData(Common_Sort_enum type)
{
    m_eSortType = type;
    const int iRecSize = RecordSize(type);
    if (iRecSize == m_iRecSize && IsReady())
    {
        return; // one search a character: the buffers outlive the call
    }
    FreeBuffers();
    m_iRecSize = iRecSize;
    if (iRecSize > 0)
    {
        m_pKeyBuf = static_cast<char*>(std::malloc(static_cast<size_t>(iRecSize)));
        m_pSwapBuf = static_cast<char*>(std::malloc(static_cast<size_t>(iRecSize)));
    }
}

int Common_Qsort::QuickSort(char* base, int count, Common_Sort_enum type)
{
    if (base == nullptr || count < 1)
    {
        return -1;
    }
    InitInterData(type);
    if (!IsReady())
    {
        return -1;
    }
    QuickSort1(base, 0, count - 1);
    InsertionSort(base, 0, count - 1);
    return count;
}

void Common_Qsort::QuickSort1(char* base, int lo, int hi)
{
    if (base != nullptr && IsReady())
    {
        CRecordArray array(*this, base, static_cast<size_t>(m_iRecSize), m_pKeyBuf, m_pSwapBuf);
        SortPartitions(array, lo, hi);
    }
}

void Common_Qsort::InsertionSort(char* base, int lo, int hi)
{
    if (base != nullptr && IsReady())
    {
        CRecordArray array(*this, base, static_cast<size_t>(m_iRecSize), m_pKeyBuf, m_pSwapBuf);
        SortInsertions(array, lo, hi);
    }
}

char* Common_Qsort::RecordAt(char* base, int iIndex) const
{
    return base + static_cast<ptrdiff_t>(iIndex) * m_iRecSize;
}

// Halves 0..count - 1: the index of an equal record (then *pbFound is true), or the place where
// the key belongs.
int Common_Qsort::SearchHalves(char* base, int count, char* key, bool* pbFound)
{
    int lo = 0;
    int hi = count - 1;
    while (lo <= hi)
    {
        const int mid = lo + (hi - lo) / 2;
        char* pRecord = RecordAt(base, mid);
        if (QSORT_EQ(key, pRecord) == 1)
        {
            *pbFound = true;
            return mid;
        }
        if (QSORT_LT(key, pRecord) == 1)
        {
            hi = mid - 1;
        }
        else
        {
            lo = mid + 1;
        }
    }
    return hi + 1;
}

// Whether there are records to look at; where there are none, *piResult is the answer. An empty
// array, null or not, has one place for a key: its beginning.
bool Common_Qsort::BeginSearch(const char* base, int count, const char* key, Common_Sort_enum type,
                               int bInsertPos, int* piResult)
{
    InitInterData(type);
    *piResult = IsReady() && count <= 0 && bInsertPos != 0 ? 0 : -1;
    return IsReady() && count > 0 && base != nullptr && key != nullptr;
}

int Common_Qsort::SearchExact(char* base, int count, char* key)
{
    char* pLast = RecordAt(base, count - 1);
    if (count > 1 && (QSORT_LT(key, base) == 1 || QSORT_GT(key, pLast) == 1))
    {
        return -1;
    }
    if (QSORT_EQ(key, base) == 1)
    {
        return 0;
    }
    if (count > 1 && QSORT_EQ(key, pLast) == 1)
    {
        return count - 1;
    }
    bool bFound = false;
    const int iPos = count > 1 ? SearchHalves(base, count, key, &bFound) : -1;
    return bFound ? iPos : -1;
}

int Common_Qsort::Search_Bin(char* base, int count, char* key, Common_Sort_enum type,
                             int bInsertPos)
{
    int iNoRecords = -1;
    if (!BeginSearch(base, count, key, type, bInsertPos, &iNoRecords))
    {
        return iNoRecords;
    }
    if (bInsertPos == 0)
    {
        return SearchExact(base, count, key);
    }
    if (count == 1)
    {
        return QSORT_LT(key, base) == 1 ? 0 : 1;
    }
    if (QSORT_GT(key, base) != 1)
    {
        return 0;
    }
    if (QSORT_LT(key, RecordAt(base, count - 1)) != 1)
    {
        return count;
    }
    bool bFound = false;
    return SearchHalves(base, count, key, &bFound);
}

int Common_Qsort::Search_BinEx(char* base, int count, char* key, Common_Sort_enum type,
                               int bInsertPos, int* pbFound)
{
    int iNoRecords = -1;
    if (!BeginSearch(base, count, key, type, bInsertPos, &iNoRecords))
    {
        return iNoRecords;
    }
    if (bInsertPos == 0)
    {
        return SearchExact(base, count, key);
    }
    bool bFound = false;
    const int iPos = SearchInsertion(base, count, key, &bFound);
    if (bFound && pbFound != nullptr)
    {
        *pbFound = 1;
    }
    return iPos;
}

// The insertion place that prefers an equal first or last record to the place behind it.
int Common_Qsort::SearchInsertion(char* base, int count, char* key, bool* pbFound)
{
    if (count == 1)
    {
        if (QSORT_LT(key, base) == 1)
        {
            return 0;
        }
        *pbFound = QSORT_EQ(key, base) == 1;
        return *pbFound ? 0 : 1;
    }
    if (QSORT_GT(key, base) != 1)
    {
        *pbFound = QSORT_EQ(key, base) == 1;
        return 0;
    }
    char* pLast = RecordAt(base, count - 1);
    if (QSORT_LT(key, pLast) != 1)
    {
        *pbFound = QSORT_EQ(key, pLast) == 1;
        return *pbFound ? count - 1 : count;
    }
    return SearchHalves(base, count, key, pbFound);
}

int Common_Qsort::QSORT_EQ(char* a, char* b)
{
    switch (m_eSortType)
    {
    case SORT_NAME:
        return CompareNameText(AsContact(a), AsContact(b)) == 0 ? 1 : 0;
    case SORT_TIME:
        return AsContact(a).llLastTimeContacted == AsContact(b).llLastTimeContacted ? 1 : 0;
    case SORT_PYWORD:
        return CompareWords(a, b) == 0 ? 1 : 0;
    }
    return -1;
}

int Common_Qsort::QSORT_GT(char* a, char* b)
{
    switch (m_eSortType)
    {
    case SORT_NAME:
        return NameSortsBehind(AsContact(a), AsContact(b)) ? 1 : 0;
    case SORT_TIME:
        return AsContact(a).llLastTimeContacted < AsContact(b).llLastTimeContacted ? 1 : 0;
    case SORT_PYWORD:
        return CompareWords(a, b) > 0 ? 1 : 0;
    }
    return -1;
}

int Common_Qsort::QSORT_LT(char* a, char* b)
{
    switch (m_eSortType)
    {
    case SORT_NAME:
        return NameSortsBehind(AsContact(b), AsContact(a)) ? 1 : 0;
    case SORT_TIME:
        return AsContact(a).llLastTimeContacted > AsContact(b).llLastTimeContacted ? 1 : 0;
    case SORT_PYWORD:
        return CompareWords(a, b) < 0 ? 1 : 0;
    }
    return -1;
}
