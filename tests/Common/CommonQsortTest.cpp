// The sorter against the orders and the steps written down plainly: exact permutations of equal
// records, and both searches at every length at which they differ.

#include "Common/CommonQsort.h"

#include "Core/ContactRecords.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <random>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

namespace
{

using Contact = tag_ContactsStruct;
using Records = std::vector<Contact>;

std::vector<int64_t> NameUnits(const Contact& record)
{
    const wchar_t* pEnd = std::find(std::begin(record.szName), std::end(record.szName), L'\0');
    return {std::begin(record.szName), pEnd};
}

bool NameBehind(const Contact& a, const Contact& b)
{
    const auto isIn = [](const Contact& record, unsigned uFirst, unsigned uCount)
    {
        const unsigned uCode = static_cast<unsigned>(record.szLocalizerKey[0]) & 0xFFFFU;
        return uCode >= uFirst && uCode < uFirst + uCount;
    };
    const auto hanZi = [&](const Contact& record) { return isIn(record, 0x1000, 15422); };
    const auto alpha = [&](const Contact& record) { return isIn(record, 0x4F00, 26); };
    if (a.szName[0] == b.szName[0] && ((hanZi(a) && alpha(b)) || (alpha(a) && hanZi(b))))
    {
        return hanZi(a);
    }
    const auto keys = [&](const Contact& record)
    {
        return std::tuple(record.szName[0] == 0x7FFFFFFF, record.szLocalizerKey[0] == 0x5000,
                          isIn(record, 0x5A00, 10), NameUnits(record));
    };
    return keys(a) > keys(b);
}

// One order, on records with few different keys and a rest that tells equal ones apart.
class Sorter : public testing::TestWithParam<Common_Sort_enum>
{
protected:
    static bool Behind(const Contact& a, const Contact& b)
    {
        return GetParam() == SORT_NAME ? NameBehind(a, b)
                                       : a.llLastTimeContacted < b.llLastTimeContacted;
    }
    static bool Equal(const Contact& a, const Contact& b)
    {
        return GetParam() == SORT_NAME ? NameUnits(a) == NameUnits(b)
                                       : a.llLastTimeContacted == b.llLastTimeContacted;
    }

    // Any code with any name, among them names that fill their field without a terminator.
    Contact Make()
    {
        static const wchar_t UNITS[] = {L'a', L'z', 0x4E00, 0xFFFE, 0xFFFF, 0x10000};
        static const wchar_t CODES[] = {0x1000, 0x4C3D, 0x4F19, 0x5000, 0x15000, 0x5A09, 0, 0x4C3E};
        static const int64_t TIMES[] = {INT64_MIN, -1, 0, 1, 1LL << 31, 1LL << 32, INT64_MAX};
        Contact record = {};
        std::generate_n(record.szName, m_rng() % 8 == 0 ? 31 : m_rng() % 4,
                        [&] { return UNITS[m_rng() % 6]; });
        record.szName[0] = m_rng() % 6 == 0 ? 0x7FFFFFFF : record.szName[0];
        record.szLocalizerKey[0] = CODES[m_rng() % 8];
        record.llLastTimeContacted = TIMES[m_rng() % 7];
        record.iContactID = static_cast<int>(m_rng());
        return record;
    }
    Records MakeRecords(size_t uCount)
    {
        Records vRecords(uCount);
        std::generate(vRecords.begin(), vRecords.end(), [this] { return Make(); });
        return vRecords;
    }

    // --- The steps, one by one -----------------------------------------------------------------

    static void PlainQuickSort(Contact* a, int lo, int hi)
    {
        while (lo >= 0 && hi >= 0 && hi - lo >= 5)
        {
            const int mid = (lo + hi) / 2;
            for (const auto& [i, j] : {std::pair(lo, mid), std::pair(lo, hi), std::pair(mid, hi)})
            {
                if (Behind(a[i], a[j]))
                {
                    std::swap(a[i], a[j]);
                }
            }
            std::swap(a[mid], a[hi - 1]);
            const Contact pivot = a[hi - 1];
            int i = lo;
            int j = hi - 1;
            for (;; ++i)
            {
                while (i + 1 <= hi && Behind(pivot, a[i + 1]))
                {
                    ++i;
                }
                --j;
                while (j >= i + 1 && Behind(a[j], pivot))
                {
                    --j;
                }
                if (j < i + 1)
                {
                    break;
                }
                std::swap(a[i + 1], a[j]);
            }
            std::swap(a[i + 1], a[hi - 1]);
            PlainQuickSort(a, lo, j);
            lo = i + 2;
        }
    }

    static void PlainInsertionSort(Records& a)
    {
        for (size_t k = 1; k < a.size(); ++k)
        {
            for (size_t m = k; m > 0 && Behind(a[m - 1], a[m]); --m)
            {
                std::swap(a[m - 1], a[m]);
            }
        }
    }

    // An index, and whether the form that tells so met an equal record.
    static std::pair<int, bool> PlainSearch(const Records& a, const Contact& key, bool bInsert,
                                            bool bMarks)
    {
        const auto eq = [&](int i) { return Equal(key, a[static_cast<size_t>(i)]); };
        const auto gt = [&](int i) { return Behind(key, a[static_cast<size_t>(i)]); };
        const auto lt = [&](int i) { return Behind(a[static_cast<size_t>(i)], key); };
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
            return bMarks && eq(hi) ? std::pair(hi, true) : std::pair(iCount, false);
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

    std::mt19937 m_rng{1};
    Common_Qsort m_sorter;
};

INSTANTIATE_TEST_SUITE_P(Orders, Sorter, testing::Values(SORT_NAME, SORT_TIME));

} // namespace

TEST_P(Sorter, LeavesThePermutationOfItsStepsWhateverIsSorted)
{
    for (int iRound = 0; iRound < 500; ++iRound)
    {
        Records vRecords = MakeRecords(1 + m_rng() % 60);
        Records vExpected = vRecords;
        const int iCount = static_cast<int>(vRecords.size());
        PlainQuickSort(vExpected.data(), 0, iCount - 1);
        PlainInsertionSort(vExpected);
        m_sorter.QuickSort(reinterpret_cast<char*>(vRecords.data()), iCount, GetParam());
        for (size_t i = 0; i < vRecords.size(); ++i)
        {
            ASSERT_EQ(vRecords[i].iContactID, vExpected[i].iContactID) << "round " << iRound;
        }
    }
}

TEST_P(Sorter, SearchesAtEveryLength)
{
    for (int iRound = 0; iRound < 3000; ++iRound)
    {
        Records a = MakeRecords(m_rng() % 10);
        const int iCount = static_cast<int>(a.size());
        char* pBase = reinterpret_cast<char*>(a.data());
        m_sorter.QuickSort(pBase, iCount, GetParam());
        Contact key = iCount > 0 && m_rng() % 2 == 0 ? a[m_rng() % a.size()] : Make();
        char* pKey = reinterpret_cast<char*>(&key);
        for (const int bInsert : {0, 1})
        {
            int bFound = 0;
            const int iPlain = m_sorter.Search_Bin(pBase, iCount, pKey, GetParam(), bInsert);
            ASSERT_EQ(iPlain, PlainSearch(a, key, bInsert == 1, false).first);
            const int iMarked =
                m_sorter.Search_BinEx(pBase, iCount, pKey, GetParam(), bInsert, &bFound);
            ASSERT_EQ(std::pair(iMarked, bFound == 1), PlainSearch(a, key, bInsert == 1, true));
        }
    }
}

TEST(CommonQsort, RefusesEveryValueThatIsNoOrder)
{
    for (const int iKind : {2, 4, -1, INT_MAX})
    {
        const auto eKind = static_cast<Common_Sort_enum>(iKind);
        char szRecords[] = "ba";
        char szKey[] = "a";
        Common_Qsort sorter;
        EXPECT_EQ(-1, sorter.QuickSort(szRecords, 2, eKind));
        EXPECT_STREQ("ba", szRecords);
        EXPECT_EQ(-1, sorter.Search_Bin(szRecords, 2, szKey, eKind, 1));
        EXPECT_EQ(-1, sorter.QSORT_GT(szRecords, szKey));
    }
}
