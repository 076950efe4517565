#include "Common/CommonQsort.h"

#include "Common/NameOrder.h"
#include "Common/SearchSteps.h"
#include "Common/SortSteps.h"
#include "Core/Records/ContactRecords.h"
#include "Core/Records/LocalizerCodes.h"

#include <algorithm>
#include <cstddef>
#include <cstring>

namespace
{

constexpr size_t MAX_RECORD_SIZE = std::max<size_t>(sizeof(tag_ContactsStruct), PY_RECORD_SIZE);

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
    CRecordArray(Common_Qsort& sorter, char* pBase, int iSize)
        : m_sorter(sorter), m_pBase(pBase), m_uSize(static_cast<size_t>(iSize))
    {
    }

    bool Greater(int a, int b) { return m_sorter.QSORT_GT(At(a), At(b)) == 1; }
    bool LessThanHeld(int a) { return m_sorter.QSORT_LT(At(a), m_acHeld) == 1; }
    bool GreaterThanHeld(int a) { return m_sorter.QSORT_GT(At(a), m_acHeld) == 1; }
    void Hold(int a) { std::memcpy(m_acHeld, At(a), m_uSize); }
    void Release(int a) { std::memcpy(At(a), m_acHeld, m_uSize); }
    void Move(int from, int to) { std::memcpy(At(to), At(from), m_uSize); }
    void Swap(int a, int b)
    {
        if (a != b)
        {
            std::memcpy(m_acSwap, At(a), m_uSize);
            std::memcpy(At(a), At(b), m_uSize);
            std::memcpy(At(b), m_acSwap, m_uSize);
        }
    }

private:
    char* At(int a) const { return m_pBase + static_cast<size_t>(a) * m_uSize; }

    Common_Qsort& m_sorter;
    char* m_pBase;
    size_t m_uSize;
    alignas(tag_ContactsStruct) char m_acHeld[MAX_RECORD_SIZE]; // pivot, or record being inserted
    alignas(tag_ContactsStruct) char m_acSwap[MAX_RECORD_SIZE]; // one side of an exchange
};

// A key to compare with the records of a sorted array.
class CKeyedArray
{
public:
    CKeyedArray(Common_Qsort& sorter, char* pBase, int iSize, char* pKey)
        : m_sorter(sorter), m_pBase(pBase), m_uSize(static_cast<size_t>(iSize)), m_pKey(pKey)
    {
    }

    bool KeyEquals(int i) { return m_sorter.QSORT_EQ(m_pKey, At(i)) == 1; }
    bool KeyBefore(int i) { return m_sorter.QSORT_LT(m_pKey, At(i)) == 1; }
    bool KeyBehind(int i) { return m_sorter.QSORT_GT(m_pKey, At(i)) == 1; }

private:
    char* At(int i) const { return m_pBase + static_cast<size_t>(i) * m_uSize; }

    Common_Qsort& m_sorter;
    char* m_pBase;
    size_t m_uSize;
    char* m_pKey;
};

int SearchExact(CKeyedArray& array, int iCount)
{
    const int iLast = iCount - 1;
    if (iCount > 1 && (array.KeyBefore(0) || array.KeyBehind(iLast)))
    {
        return -1;
    }
    if (array.KeyEquals(0))
    {
        return 0;
    }
    if (iCount > 1 && array.KeyEquals(iLast))
    {
        return iLast;
    }
    bool bFound = false;
    const int iPos = iCount > 1 ? SearchHalves(array, iCount, &bFound) : -1;
    return bFound ? iPos : -1;
}

// The insertion place; an equal first or last record is preferred to the place behind it.
int SearchInsertion(CKeyedArray& array, int iCount, bool* pbFound)
{
    const int iLast = iCount - 1;
    if (iCount == 1 && array.KeyBefore(0))
    {
        return 0;
    }
    if (iCount > 1 && !array.KeyBehind(0))
    {
        *pbFound = array.KeyEquals(0);
        return 0;
    }
    if (iCount == 1 || !array.KeyBefore(iLast))
    {
        *pbFound = array.KeyEquals(iLast);
        return *pbFound ? iLast : iCount;
    }
    return SearchHalves(array, iCount, pbFound);
}

} // namespace

Common_Qsort::Common_Qsort() = default;

Common_Qsort::~Common_Qsort() = default;

void Common_Qsort::InitInterData(Common_Sort_enum type)
{
    m_eSortType = type;
    m_iRecSize = RecordSize(type);
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
        CRecordArray array(*this, base, m_iRecSize);
        SortPartitions(array, lo, hi);
    }
}

void Common_Qsort::InsertionSort(char* base, int lo, int hi)
{
    if (base != nullptr && IsReady())
    {
        CRecordArray array(*this, base, m_iRecSize);
        SortInsertions(array, lo, hi);
    }
}

// Whether there are records to search; if not, *piResult is the answer. In an empty array, null or
// not, a key is inserted at index 0.
bool Common_Qsort::BeginSearch(const char* base, int count, const char* key, Common_Sort_enum type,
                               int bInsertPos, int* piResult)
{
    InitInterData(type);
    *piResult = IsReady() && count <= 0 && bInsertPos != 0 ? 0 : -1;
    return IsReady() && count > 0 && base != nullptr && key != nullptr;
}

int Common_Qsort::Search_Bin(char* base, int count, char* key, Common_Sort_enum type,
                             int bInsertPos)
{
    int iNoRecords = -1;
    if (!BeginSearch(base, count, key, type, bInsertPos, &iNoRecords))
    {
        return iNoRecords;
    }
    CKeyedArray array(*this, base, m_iRecSize, key);
    return bInsertPos == 0 ? SearchExact(array, count) : SearchPlace(array, count);
}

int Common_Qsort::Search_BinEx(char* base, int count, char* key, Common_Sort_enum type,
                               int bInsertPos, int* pbFound)
{
    int iNoRecords = -1;
    if (!BeginSearch(base, count, key, type, bInsertPos, &iNoRecords))
    {
        return iNoRecords;
    }
    CKeyedArray array(*this, base, m_iRecSize, key);
    if (bInsertPos == 0)
    {
        return SearchExact(array, count);
    }
    bool bFound = false;
    const int iPos = SearchInsertion(array, count, &bFound);
    if (bFound && pbFound != nullptr)
    {
        *pbFound = 1;
    }
    return iPos;
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
