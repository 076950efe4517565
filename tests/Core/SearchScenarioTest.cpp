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

constexpr int At(int iFirst, int iLast)
{
    return iFirst << 16 | iLast;
}

// The mask of these letters, '#' standing for all other keys.
long Keys(const std::string& strKeys)
{
    long lMask = 0;
    for (const char cKey : strKeys)
    {
        lMask |= cKey == '#' ? 0x4000000L : 1L << (cKey - 'a');
    }
    return lMask;
}

class CSearchTest : public CFacadeTest
{
protected:
    static std::string IndexCharacters(const tag_Found& found)
    {
        const auto vCharacters = found.Column(&tag_LocalizerDetail::iFirstWord);
        return {vCharacters.begin(), vCharacters.end()};
    }
};

// Contacts are 1, 2, ... in the order of the names.
TEST_F(CSearchTest, FindsRanksAndTellsWhatMayFollow)
{
    const struct
    {
        std::vector<std::string> vNames;
        const char* szInput;
        IME_SEARCH_TYPE eType;
        Ids vIds;
        std::vector<int32_t> vMatches;
        const char* szKeys;
        const char* szWords;
    } CASES[] = {
        // Initials, whole readings and their beginnings, on the leftmost character that fits.
        {{"李张三"}, "zs", WORD, {1}, {At(1, 2)}, "a", "三"},
        {{"张三"}, "zhangs", WORD, {1}, {At(0, 1)}, "a", "三"},
        {{"张三"}, "zx", WORD, {}, {}, "", ""},
        {{"先安", "先"}, "xian", WORD, {2, 1}, {At(0, 0), At(0, 1)}, "a", "先安"},
        // Every reading of a character counts.
        {{"长江"}, "c", WORD, {1}, {At(0, 0)}, "hj", "长"},
        {{"长江"}, "ZHANGJ", WORD, {1}, {At(0, 1)}, "i", "江"},
        // Letters only one by one; what lies between takes a key of its own.
        {{"王Li"}, "954", NUM, {1}, {At(0, 2)}, "", ""},
        {{"张 三"}, "zs", WORD, {}, {}, "", ""},
        {{"张 三"}, "z#s", WORD, {1}, {At(0, 2)}, "a", "三"},
        // Initials before beginnings.
        {{"林", "Lia"}, "li", WORD, {2, 1}, {At(0, 1), At(0, 0)}, "an", "林"},
        // Chinese characters among letters.
        {{"张三", "张四"}, "zhang三", WORD, {1}, {At(0, 1)}, "", ""},
        // Nameless contacts are listed and never found.
        {{"", "李a", "长 5"}, "", NUM, {3, 2, 1}, {0, 0, 0}, "acz#l", ""},
        {{""}, "#", WORD, {}, {}, "", ""},
    };
    for (const auto& row : CASES)
    {
        SCOPED_TRACE(row.vNames[0] + " / " + row.szInput);
        m_provider.Execute("delete from visible_contacts");
        BuildNames(row.vNames);
        const tag_Found found = Search(row.szInput, row.eType);
        EXPECT_EQ(found.iRet, 0);
        EXPECT_EQ(found.Contacts(), row.vIds);
        EXPECT_EQ(found.Column(&tag_LocalizerDetail::iMatchPos), row.vMatches);
        EXPECT_EQ(found.lMask, Keys(row.szKeys)) << std::hex << found.lMask;
        EXPECT_EQ(found.strWords, row.szWords);
    }
}

// The limits that the README states, each on a name of its own: texts that find it and texts that
// do not.
TEST_F(CSearchTest, StaysWithinItsLimits)
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
        {"张小三", WORD, {"zx", "xs", "zhangxiaos"}, {"zs", "zhangsan"}},
        {"吕布", WORD, {"lv", "lvb"}, {"lu"}},
        {"重庆", WORD, {"chong", "zhong", "cq", "zq"}, {"chong4"}},
        {"㐂久", WORD, {"#j", "j"}, {"㐂", "㐂久", "xj"}},
        {"李四张学友會長", WORD, {"hui", "xy"}, {"会", "會"}},
    };
    for (const auto& row : ROWS)
    {
        BuildNames({row.szName});
        for (const char* szText : row.vFound)
        {
            EXPECT_EQ(Search(szText, row.eType).Contacts(), Ids{1}) << szText << ' ' << row.szName;
        }
        for (const char* szText : row.vNotFound)
        {
            EXPECT_EQ(Search(szText, row.eType).Contacts(), Ids{}) << szText << ' ' << row.szName;
        }
    }
    EXPECT_EQ(Search("zhangsan12").lMask, 0);
    // The caller's text is changed in place.
    const std::string strCode = LocalizerKeyOf("李");
    EXPECT_EQ(Narrow(Search("Z李# 9").strInput), "z" + strCode + "# 9");
    EXPECT_EQ(Search(strCode + "s").Contacts(), Ids{1}) << "codes stay codes";
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
    const std::pair<const char*, long long> NAMES[] = {
        {"Ann", llNow - 29 * DAY},   {"zoe", llNow - 31 * DAY}, {"长江", llNow - 89 * DAY},
        {"张三", llNow - 181 * DAY}, {"-x", llNow - 361 * DAY}, {"", 0}};
    std::vector<tag_ProviderContact> vContacts;
    for (const auto& [szName, llTime] : NAMES)
    {
        vContacts.push_back({static_cast<int>(vContacts.size()) + 1, szName});
        vContacts.back().llLastTime = llTime;
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
    // A narrowed list keeps its order and takes the characters from the names.
    const tag_Found narrowed = Search("", WORD, byTime.set);
    EXPECT_EQ(narrowed.Contacts(), byTime.Contacts());
    EXPECT_EQ(IndexCharacters(narrowed), "AZCZ##");
    EXPECT_EQ(Search("z").Contacts(), (Ids{3, 2, 4})) << "matches rank by name in any order";
}

// The code of each failing search, which leaves the caller's arguments as they were.
TEST_F(CSearchTest, FailsWithoutTouchingWhatItHandsOut)
{
    wchar_t szInput[] = L"zs";
    tag_LocalizerResult untouched = {};
    tag_LocalizerResult* pResult = &untouched;
    CFilterChain* pChain = &m_everybody;
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
