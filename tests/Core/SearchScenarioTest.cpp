// Searches through the facade on an index built from a real database: what is found where, what
// may follow, what is told, and what stays as it was when a search fails.

#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/MemoryFailure.h"

#include <algorithm>
#include <ctime>
#include <filesystem>
#include <functional>

namespace
{

using Lines = std::vector<std::string>;
using Places = std::vector<std::pair<int, int>>; // contact and iMatchPos

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

std::string Text(const std::vector<std::string>& vTexts)
{
    std::string strAll;
    for (const std::string& strText : vTexts)
    {
        strAll += strText;
    }
    return strAll;
}

std::wstring Sorted(const std::string& strUtf8)
{
    std::wstring strUnits = Wide(strUtf8);
    std::sort(strUnits.begin(), strUnits.end());
    return strUnits;
}

} // namespace

class CSearchTest : public CFacadeTest
{
protected:
    static Places PlacesOf(const tag_Found& found)
    {
        Places vPlaces;
        for (int i = 0; found.set != nullptr && i < found.set->iResultNum; ++i)
        {
            vPlaces.emplace_back(found.Entry(i).iContactID, found.Entry(i).iMatchPos);
        }
        return vPlaces;
    }

    static std::string IndexCharacters(const tag_Found& found)
    {
        std::string strAll;
        for (int i = 0; found.set != nullptr && i < found.set->iResultNum; ++i)
        {
            strAll += static_cast<char>(found.Entry(i).iFirstWord);
        }
        return strAll;
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
        Places vPlaces;
        const char* szKeys;
        const char* szWords;
    } CASES[] = {
        // Initials, whole readings and their beginnings, on the leftmost character that fits.
        {{"张三"}, "zs", WORD, {{1, At(0, 1)}}, "a", "三"},
        {{"李张三"}, "zs", WORD, {{1, At(1, 2)}}, "a", "三"},
        {{"张三"}, "zhangs", WORD, {{1, At(0, 1)}}, "a", "三"},
        {{"张三"}, "zhangsan", WORD, {{1, At(0, 1)}}, "", "三"},
        {{"张三"}, "zhan", WORD, {{1, At(0, 0)}}, "gs", "张"},
        {{"张三"}, "zx", WORD, {}, "", ""},
        {{"张张三"}, "zs", WORD, {{1, At(1, 2)}}, "a", "三"},
        // Of all ways to cut the text that fit, the last one decides.
        {{"先安"}, "xian", WORD, {{1, At(0, 1)}}, "a", "先安"},
        {{"先安", "先"}, "xian", WORD, {{2, At(0, 0)}, {1, At(0, 1)}}, "a", "先安"},
        {{"张三", "张三四"}, "94264726", NUM, {{1, At(0, 1)}, {2, At(0, 1)}}, "s", ""},
        // Every reading of a character counts.
        {{"长江"}, "c", WORD, {{1, At(0, 0)}}, "hj", "长"},
        {{"长江"}, "zh", WORD, {{1, At(0, 0)}}, "aj", "长"},
        {{"长江"}, "zhangj", WORD, {{1, At(0, 1)}}, "i", "江"},
        {{"长江"}, "24264", NUM, {{1, At(0, 0)}}, "j", ""},
        {{"长江"}, "94264", NUM, {{1, At(0, 0)}}, "j", ""},
        {{"单"}, "shan", WORD, {{1, At(0, 0)}}, "", "单"},
        {{"单"}, "dan", WORD, {{1, At(0, 0)}}, "", "单"},
        // Letters only one by one, in any case.
        {{"Tom"}, "to", WORD, {{1, At(0, 1)}}, "m", ""},
        {{"Tom"}, "TO", WORD, {{1, At(0, 1)}}, "m", ""},
        {{"Tom"}, "866", NUM, {{1, At(0, 2)}}, "", ""},
        {{"王Li"}, "wangli", WORD, {{1, At(0, 2)}}, "", ""},
        {{"王Li"}, "926454", NUM, {{1, At(0, 2)}}, "", ""},
        {{"王Li"}, "wli", WORD, {{1, At(0, 2)}}, "", ""},
        {{"王Li"}, "954", NUM, {{1, At(0, 2)}}, "", ""},
        {{"王Li"}, "wangl", WORD, {{1, At(0, 1)}}, "i", ""},
        // What lies between takes a key of its own.
        {{"张 三"}, "zs", WORD, {}, "", ""},
        {{"张 三"}, "z#s", WORD, {{1, At(0, 2)}}, "a", "三"},
        {{"张 三"}, "z", WORD, {{1, At(0, 0)}}, "h#", "张"},
        {{"张 三"}, "9#7", NUM, {}, "", ""},
        {{"张3三"}, "z#s", WORD, {{1, At(0, 2)}}, "a", "三"},
        {{"张3三"}, "937", NUM, {{1, At(0, 2)}}, "", ""},
        {{"张3三"}, "z3", WORD, {{1, At(0, 1)}}, "s", ""},
        // Ten keys leave no room for another; the candidates are told all the same.
        {{"张三四王"}, "zhangsansi", WORD, {{1, At(0, 2)}}, "", "四"},
        {{"张三四王"}, "zhangsans", WORD, {{1, At(0, 2)}}, "iw", "四"},
        {{"Abcdefghijk"}, "abcdefghij", WORD, {{1, At(0, 9)}}, "", ""},
        {{"Abcdefghijk"}, "k", WORD, {}, "", ""},
        // Initials before whole readings before beginnings; then the start, the span, the name.
        {{"林", "李", "Ali", "Lia"},
         "li",
         WORD,
         {{4, At(0, 1)}, {3, At(1, 2)}, {2, At(0, 0)}, {1, At(0, 0)}},
         "an",
         "李林"},
        {{"王小", "王晓", "小王"},
         "w",
         WORD,
         {{1, At(0, 0)}, {2, At(0, 0)}, {3, At(1, 1)}},
         "ax",
         "王"},
        // Chinese characters, typed simplified or traditional, alone and among letters.
        {{"张三", "張四"}, "张", WORD, {{1, 0}, {2, 0}}, "s", ""},
        {{"张三", "張四"}, "張", WORD, {{1, 0}, {2, 0}}, "s", ""},
        {{"张三", "张四"}, "張三", WORD, {{1, At(0, 1)}}, "", ""},
        {{"张三", "张四"}, "张s", WORD, {{1, At(0, 1)}, {2, At(0, 1)}}, "ai", "三四"},
        {{"张三", "张四"}, "zhang三", WORD, {{1, At(0, 1)}}, "", ""},
        {{"张三", "张四"}, "张", NUM, {}, "", ""},
        // Only the first four characters of a name are folded.
        {{"一二三四張"}, "張", WORD, {}, "", ""},
        {{"一二三四張"}, "zh", WORD, {{1, At(4, 4)}}, "a", "張"},
        // Nameless contacts are listed and never found.
        {{"", "张"}, "", WORD, {{2, 0}, {1, 0}}, "z", ""},
        {{"", "Z"}, "z", WORD, {{2, 0}}, "", ""},
        {{""}, "#", WORD, {}, "", ""},
        {{"李a", "长 5"}, "", NUM, {{2, 0}, {1, 0}}, "acz#l", ""},
        {{}, "z", WORD, {}, "", ""},
    };
    for (const auto& row : CASES)
    {
        SCOPED_TRACE(Text(row.vNames) + " / " + row.szInput);
        m_provider.Execute("delete from visible_contacts");
        BuildNames(row.vNames);
        const tag_Found found = Search(row.szInput, row.eType);
        EXPECT_EQ(found.iRet, 0);
        EXPECT_EQ(PlacesOf(found), row.vPlaces);
        EXPECT_EQ(found.lMask, Keys(row.szKeys)) << std::hex << found.lMask;
        EXPECT_EQ(found.strWords, row.szWords);
        EXPECT_EQ(found.set->pDetail == nullptr, row.vPlaces.empty());
        if (*row.szInput != 0)
        {
            EXPECT_EQ(Text({IndexCharacters(found)}), std::string(row.vPlaces.size(), '\0'));
        }
    }
}

TEST_F(CSearchTest, ChangesTheCallersTextInPlace)
{
    BuildNames({"张三"});
    wchar_t szCodes[CONTACT_MAX_KEY] = {};
    std::wstring strName = L"张三";
    ASSERT_EQ(m_logic.GetLocalizer(strName.data(), szCodes), 0);
    EXPECT_EQ(SearchWide(L"ZS").strInput, L"zs");
    EXPECT_EQ(SearchWide(L"Z張# 9").strInput, (std::wstring{L'z', szCodes[0]} + L"# 9"));
    const tag_Found again = SearchWide(SearchWide(L"張s").strInput); // codes stay codes
    EXPECT_EQ(again.Contacts(), Ids{1});
    EXPECT_EQ(again.strInput, (std::wstring{szCodes[0], L's'}));
    const tag_Found tooLong = SearchWide(L"ZHANGSANSIX");
    EXPECT_EQ(tooLong.iRet, LOC_ERR_PARAM);
    EXPECT_EQ(tooLong.strInput, L"zhangsansix");
}

TEST_F(CSearchTest, OffersAtMostTwentyCharacters)
{
    const std::string strNames = "张赵郑周朱祝庄邹左曾詹章翟钟竺卓宗臧祖宰再在早造则";
    std::vector<std::string> vNames;
    for (const wchar_t unit : Wide(strNames))
    {
        vNames.push_back(Narrow(std::wstring(1, unit)));
        vNames.push_back(vNames.back() + "a"); // no character twice
    }
    BuildNames(vNames);
    const tag_Found found = Search("z");
    EXPECT_EQ(found.set->iResultNum, 50);
    EXPECT_EQ(found.uWordUnits, 20U);
    std::wstring strWords = Sorted(found.strWords);
    EXPECT_EQ(std::unique(strWords.begin(), strWords.end()), strWords.end());
    EXPECT_TRUE(std::all_of(strWords.begin(), strWords.end(),
                            [&](wchar_t unit)
                            { return Wide(strNames).find(unit) != std::wstring::npos; }));
}

// What the caller narrows as the user types is what a search of the whole store gives.
TEST_F(CSearchTest, NarrowsKeyByKeyLikeTheWholeStore)
{
    const std::wstring strFirst = L"张王李赵长单曾刘";
    const std::wstring strSecond = L"小三长明 Aa9志";
    std::vector<std::string> vNames = {"", "Anna", "Zhang Li", "z9", "长长长"};
    for (const wchar_t first : strFirst)
    {
        for (const wchar_t second : strSecond)
        {
            vNames.push_back(Narrow({first, second, strFirst[vNames.size() % strFirst.size()]}));
        }
    }
    BuildNames(vNames);
    const std::pair<const char*, IME_SEARCH_TYPE> INPUTS[] = {
        {"zhangxiaoz", WORD}, {"zhangsan", WORD}, {"chang#l", WORD},   {"lz", WORD},
        {"张xi", WORD},       {"zc", WORD},       {"9426494264", NUM}, {"954", NUM},
        {"5426", NUM},        {"29", NUM},        {"wangali", WORD},   {"qq", WORD}};
    for (const auto& [szInput, eType] : INPUTS)
    {
        const std::wstring strAll = Wide(szInput);
        tag_Found last = SearchWide(L"", eType);
        ASSERT_EQ(last.Contacts().size(), vNames.size());
        for (size_t uLength = 1; uLength <= strAll.size(); ++uLength)
        {
            SCOPED_TRACE(Narrow(strAll.substr(0, uLength)));
            const tag_Found whole = SearchWide(strAll.substr(0, uLength), eType);
            const tag_Found narrowed = SearchWide(strAll.substr(0, uLength), eType, last.set);
            EXPECT_EQ(narrowed.iRet, 0);
            EXPECT_EQ(PlacesOf(narrowed), PlacesOf(whole));
            EXPECT_EQ(narrowed.lMask, whole.lMask);
            if (whole.uWordUnits < CN_WORD_MAX)
            {
                EXPECT_EQ(Sorted(narrowed.strWords), Sorted(whole.strWords));
            }
            last = narrowed;
        }
    }
}

TEST_F(CSearchTest, NarrowingReadsNeitherTheStoreNorTheFiltersAndKeepsTheSet)
{
    BuildNames({"张三", "李四", "张五"});
    const tag_Found all = Search("");
    const std::vector<tag_LocalizerDetail> vBefore(all.set->pDetail,
                                                   all.set->pDetail + all.set->iResultNum);
    std::filesystem::remove(CDataPaths::ContactRecords());
    std::filesystem::remove(CDataPaths::ContactReg());
    const CLockHolder holder;
    const auto pNobody = Chain({{FILTER_GROUP, 99}});
    m_log.Clear();
    for (int iTime = 0; iTime < 2; ++iTime)
    {
        EXPECT_EQ(Search("z", WORD, all.set, pNobody.get()).Contacts(), (Ids{1, 3}));
    }
    EXPECT_EQ(m_log.Texts(ERROR_LINE), Lines{});
    EXPECT_EQ(Search("fei", SPECIAL, all.set).Contacts(), Ids{}); // the set, not the numbers
    EXPECT_EQ(
        std::memcmp(all.set->pDetail, vBefore.data(), vBefore.size() * sizeof(tag_LocalizerDetail)),
        0);
    EXPECT_EQ(all.set->iResultNum, 3);
}

TEST_F(CSearchTest, ResultsDoNotChangeWithTheStore)
{
    BuildNames({"张三", "张五"});
    tag_Found all = Search("");
    const tag_Found found = Search("z", WORD, all.set);
    const tag_LocalizerDetail before = found.Entry(1);
    all.set.reset();
    m_provider.Remove(1);
    m_provider.SetName(2, "Ann", "\u4F00");
    ASSERT_EQ(m_logic.MemInit(true), 0);
    EXPECT_EQ(found.Contacts(), (Ids{1, 2}));
    EXPECT_EQ(std::memcmp(&found.Entry(1), &before, sizeof(before)), 0);
    EXPECT_EQ(Search("z").Contacts(), Ids{});
    EXPECT_EQ(Search("a").Contacts(), Ids{2});
}

// The fixed numbers need no index and pass every filter.
TEST_F(CSearchTest, FindsTheSpecialNumbers)
{
    ASSERT_EQ(CQVLocalizerManager::InitMapFile(), 0);
    const auto pNobody = Chain({{FILTER_GROUP, 99}, {FILTER_ONLINE, 0}});
    const struct
    {
        const char* szInput;
        const char* szIds;
    } CASES[] = {{"", "0123456"},     {"fj", "0"},       {"feijing", "0"},    {"zasg", "1"},
                 {"zhangaishe", "1"}, {"bddhch", "2"},   {"bendidianh", "2"}, {"hj", "3"},
                 {"huojing", "3"},    {"jjzx", "4"},     {"jijiuzhong", "4"}, {"tqyb", "5"},
                 {"tianqiyuba", "5"}, {"dljtsgbj", "6"}, {"daolujiaot", "6"}, {"警", "036"},
                 {"bj", "6"},         {"j", "4036"},     {"xyz", ""}};
    for (const auto& row : CASES)
    {
        const tag_Found found = Search(row.szInput, SPECIAL, nullptr, pNobody.get());
        EXPECT_EQ(found.iRet, 0);
        std::string strIds;
        for (const int iId : found.Contacts())
        {
            strIds += std::to_string(iId);
        }
        EXPECT_EQ(strIds, row.szIds) << row.szInput;
    }
}

TEST_F(CSearchTest, KeepsWhatPassesEveryFilter)
{
    // id, name, key, groups, accounts, time, times, status
    std::vector<tag_ProviderContact> vContacts = {
        {1, "Za", "", "4.9", "1", 0, 0, 11},
        {2, "Zb", "", "4", "1.2"},
        {3, "Zc", "", "9", "3"},
        {4, "Zd", "", "", "2"},
        {5, "Ze", "", "4", ""},
        {6, "B", "", "4", "1"},
    };
    vContacts[0].bOnline = true;
    vContacts[1].bPhone = vContacts[1].bStarred = true;
    vContacts[2].bMail = vContacts[2].bPhone = true;
    vContacts[3].bAddress = vContacts[3].bSecret = true;
    Store(vContacts);
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const std::pair<std::vector<std::pair<int, QVLong32>>, Ids> CASES[] = {
        {{}, {1, 2, 3, 4, 5}},
        {{{FILTER_GROUP, 4}}, {1, 2, 5}},
        {{{FILTER_GROUP, 4}, {FILTER_GROUP, 9}}, {1}},
        {{{FILTER_GROUP, SECRET_GROUP_ID}}, {4}},
        {{{FILTER_GROUP_EXPAND, SECRET_GROUP_ID}}, {1, 2, 3, 5}},
        {{{FILTER_ACCOUNT, 2}}, {2, 4}},
        {{{FILTER_ACCOUNT_EXPAND, 1}, {FILTER_ACCOUNT_EXPAND, 3}}, {2, 4, 5}},
        {{{FILTER_PHONE, 99}}, {2, 3}},
        {{{FILTER_PHONE, 0}, {FILTER_FAVOURITES, 7}}, {2}},
        {{{FILTER_MAIL, 0}}, {3}},
        {{{FILTER_POSTAL, 0}}, {4}},
        {{{FILTER_CONTACT_ID_EXPAND, 2}, {3, 1}, {99, 1}}, {1, 3, 4, 5}},
        {{{FILTER_ONLINE, 0}}, {1}},
        {{{FILTER_ONLINE, 0}, {FILTER_PHONE, 0}}, {}},
    };
    for (const auto& [vFilters, vIds] : CASES)
    {
        SCOPED_TRACE(vFilters.empty() ? -1 : vFilters[0].first);
        const auto pChain = Chain(vFilters);
        EXPECT_EQ(Search("z", WORD, nullptr, pChain.get()).Contacts(), vIds);
        EXPECT_EQ(Search("9", NUM, nullptr, pChain.get()).Contacts(), vIds);
    }
}

TEST_F(CSearchTest, ListsUnderIndexCharacters)
{
    constexpr long long DAY = 86400000;
    const long long llNow = static_cast<long long>(std::time(nullptr)) * 1000;
    const struct
    {
        const char* szName;
        long long llTime;
    } NAMES[] = {{"Ann", llNow - 29 * DAY},
                 {"zoe", llNow - 31 * DAY},
                 {"长江", llNow - 89 * DAY},
                 {"张三", llNow - 91 * DAY},
                 {"9", llNow - 181 * DAY},
                 {"", llNow - 361 * DAY},
                 {"-x", 0},
                 {"éa", llNow + DAY}};
    std::vector<tag_ProviderContact> vContacts;
    for (const auto& row : NAMES)
    {
        vContacts.push_back({static_cast<int>(vContacts.size()) + 1, row.szName});
        vContacts.back().llLastTime = row.llTime;
    }
    Store(vContacts);
    ASSERT_EQ(m_logic.MemInit(true), 0);

    const tag_Found byName = Search("");
    EXPECT_EQ(byName.Contacts(), (Ids{1, 3, 2, 4, 5, 7, 8, 6}));
    EXPECT_EQ(IndexCharacters(byName), "ACZZ####");
    EXPECT_EQ(byName.lMask, Keys("anzoecjsx#"));
    int iNameCounts[27] = {};
    EXPECT_EQ(m_logic.GetFirstWordInfo(byName.set.get(), iNameCounts), 0);
    EXPECT_EQ(m_logic.GetFirstWordInfo(byName.set.get(), iNameCounts), 0); // only adds
    EXPECT_EQ(iNameCounts[0], 2);
    EXPECT_EQ(iNameCounts[2], 2);
    EXPECT_EQ(iNameCounts[25], 4);
    EXPECT_EQ(iNameCounts[26], 8);

    m_logic.SetSortType(STORE_ORDER_TIME);
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const tag_Found byTime = Search("");
    EXPECT_EQ(byTime.Contacts(), (Ids{8, 1, 2, 3, 4, 5, 6, 7}));
    EXPECT_EQ(IndexCharacters(byTime), "11223455");
    EXPECT_EQ(byTime.lMask, byName.lMask);
    int iTimeCounts[6] = {};
    EXPECT_EQ(m_logic.GetFirstWordInfo(byTime.set.get(), iTimeCounts), 0);
    EXPECT_EQ((Ids(iTimeCounts, iTimeCounts + 6)), (Ids{2, 2, 1, 1, 2, 0}));
    EXPECT_EQ(m_logic.GetFirstWordInfo(Search("z").set.get(), iTimeCounts), 0);
    EXPECT_EQ(iTimeCounts[5], 3); // a set of an input has no index characters

    // A narrowed list keeps its order and takes the characters from the names.
    const tag_Found narrowed = Search("", WORD, byTime.set);
    EXPECT_EQ(narrowed.Contacts(), byTime.Contacts());
    EXPECT_EQ(IndexCharacters(narrowed), "#AZCZ###");
    // Matches rank by name, whatever the store's order.
    EXPECT_EQ(Search("z").Contacts(), (Ids{3, 2, 4}));
    EXPECT_EQ(IndexCharacters(Search("", SPECIAL)), "5555555");
}

// The code of each failing search, which leaves the caller's arguments as they were.
TEST_F(CSearchTest, FailsWithoutTouchingWhatItHandsOut)
{
    BuildNames({"张三"});
    const tag_Found last = Search("");
    std::wstring strTooLong = L"zszszszszsz";
    struct tag_Arguments
    {
        wchar_t* szInput;
        int iType;
        CFilterChain* pChain;
        tag_LocalizerResult** ppResult;
        long* pMask;
        wchar_t* szWords;
    };
    const struct
    {
        const char* szWhat;
        int iRet;
        std::function<void(tag_Arguments&)> fnSpoil;
    } CASES[] = {
        {"no chain", -1, [](tag_Arguments& arguments) { arguments.pChain = nullptr; }},
        {"no chain for the special numbers", -1,
         [](tag_Arguments& arguments)
         {
             arguments.pChain = nullptr;
             arguments.iType = SPECIAL;
         }},
        {"no result", -1, [](tag_Arguments& arguments) { arguments.ppResult = nullptr; }},
        {"no text", LOC_ERR_PARAM, [](tag_Arguments& arguments) { arguments.szInput = nullptr; }},
        {"no mask", LOC_ERR_PARAM, [](tag_Arguments& arguments) { arguments.pMask = nullptr; }},
        {"no words", LOC_ERR_PARAM, [](tag_Arguments& arguments) { arguments.szWords = nullptr; }},
        {"eleven characters", LOC_ERR_PARAM,
         [&](tag_Arguments& arguments) { arguments.szInput = strTooLong.data(); }},
        {"unknown type", 0, [](tag_Arguments& arguments) { arguments.iType = 3; }},
        {"unknown type alone", 0,
         [](tag_Arguments& arguments)
         { arguments = {nullptr, -1, arguments.pChain, arguments.ppResult, nullptr, nullptr}; }},
        {"no mapping from here on", LOC_ERR_MAP,
         [](tag_Arguments&) { std::filesystem::remove(CDataPaths::PinyinMapping()); }},
    };
    for (const auto& row : CASES)
    {
        for (tag_LocalizerResult* pLast :
             {last.set.get(), static_cast<tag_LocalizerResult*>(nullptr)})
        {
            SCOPED_TRACE(row.szWhat);
            tag_LocalizerResult untouched = {};
            tag_LocalizerResult* pResult = &untouched;
            long lMask = MASK_UNSET;
            wchar_t szWords[CN_WORD_MAX] = {};
            wchar_t szInput[] = L"zs";
            tag_Arguments arguments = {szInput, WORD, &m_everybody, &pResult, &lMask, szWords};
            row.fnSpoil(arguments);
            m_log.Clear();
            EXPECT_EQ(m_logic.Search(pLast, arguments.szInput,
                                     static_cast<IME_SEARCH_TYPE>(arguments.iType),
                                     arguments.pChain, 0, arguments.ppResult, arguments.pMask,
                                     arguments.szWords),
                      row.iRet);
            EXPECT_EQ(pResult, &untouched);
            EXPECT_EQ(lMask, MASK_UNSET);
            EXPECT_EQ(szWords[0], 0);
            EXPECT_EQ(std::wstring(szInput), L"zs");
            EXPECT_EQ(m_log.Lines().empty(), row.iRet == -1);
        }
    }
}

TEST_F(CSearchTest, TellsEachStepInOrder)
{
    BuildNames({"张三", "李四"});
    const auto pGroup = Chain({{FILTER_GROUP, 99}});
    const Lines START = {"QV_Contacts: Search Start\n"};
    const auto Copied = [](int iLeft)
    {
        return Lines{
            "QV_Contacts:Lock TRY LOCK",
            "QV_Contacts:LOCK RET = 1 ",
            "QV_Contacts:CopyContactsResult iContactCount = 2\n",
            "QV_Contacts:UnLock TRY UNLOCK",
            "QV_Contacts:UNLOCK RET = 1 ",
            "QV_Contacts: CopyContactsResult Filter Result Num = " + std::to_string(iLeft) + "\n"};
    };
    const Lines TIME = {"QV_Contacts: Search CopyContactsResult time = "};
    const auto Matched = [](int iMatches, const char* szMask)
    {
        return Lines{"QV_Contacts:DoSearch m_vLocateArray nCount = " + std::to_string(iMatches) +
                         "\n",
                     std::string("QV_Contacts:DoSearch QVLocalizerManger pMask = ") + szMask + "\n",
                     "QV_Contacts: Search IFL_Search time = "};
    };
    const tag_Found all = Search("");
    const struct
    {
        const char* szInput;
        int iType;
        const CFacadeTest::Set& last;
        CFilterChain* pChain;
        std::vector<Lines> vSteps;
    } CASES[] = {
        {"z", WORD, nullptr, nullptr, {START, Copied(2), TIME, Matched(1, "40080")}},
        {"z", NUM, nullptr, pGroup.get(), {START, Copied(0), TIME, Matched(0, "0")}},
        {"l", WORD, all.set, nullptr, {START, Matched(1, "40100")}},
        {"fj", SPECIAL, nullptr, nullptr, {START, TIME, Matched(1, "100")}},
        {"12345678901", NUM, nullptr, nullptr, {START, Copied(2), TIME, {Matched(0, "").back()}}},
        {"z", 3, nullptr, nullptr, {START, Copied(2), TIME}},
    };
    for (const auto& row : CASES)
    {
        SCOPED_TRACE(row.szInput);
        m_log.Clear();
        Search(row.szInput, static_cast<IME_SEARCH_TYPE>(row.iType), row.last, row.pChain);
        Lines vExpected;
        for (const Lines& vStep : row.vSteps)
        {
            vExpected.insert(vExpected.end(), vStep.begin(), vStep.end());
        }
        ASSERT_EQ(m_log.Lines().size(), vExpected.size()) << testing::PrintToString(m_log.Lines());
        for (size_t i = 0; i < vExpected.size(); ++i)
        {
            tag_LogLine line = m_log.Lines()[i];
            const size_t uTime = line.strText.find(" time = ");
            if (uTime != std::string::npos)
            {
                EXPECT_EQ(line.strText.find_first_not_of("0123456789", uTime + 8),
                          line.strText.size() - 1);
                EXPECT_EQ(line.strText.back(), '\n');
                line.strText.resize(uTime + 8);
            }
            EXPECT_EQ(line, (tag_LogLine{DEBUG_LINE, "QV_Localize", vExpected[i]}));
        }
    }
}

TEST_F(CSearchTest, FindsNothingWithoutIndexOrLock)
{
    ASSERT_EQ(CQVLocalizerManager::InitMapFile(), 0);
    EXPECT_EQ(Search("").iRet, 0);
    EXPECT_EQ(Search("").Contacts(), Ids{});
    BuildNames({"张三"});
    {
        const CLockHolder holder;
        const tag_Found found = Search("z");
        EXPECT_EQ(found.iRet, 0);
        EXPECT_EQ(found.Contacts(), Ids{});
        EXPECT_EQ(found.set->pDetail, nullptr);
        EXPECT_EQ(m_log.Texts(ERROR_LINE).size(), 6U);
        EXPECT_EQ(m_log.Texts(ERROR_LINE).back(),
                  "QV_Contacts:CopyContactsResult write share memo lock false return");
        EXPECT_EQ(Search("", SPECIAL).Contacts().size(), 7U);
    }
    EXPECT_EQ(Search("z").Contacts(), Ids{1});
}

// Memory ends at each allocation in turn: the code, the pointer handed out, nothing kept.
TEST_F(CSearchTest, SurvivesWithoutMemory)
{
    BuildNames({"张三", "李四", "张五", "Zoe"});
    const tag_Found all = Search("");
    const auto pChain = Chain({{FILTER_GROUP_EXPAND, 4}, {FILTER_ACCOUNT_EXPAND, 9}});
    const struct
    {
        const char* szInput;
        IME_SEARCH_TYPE eType;
        const Set& last;
        CFilterChain* pChain;
        Ids vIds;
    } CASES[] = {{"z", WORD, nullptr, &m_everybody, {4, 1, 3}},
                 {"zhangsan", WORD, nullptr, pChain.get(), {1}},
                 {"", NUM, nullptr, &m_everybody, {2, 4, 1, 3}},
                 {"9", NUM, all.set, &m_everybody, {4, 1, 3}},
                 {"j", SPECIAL, nullptr, &m_everybody, {4, 0, 3, 6}}};
    for (const auto& row : CASES)
    {
        int iFailures = 1;
        for (int iGranted = 0; iFailures > 0; ++iGranted)
        {
            SCOPED_TRACE(std::string(row.szInput) + " " + std::to_string(iGranted));
            m_log.Clear();
            std::wstring strInput = Wide(row.szInput);
            tag_LocalizerResult untouched = {};
            tag_LocalizerResult* pResult = &untouched;
            long lMask = 0;
            wchar_t szWords[CN_WORD_MAX + 1] = {};
            int iRet = 0;
            {
                const CMemoryFailure failure(iGranted);
                iRet = m_logic.Search(row.last.get(), strInput.data(), row.eType, row.pChain, 0,
                                      &pResult, &lMask, szWords);
                iFailures = failure.Failures();
            }
            const bool bSearched =
                m_log.Texts(DEBUG_LINE).back().find("IFL_Search") != std::string::npos;
            if (iRet != 0)
            {
                EXPECT_EQ(iRet, -1);
                EXPECT_GT(iFailures, 0);
                EXPECT_EQ(pResult, bSearched ? nullptr : &untouched);
                continue;
            }
            ASSERT_NE(pResult, nullptr);
            ASSERT_NE(pResult, &untouched);
            const tag_Found found = {0, Set(pResult, [this](tag_LocalizerResult* pSet)
                                            { m_logic.FreeSearchResult(pSet); })};
            if (iFailures == 0)
            {
                EXPECT_EQ(found.Contacts(), row.vIds);
            }
        }
        EXPECT_EQ(Search(row.szInput, row.eType, row.last, row.pChain).Contacts(), row.vIds);
    }
}
