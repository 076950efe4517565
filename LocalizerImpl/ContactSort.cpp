// Sorting whole records moves 704 bytes per exchange and reads two cache lines per comparison.
// Here each record is represented by a key that decides nearly every comparison alone:
//
//   group    three bits: nameless, first code other, first code a digit
//   script   whether the first code is a Chinese character or a letter
//   prefix   the first 24 units of the name, 16 bits each, cut at the first unit that needs more
//   iRecord  the record, compared when equal prefixes do not hold the whole name or do not
//            tell

#include "LocalizerImpl/ContactSort.h"

#include "Common/NameOrder.h"
#include "Common/SortSteps.h"
#include "Core/Records/LocalizerCodes.h"
#include "LocalizerImpl/QVLocalizerManager.h"

#include <cstring>
#include <memory>
#include <new>
#include <utility>

namespace
{

constexpr int PREFIX_WORDS = 6;
constexpr int UNITS_PER_WORD = 4;
constexpr int PREFIX_UNIT_BITS = 16;
constexpr uint32_t PREFIX_UNIT_MAX = 0xFFFF;
constexpr uint32_t WRAPPING_UNIT_MIN = 0x80000000;

struct tag_NameKey
{
    uint64_t auPrefix[PREFIX_WORDS];
    wchar_t firstUnit;
    uint8_t uGroup;
    bool bHanZi;
    bool bAlpha;
    bool bWhole; // the prefix is the whole name
    bool bWraps; // the prefix met a unit whose differences to others wrap
    int32_t iRecord;
};

struct tag_TimeKey
{
    int64_t llTime;
    int32_t iRecord;
};

uint8_t GroupOf(const tag_ContactsStruct& record)
{
    const wchar_t code = record.szLocalizerKey[0];
    // Three yes-or-no properties in the order in which they are asked.
    const int iNameless = record.szName[0] == NAME_EMPTY_MARK ? 4 : 0;
    const int iOther = code == LOC_OTHER ? 2 : 0;
    const int iDigit = IsDigitCode(CodeBits(code)) ? 1 : 0;
    return static_cast<uint8_t>(iNameless + iOther + iDigit);
}

// A unit too large for its field takes the largest value and ends the prefix: two prefixes that
// differ then differ in the order of the names, unless one of them wraps.
void FillPrefix(const wchar_t* szName, tag_NameKey& key)
{
    bool bCut = false;
    for (int i = 0; i < PREFIX_WORDS * UNITS_PER_WORD; ++i)
    {
        const bool bEnded = key.bWhole || bCut;
        const uint32_t uUnit = bEnded ? 0 : static_cast<uint32_t>(szName[i]);
        const bool bLarge = uUnit >= PREFIX_UNIT_MAX;
        key.bWhole = key.bWhole || (uUnit == 0 && !bCut);
        key.bWraps = key.bWraps || uUnit >= WRAPPING_UNIT_MIN;
        bCut = bCut || bLarge;
        uint64_t& uWord = key.auPrefix[i / UNITS_PER_WORD];
        uWord = (uWord << PREFIX_UNIT_BITS) | (bLarge ? PREFIX_UNIT_MAX : uUnit);
    }
}

tag_NameKey NameKeyOf(const tag_ContactsStruct& record, int iRecord)
{
    const uint16_t uCode = CodeBits(record.szLocalizerKey[0]);
    tag_NameKey key = {};
    FillPrefix(record.szName, key);
    key.firstUnit = record.szName[0];
    key.uGroup = GroupOf(record);
    key.bHanZi = IsHanZiCode(uCode);
    key.bAlpha = IsAlphaCode(uCode);
    key.iRecord = iRecord;
    return key;
}

// The name order on keys; see Common/NameOrder.h.
class CNameBehind
{
public:
    using Key = tag_NameKey;

    explicit CNameBehind(const tag_ContactsStruct* pRecords) : m_pRecords(pRecords) {}

    Key KeyOf(int iRecord) const { return NameKeyOf(m_pRecords[iRecord], iRecord); }

    bool operator()(const Key& a, const Key& b) const
    {
        if (a.firstUnit == b.firstUnit && ((a.bHanZi && b.bAlpha) || (a.bAlpha && b.bHanZi)))
        {
            return a.bHanZi;
        }
        if (a.uGroup != b.uGroup)
        {
            return a.uGroup > b.uGroup;
        }
        for (int i = 0; i < PREFIX_WORDS && !a.bWraps && !b.bWraps; ++i)
        {
            if (a.auPrefix[i] != b.auPrefix[i])
            {
                return a.auPrefix[i] > b.auPrefix[i];
            }
        }
        const bool bEqual = a.bWhole && b.bWhole; // no prefix that wraps is a whole name
        return !bEqual && CompareNameText(m_pRecords[a.iRecord], m_pRecords[b.iRecord]) > 0;
    }

private:
    const tag_ContactsStruct* m_pRecords;
};

// Last contact, most recent first.
class CTimeBehind
{
public:
    using Key = tag_TimeKey;

    explicit CTimeBehind(const tag_ContactsStruct* pRecords) : m_pRecords(pRecords) {}

    Key KeyOf(int iRecord) const { return {m_pRecords[iRecord].llLastTimeContacted, iRecord}; }

    bool operator()(const Key& a, const Key& b) const { return a.llTime < b.llTime; }

private:
    const tag_ContactsStruct* m_pRecords;
};

// The keys as an array for the sorting steps.
template <class TBehind>
class CKeyArray
{
public:
    using Key = typename TBehind::Key;

    CKeyArray(Key* pKeys, const TBehind& behind) : m_pKeys(pKeys), m_behind(behind) {}

    bool Greater(int a, int b) const { return m_behind(m_pKeys[a], m_pKeys[b]); }
    bool LessThanHeld(int a) const { return m_behind(m_held, m_pKeys[a]); }
    bool GreaterThanHeld(int a) const { return m_behind(m_pKeys[a], m_held); }
    void Swap(int a, int b) { std::swap(m_pKeys[a], m_pKeys[b]); }
    void Hold(int a) { m_held = m_pKeys[a]; }
    void Move(int from, int to) { m_pKeys[to] = m_pKeys[from]; }
    void Release(int a) { m_pKeys[a] = m_held; }

private:
    Key* m_pKeys;
    TBehind m_behind;
    Key m_held = {};
};

// Moves every record to its place along the cycles of the permutation: place i gets the record
// that pKeys[i] names. The keys are used up.
template <class TKey>
void PlaceRecords(tag_ContactsStruct* pRecords, int iCount, TKey* pKeys)
{
    for (int iStart = 0; iStart < iCount; ++iStart)
    {
        if (pKeys[iStart].iRecord == iStart)
        {
            continue;
        }
        const tag_ContactsStruct first = pRecords[iStart];
        int iPlace = iStart;
        while (pKeys[iPlace].iRecord != iStart)
        {
            const int iFrom = pKeys[iPlace].iRecord;
            pRecords[iPlace] = pRecords[iFrom];
            pKeys[iPlace].iRecord = iPlace;
            iPlace = iFrom;
        }
        pRecords[iPlace] = first;
        pKeys[iPlace].iRecord = iPlace;
    }
}

// False when there is no memory for the keys; the records are as they were then.
template <class TBehind>
bool SortByKeys(tag_ContactsStruct* pRecords, int iCount)
{
    using Key = typename TBehind::Key;
    const std::unique_ptr<Key[]> keys(new (std::nothrow) Key[static_cast<size_t>(iCount)]);
    if (keys == nullptr)
    {
        return false;
    }
    const TBehind behind(pRecords);
    for (int i = 0; i < iCount; ++i)
    {
        keys[static_cast<size_t>(i)] = behind.KeyOf(i);
    }
    CKeyArray<TBehind> array(keys.get(), behind);
    SortPartitions(array, 0, iCount - 1);
    SortInsertions(array, 0, iCount - 1);
    PlaceRecords(pRecords, iCount, keys.get());
    return true;
}

} // namespace

void SortContacts(tag_ContactsStruct* pRecords, int iCount, Common_Sort_enum type)
{
    if (pRecords == nullptr || iCount < 1)
    {
        return;
    }
    const bool bSorted = type == SORT_TIME ? SortByKeys<CTimeBehind>(pRecords, iCount)
                                           : SortByKeys<CNameBehind>(pRecords, iCount);
    if (!bSorted)
    {
        Common_Qsort sorter;
        sorter.QuickSort(reinterpret_cast<char*>(pRecords), iCount, type);
    }
}

int CQVLocalizerManager::LocalizerQuickSort(tag_ContactsStruct* pRecords, int iCount, int iSortType)
{
    if (iSortType == STORE_ORDER_TIME)
    {
        SortContacts(pRecords, iCount, SORT_TIME);
        return 0;
    }
    SortContacts(pRecords, iCount, SORT_NAME);
    for (int i = 0; pRecords != nullptr && i < iCount; ++i)
    {
        pRecords[i].iSortIndex = i;
    }
    return 0;
}
