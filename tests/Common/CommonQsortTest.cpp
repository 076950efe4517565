// The sorter against the orders and the steps written down plainly: sequences, exact permutations
// of equal records, and both searches at every length at which they differ.

#include "Common/CommonQsort.h"

#include "Core/ContactRecords.h"
#include "Core/LocalizerCodes.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <utility>
#include <vector>

namespace
{

constexpr int ROUNDS = 300;
constexpr int MAX_RECORDS = 60;
constexpr Common_Sort_enum UNKNOWN_KIND = static_cast<Common_Sort_enum>(2);

using Contact = tag_ContactsStruct;

template <class T>
char* Bytes(T* pRecords)
{
    return reinterpret_cast<char*>(pRecords);
}

// --- The three orders: whether a sorts behind b, and whether the two are equal ----------------

std::vector<int64_t> NameUnits(const Contact& record)
{
    const wchar_t* pEnd = std::find(std::begin(record.szName), std::end(record.szName), L'\0');
    return {std::begin(record.szName), pEnd};
}

bool IsIn(wchar_t code, unsigned uFirst, unsigned uCount)
{
    const unsigned uCode = static_cast<unsigned>(code) & 0xFFFFU;
    return uCode >= uFirst && uCode < uFirst + uCount;
}

bool NameBehind(const Contact& a, const Contact& b)
{
    const wchar_t ka = a.szLocalizerKey[0];
    const wchar_t kb = b.szLocalizerKey[0];
    const auto hanZi = [](wchar_t k) { return IsIn(k, 0x1000, 15422); };
    const auto alpha = [](wchar_t k) { return IsIn(k, 0x4F00, 26); };
    const auto digit = [](wchar_t k) { return IsIn(k, 0x5A00, 10); };
    if (a.szName[0] == b.szName[0] && hanZi(ka) && alpha(kb))
    {
        return true;
    }
    if (a.szName[0] == b.szName[0] && alpha(ka) && hanZi(kb))
    {
        return false;
    }
    if ((a.szName[0] == 0x7FFFFFFF) != (b.szName[0] == 0x7FFFFFFF))
    {
        return a.szName[0] == 0x7FFFFFFF;
    }
    if ((ka == 0x5000) != (kb == 0x5000))
    {
        return ka == 0x5000;
    }
    if (digit(ka) != digit(kb))
    {
        return digit(ka);
    }
    return NameUnits(a) > NameUnits(b);
}

// --- Records -----------------------------------------------------------------------------------

Contact NameRecord(const std::wstring& strName, wchar_t code)
{
    Contact record = {};
    std::copy_n(strName.begin(), std::min<size_t>(strName.size(), 31), record.szName);
    record.szLocalizerKey[0] = code;
    return record;
}

// Each kind makes records with few different keys and a rest that tells equal ones apart.
struct tag_NameKind
{
    static constexpr Common_Sort_enum TYPE = SORT_NAME;
    using Record = Contact;

    static bool Behind(const Contact& a, const Contact& b) { return NameBehind(a, b); }
    static bool Equal(const Contact& a, const Contact& b) { return NameUnits(a) == NameUnits(b); }
    // Any code with any name, among them names that fill their field without a terminator.
    static Contact Make(std::mt19937& rng)
    {
        static const wchar_t UNITS[] = {L'a', L'a', L'z', 0x4E00, 0xFFFE, 0xFFFF, 0x10000};
        static const wchar_t CODES[] = {0x1000, 0x4C3D, 0x4F19, 0x5000, 0x15000, 0x5A09, 0, 0x4C3E};
        std::wstring strName(rng() % 8 == 0 ? 31 : rng() % 4, L'a');
        std::generate(strName.begin(), strName.end(), [&] { return UNITS[rng() % 7]; });
        Contact record = NameRecord(rng() % 6 == 0 ? L"\x7FFFFFFF" : strName, CODES[rng() % 8]);
        record.iContactID = static_cast<int>(rng());
        return record;
    }
};

struct tag_TimeKind
{
    static constexpr Common_Sort_enum TYPE = SORT_TIME;
    using Record = Contact;

    static bool Behind(const Contact& a, const Contact& b)
    {
        return a.llLastTimeContacted < b.llLastTimeContacted;
    }
    static bool Equal(const Contact& a, const Contact& b) { return !Behind(a, b) && !Behind(b, a); }
    static Contact Make(std::mt19937& rng)
    {
        static const int64_t TIMES[] = {INT64_MIN, -1, 0, 1, 1LL << 31, 1LL << 32, INT64_MAX};
        Contact record = {};
        record.llLastTimeContacted = TIMES[rng() % 7];
        record.iContactID = static_cast<int>(rng());
        return record;
    }
};

struct tag_WordKind
{
    static constexpr Common_Sort_enum TYPE = SORT_PYWORD;
    using Record = PYOFWORDS;

    static std::vector<unsigned char> Word(const PYOFWORDS& record)
    {
        const auto* p = reinterpret_cast<const unsigned char*>(&record);
        return {p, std::find(p, p + sizeof(record), 0)};
    }
    static bool Behind(const PYOFWORDS& a, const PYOFWORDS& b) { return Word(a) > Word(b); }
    static bool Equal(const PYOFWORDS& a, const PYOFWORDS& b) { return Word(a) == Word(b); }
    // Some words run into the next field, some records hold no 0 at all.
    static PYOFWORDS Make(std::mt19937& rng)
    {
        static const unsigned char BYTES[] = {'a', 0x7F, 0x80, 0xE4, 0xFF};
        PYOFWORDS record = {};
        std::generate_n(Bytes(&record), sizeof(record),
                        [&] { return static_cast<char>(BYTES[rng() % 5]); });
        if (rng() % 8 != 0)
        {
            Bytes(&record)[rng() % 6] = 0;
        }
        return record;
    }
};

template <class T>
std::string AsBytes(const std::vector<T>& vRecords)
{
    return {reinterpret_cast<const char*>(vRecords.data()), vRecords.size() * sizeof(T)};
}

template <class TKind>
std::vector<typename TKind::Record> MakeRecords(std::mt19937& rng, size_t uCount)
{
    std::vector<typename TKind::Record> vRecords(uCount);
    std::generate(vRecords.begin(), vRecords.end(), [&] { return TKind::Make(rng); });
    return vRecords;
}

// --- The steps, word for word ------------------------------------------------------------------

template <class TKind>
void PlainQuickSort(std::vector<typename TKind::Record>& a, int lo, int hi)
{
    const auto at = [&a](int i) -> typename TKind::Record& { return a[static_cast<size_t>(i)]; };
    while (lo >= 0 && hi >= 0 && hi - lo >= 5)
    {
        const int mid = (lo + hi) / 2;
        for (const auto& pair : {std::pair(lo, mid), std::pair(lo, hi), std::pair(mid, hi)})
        {
            if (TKind::Behind(at(pair.first), at(pair.second)))
            {
                std::swap(at(pair.first), at(pair.second));
            }
        }
        std::swap(at(mid), at(hi - 1));
        const typename TKind::Record pivot = at(hi - 1);
        int i = lo;
        int j = hi - 1;
        for (;;)
        {
            while (i + 1 <= hi && TKind::Behind(pivot, at(i + 1)))
            {
                ++i;
            }
            --j;
            while (j >= i + 1 && TKind::Behind(at(j), pivot))
            {
                --j;
            }
            if (j < i + 1)
            {
                break;
            }
            std::swap(at(i + 1), at(j));
            ++i;
        }
        std::swap(at(i + 1), at(hi - 1));
        PlainQuickSort<TKind>(a, lo, j);
        lo = i + 2;
    }
}

template <class TKind>
void PlainInsertionSort(std::vector<typename TKind::Record>& a, size_t lo, size_t hi)
{
    for (size_t k = lo + 1; k <= hi; ++k)
    {
        for (size_t m = k; m > lo && TKind::Behind(a[m - 1], a[m]); --m)
        {
            std::swap(a[m - 1], a[m]);
        }
    }
}

// What a search of either form answers: an index, and whether it met an equal record.
using Place = std::pair<int, bool>;

// The search; bMarks is the form that tells whether it met an equal record.
template <class TKind>
Place PlainSearch(const std::vector<typename TKind::Record>& a, const typename TKind::Record& key,
                  bool bInsert, bool bMarks)
{
    const auto eq = [&](int i) { return TKind::Equal(key, a[static_cast<size_t>(i)]); };
    const auto gt = [&](int i) { return TKind::Behind(key, a[static_cast<size_t>(i)]); };
    const auto lt = [&](int i) { return TKind::Behind(a[static_cast<size_t>(i)], key); };
    const int iCount = static_cast<int>(a.size());
    int hi = iCount - 1;
    if (iCount == 0)
    {
        return {bInsert ? 0 : -1, false};
    }
    if (iCount == 1 && bInsert)
    {
        const bool bEqual = bMarks && !lt(0) && eq(0);
        return {lt(0) || bEqual ? 0 : 1, bEqual};
    }
    if (iCount == 1)
    {
        return {eq(0) ? 0 : -1, false};
    }
    if (bInsert && !gt(0))
    {
        return {0, bMarks && eq(0)};
    }
    if (bInsert && !lt(hi))
    {
        return bMarks && eq(hi) ? Place{hi, true} : Place{iCount, false};
    }
    if (!bInsert && (lt(0) || gt(hi) || eq(0) || eq(hi)))
    {
        return {lt(0) || gt(hi) ? -1 : eq(0) ? 0 : hi, false};
    }
    int lo = 0;
    while (lo <= hi)
    {
        const int mid = (lo + hi) / 2;
        if (eq(mid))
        {
            return {mid, bInsert && bMarks};
        }
        (lt(mid) ? hi : lo) = lt(mid) ? mid - 1 : mid + 1;
    }
    return {bInsert ? hi + 1 : -1, false};
}

template <class TKind>
class SorterOf : public testing::Test
{
};

using Kinds = testing::Types<tag_NameKind, tag_TimeKind, tag_WordKind>;
TYPED_TEST_SUITE(SorterOf, Kinds, );

} // namespace

TYPED_TEST(SorterOf, LeavesThePermutationOfItsStepsWhateverIsSorted)
{
    std::mt19937 rng(1);
    Common_Qsort sorter;
    for (int iRound = 0; iRound < ROUNDS; ++iRound)
    {
        auto vRecords = MakeRecords<TypeParam>(rng, 1 + rng() % MAX_RECORDS);
        auto vExpected = vRecords;
        const int iCount = static_cast<int>(vRecords.size());
        PlainQuickSort<TypeParam>(vExpected, 0, iCount - 1);
        PlainInsertionSort<TypeParam>(vExpected, 0, vExpected.size() - 1);
        ASSERT_EQ(sorter.QuickSort(Bytes(vRecords.data()), iCount, TypeParam::TYPE), iCount);
        ASSERT_EQ(AsBytes(vRecords), AsBytes(vExpected)) << "round " << iRound;
    }
}

TYPED_TEST(SorterOf, ComparesTwoRecordsByTheOrder)
{
    std::mt19937 rng(2);
    Common_Qsort sorter;
    sorter.InitInterData(TypeParam::TYPE);
    for (int iRound = 0; iRound < 20 * ROUNDS; ++iRound)
    {
        auto a = TypeParam::Make(rng);
        auto b = TypeParam::Make(rng);
        ASSERT_EQ(sorter.QSORT_GT(Bytes(&a), Bytes(&b)), TypeParam::Behind(a, b) ? 1 : 0);
        ASSERT_EQ(sorter.QSORT_LT(Bytes(&a), Bytes(&b)), TypeParam::Behind(b, a) ? 1 : 0);
        ASSERT_EQ(sorter.QSORT_EQ(Bytes(&a), Bytes(&b)), TypeParam::Equal(a, b) ? 1 : 0);
    }
}

TYPED_TEST(SorterOf, SortsByInsertionAloneWithEqualRecordsInTheirOrder)
{
    std::mt19937 rng(3);
    Common_Qsort sorter;
    sorter.InitInterData(TypeParam::TYPE);
    for (int iRound = 0; iRound < ROUNDS; ++iRound)
    {
        auto vRecords = MakeRecords<TypeParam>(rng, 1 + rng() % MAX_RECORDS);
        auto vExpected = vRecords;
        const size_t lo = rng() % vRecords.size();
        const size_t hi = lo + rng() % (vRecords.size() - lo);
        PlainInsertionSort<TypeParam>(vExpected, lo, hi);
        sorter.InsertionSort(Bytes(vRecords.data()), static_cast<int>(lo), static_cast<int>(hi));
        ASSERT_EQ(AsBytes(vRecords), AsBytes(vExpected)) << lo << ".." << hi;
    }
}

TYPED_TEST(SorterOf, SearchesAtEveryLength)
{
    std::mt19937 rng(4);
    Common_Qsort sorter;
    for (int iRound = 0; iRound < 10 * ROUNDS; ++iRound)
    {
        auto a = MakeRecords<TypeParam>(rng, rng() % 10);
        const int iCount = static_cast<int>(a.size());
        sorter.QuickSort(Bytes(a.data()), iCount, TypeParam::TYPE);
        // A null base has no record to look at, and an empty array asks for none.
        auto key = iCount > 0 && rng() % 2 == 0 ? a[rng() % a.size()] : TypeParam::Make(rng);
        for (const int bInsert : {0, 1})
        {
            int bFound = -7;
            const int iPlain =
                sorter.Search_Bin(Bytes(a.data()), iCount, Bytes(&key), TypeParam::TYPE, bInsert);
            const int iMarked = sorter.Search_BinEx(Bytes(a.data()), iCount, Bytes(&key),
                                                    TypeParam::TYPE, bInsert, &bFound);
            ASSERT_EQ((Place{iPlain, false}), PlainSearch<TypeParam>(a, key, bInsert == 1, false))
                << iCount;
            ASSERT_TRUE(bFound == -7 || bFound == 1);
            ASSERT_EQ((Place{iMarked, bFound == 1}),
                      PlainSearch<TypeParam>(a, key, bInsert == 1, true))
                << iCount;
        }
    }
}

// Records as a build makes them: the code fits the name's first unit, so that the order is a
// strict one and a stable sort may serve as the measure.
TEST(CommonQsort, SortsBuiltRecordsIntoNameOrder)
{
    const std::vector<Contact> vPool = {
        NameRecord(L"zoe", 0x4F19),     NameRecord(L"zhang \u5f20san \u4e09", 0x1000),
        NameRecord(L"anna", 0x4F00),    NameRecord(L"an \u5b89", 0x2000),
        NameRecord(L"7eleven", 0x5A07), NameRecord(L"# office", 0x5000),
        NameRecord(L"\x7FFFFFFF", 0),   NameRecord(L"zoe", 0x4F19)};
    std::vector<Contact> vExpected = vPool;
    std::stable_sort(vExpected.begin(), vExpected.end(),
                     [](const Contact& a, const Contact& b) { return NameBehind(b, a); });
    EXPECT_STREQ(vExpected[2].szName, L"zoe") << "letters before Chinese characters of one initial";
    EXPECT_STREQ(vExpected[4].szName, vPool[1].szName);
    EXPECT_EQ(vExpected.back().szName[0], NAME_EMPTY_MARK);
    std::mt19937 rng(5);
    for (int iRound = 0; iRound < ROUNDS; ++iRound)
    {
        std::vector<Contact> vRecords = vPool;
        std::shuffle(vRecords.begin(), vRecords.end(), rng);
        Common_Qsort().QuickSort(Bytes(vRecords.data()), 8, SORT_NAME);
        ASSERT_EQ(AsBytes(vRecords), AsBytes(vExpected));
    }
}

TEST(CommonQsort, RefusesWhatItCannotSort)
{
    std::mt19937 rng(6);
    std::vector<Contact> vRecords = MakeRecords<tag_TimeKind>(rng, 9);
    const std::string strBefore = AsBytes(vRecords);
    char* pBase = Bytes(vRecords.data());
    Common_Qsort sorter;
    EXPECT_EQ(sorter.QuickSort(nullptr, 9, SORT_TIME), -1);
    EXPECT_EQ(sorter.QuickSort(pBase, 0, SORT_TIME), -1);
    EXPECT_EQ(sorter.QuickSort(pBase, 9, UNKNOWN_KIND), -1);
    int bFound = 0;
    for (const int bInsert : {0, 1})
    {
        EXPECT_EQ(sorter.Search_Bin(pBase, 9, pBase, UNKNOWN_KIND, bInsert), -1);
        EXPECT_EQ(sorter.Search_BinEx(pBase, 9, pBase, UNKNOWN_KIND, bInsert, &bFound), -1);
        EXPECT_EQ(sorter.Search_Bin(nullptr, 9, pBase, SORT_TIME, bInsert), -1);
        EXPECT_EQ(sorter.Search_Bin(pBase, 9, nullptr, SORT_TIME, bInsert), -1);
        EXPECT_EQ(sorter.Search_BinEx(nullptr, -1, pBase, SORT_TIME, bInsert, &bFound),
                  bInsert == 1 ? 0 : -1);
    }
    EXPECT_EQ(bFound, 0);
    sorter.InitInterData(UNKNOWN_KIND);
    EXPECT_EQ(sorter.QSORT_EQ(pBase, pBase), -1);
    EXPECT_EQ(sorter.QSORT_GT(pBase, pBase), -1);
    EXPECT_EQ(sorter.QSORT_LT(pBase, pBase), -1);
    sorter.QuickSort1(pBase, 0, 8);
    sorter.InsertionSort(pBase, 0, 8);
    EXPECT_EQ(AsBytes(vRecords), strBefore);
    EXPECT_EQ(sorter.QuickSort(pBase, 9, SORT_TIME), 9) << "the object serves the next call";
}
