// Searches through the facade on an index built from a real database: what is found where, what
// may follow, what is told, and what stays as it was when a search fails.

#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"

#include <algorithm>
#include <ctime>
#include <filesystem>

namespace
{

constexpr IME_SEARCH_TYPE WORD = IME_SEARCH_WORD;
constexpr IME_SEARCH_TYPE NUM = IME_SEARCH_NUM;
constexpr IME_SEARCH_TYPE SPECIAL = IME_SEARCH_SPECIAL;

class CSearchTest : public CFacadeTest
{
protected:
    static std::string IndexCharacters(const tag_Found& found)
    {
        const auto vCharacters = found.Column(&tag_LocalizerDetail::iFirstWord);
        return {vCharacters.begin(), vCharacters.end()};
    }
};

// On a name of its own: texts that find it and, among them the limits that the README states, texts
// that do not.
TEST_F(CSearchTest, FindsWithinItsLimits)
{
    const struct
    {
        const char* szName;
        IME_SEARCH_TYPE eType;
        std::vector<const char*> vFound;
        std::vector<const char*> vNotFound;
    } ROWS[] = {
        {"José Álvarez", WORD, {"lvar", "jos###"}, {"lvare", "jose", "josé", "ja"}},
        {"John Smith", NUM, {"5646", "76484"}, {"56467", "5646#7"}},
        {"张小三", WORD, {"zx", "xs", "zhangxiaos", "zhang小"}, {"zs", "zhangsan"}},
        {"张 三", WORD, {"z#s"}, {"zs"}},
        {"王Li", NUM, {"954"}, {"9548"}},
        {"吕布", WORD, {"lv", "lvb"}, {"lu"}},
        {"长江", WORD, {"c", "ZHANGJ"}, {"cg"}},
        {"重庆", WORD, {"chong", "zhong", "cq", "zq"}, {"chong4"}},
        {"㐂久", WORD, {"#j", "j"}, {"㐂", "㐂久", "xj"}},
        {"李四张学友會長", WORD, {"hui", "xy"}, {"会", "會"}},
        {"", WORD, {""}, {"#"}}, // listed and never found
    };
    for (const auto& row : ROWS)
    {
        BuildNames({row.szName});
        for (const Ids& vIds : {Ids{1}, Ids{}})
        {
            for (const char* szText : vIds.empty() ? row.vNotFound : row.vFound)
            {
                EXPECT_EQ(Search(szText, row.eType).Contacts(), vIds) << szText << row.szName;
            }
        }
    }
}

TEST_F(CSearchTest, RanksAndTellsWhatMayFollow)
{
    BuildNames({"先安", "先", "李", "Lia"});
    const tag_Found found = Search("xian");
    EXPECT_EQ(found.Contacts(), (Ids{2, 1})) << "the shorter match first";
    EXPECT_EQ(found.Column(&tag_LocalizerDetail::iMatchPos), (std::vector<int32_t>{0, 1}));
    EXPECT_EQ(found.lMask, 1) << "an a";
    EXPECT_EQ(found.strWords, "先安");
    const tag_Found all = Search("", NUM);
    EXPECT_EQ(all.Contacts(), (Ids{4, 3, 2, 1}));
    EXPECT_EQ(all.lMask, 0x800901) << "a, i, l or x";
    // The caller's text is changed in place.
    const std::string strCode = LocalizerKeyOf("李");
    EXPECT_EQ(Utf8Text(Search("Z李# 9").strInput), "z" + strCode + "# 9");
    EXPECT_EQ(Search(strCode).Contacts(), Ids{3}) << "codes stay codes";
    EXPECT_EQ(Search("ZHANGSAN12").lMask, 0);
    EXPECT_EQ(Search("ZHANGSAN123").iRet, LOC_ERR_PARAM);
    EXPECT_EQ(Search("ZHANGSAN123").strInput, L"zhangsan123");
}

TEST_F(CSearchTest, NarrowingReadsNeitherTheStoreNorTheFiltersAndKeepsTheSet)
{
    BuildNames({"张三", "李四", "张五"});
    const tag_Found all = Search("");
    EXPECT_EQ(Search("fei", SPECIAL, all.set).Contacts(), Ids{}) << "the set, not the numbers";
    m_provider.Remove(1);
    ASSERT_EQ(m_logic.MemInit(true), 0);
    EXPECT_EQ(Search("z").Contacts(), Ids{3});
    std::filesystem::remove(CDataPaths::ContactReg());
    const CLockHolder holder;
    const auto pNobody = Chain(FILTER_GROUP, 99);
    m_log.Clear();
    for (int iTime = 0; iTime < 2; ++iTime)
    {
        EXPECT_EQ(Search("z", WORD, all.set, pNobody.get()).Contacts(), (Ids{1, 3}));
    }
    EXPECT_EQ(m_log.Texts(ERROR_LINE), Lines{});
    EXPECT_EQ(all.Contacts(), (Ids{2, 1, 3}));
}

TEST_F(CSearchTest, ListsUnderIndexCharacters)
{
    constexpr long long DAY = 86400000;
    const long long llNow = static_cast<long long>(std::time(nullptr)) * 1000;
    std::vector<tag_DatabaseContact> vContacts = {{1, "Ann"},  {2, "zoe"}, {3, "长江"},
                                                  {4, "张三"}, {5, "-x"},  {6, ""}};
    size_t uContact = 0;
    for (const int iDays : {29, 31, 89, 181, 361})
    {
        vContacts[uContact++].llLastTimeContacted = llNow - iDays * DAY;
    }
    Store(vContacts);
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const tag_Found byName = Search("");
    EXPECT_EQ(byName.Contacts(), (Ids{1, 3, 2, 4, 5, 6}));
    EXPECT_EQ(IndexCharacters(byName), "ACZZ##");
    int iCounts[27] = {};
    EXPECT_EQ(m_logic.GetFirstWordInfo(byName.set.get(), iCounts), 0);
    EXPECT_EQ((Ids{iCounts[0], iCounts[2], iCounts[25], iCounts[26]}), (Ids{1, 1, 2, 2}));
    tag_LocalizerResult page = {};
    EXPECT_EQ(m_logic.GetSearchResult(byName.set.get(), 1, 3, &page), 0);
    EXPECT_EQ(page.pDetail, byName.set->pDetail + 1);
    EXPECT_EQ(m_logic.GetIndexByContactsId(byName.set.get(), 4), 3);

    m_logic.SetSortType(STORE_ORDER_TIME);
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const tag_Found byTime = Search("");
    EXPECT_EQ(byTime.Contacts(), (Ids{1, 2, 3, 4, 5, 6}));
    EXPECT_EQ(IndexCharacters(byTime), "122455");
    std::fill(std::begin(iCounts), std::end(iCounts), 0);
    EXPECT_EQ(m_logic.GetFirstWordInfo(byTime.set.get(), iCounts), 0);
    // A narrowed list keeps its order and takes the characters from the names.
    const tag_Found narrowed = Search("", WORD, byTime.set);
    EXPECT_EQ(narrowed.Contacts(), byTime.Contacts());
    EXPECT_EQ(IndexCharacters(narrowed), "AZCZ##");
    EXPECT_EQ(m_logic.GetFirstWordInfo(narrowed.set.get(), iCounts), 0);
    EXPECT_EQ(Ids(iCounts, iCounts + 7), (Ids{1, 2, 0, 1, 2, 6, 0})) << "of both";
    EXPECT_EQ(Search("z").Contacts(), (Ids{3, 2, 4})) << "matches rank by name in any order";
}

// The code of each failing search, which leaves the caller's arguments as they were.
TEST_F(CSearchTest, FailsWithoutTouchingWhatItHandsOut)
{
    wchar_t szInput[] = L"zs";
    tag_LocalizerResult untouched = {};
    tag_LocalizerResult* pResult = &untouched;
    CFilterChain* const pChain = &m_everybody;
    long lMask = MASK_UNSET;
    wchar_t szWords[CN_WORD_MAX] = {};
    const auto Code =
        [&](wchar_t* szText, int iType, CFilterChain* pFilters, long* pMask, wchar_t* szOut)
    {
        const auto eType = static_cast<IME_SEARCH_TYPE>(iType);
        return m_logic.Search(nullptr, szText, eType, pFilters, 0, &pResult, pMask, szOut);
    };
    EXPECT_EQ(Code(szInput, WORD, pChain, &lMask, szWords), LOC_ERR_MAP) << "no pinyin table";
    EXPECT_EQ(Code(szInput, SPECIAL, nullptr, &lMask, szWords), -1);
    EXPECT_EQ(Code(nullptr, WORD, pChain, &lMask, szWords), LOC_ERR_PARAM);
    EXPECT_EQ(Code(szInput, WORD, pChain, nullptr, szWords), LOC_ERR_PARAM);
    EXPECT_EQ(Code(szInput, WORD, pChain, &lMask, nullptr), LOC_ERR_PARAM);
    EXPECT_EQ(Code(nullptr, -1, pChain, nullptr, nullptr), 0);
    EXPECT_EQ(pResult, &untouched);
    EXPECT_EQ(lMask, MASK_UNSET);
    EXPECT_EQ(szWords[0], 0);
    EXPECT_STREQ(szInput, L"zs");
    // Only the result has no place: the keys that can follow are told all the same.
    BuildNames({"张三"});
    EXPECT_EQ(m_logic.Search(nullptr, szInput, WORD, pChain, 0, nullptr, &lMask, szWords), -1);
    EXPECT_NE(lMask, MASK_UNSET);
    EXPECT_NE(szWords[0], 0);
    // Without the lock only the fixed numbers are found, which pass every filter.
    const CLockHolder holder;
    EXPECT_EQ(Search("z").iRet, 0);
    EXPECT_EQ(Search("z").Contacts(), Ids{});
    EXPECT_EQ(m_log.Texts(ERROR_LINE).back(),
              "QV_Contacts:CopyContactsResult write share memo lock false return");
    const auto pNobody = Chain(FILTER_GROUP, 99);
    EXPECT_EQ(Search("j", SPECIAL, nullptr, pNobody.get()).Contacts(), (Ids{4, 0, 3, 6}));
    EXPECT_EQ(Search("警", SPECIAL).Contacts(), (Ids{0, 3, 6}));
}

} // namespace
