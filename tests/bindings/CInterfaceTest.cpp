// libqvlocalize against the C++ class on one store. The library is the shared one, with a state of
// its own; the class is linked into this program.

#include "Core/LocalizerLogic.h"
#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "bindings/c/qvlocalize.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/ProviderDatabase.h"
#include "tests/Support/StoreImage.h"
#include "tools/ContactDatabase.h"
#include "tools/SampleContacts.h"

#include <algorithm>
#include <clocale>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <gtest/gtest.h>
#include <iterator>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <string>
#include <vector>

namespace
{

constexpr int CONTACTS = 400;
constexpr int64_t NOW = 1700000000000;
constexpr int32_t FILTER_KINDS[] = {QV_FILTER_GROUP,   QV_FILTER_ACCOUNT,     QV_FILTER_PHONE,
                                    QV_FILTER_STARRED, QV_FILTER_NOT_GROUP,   QV_FILTER_MAIL,
                                    QV_FILTER_POSTAL,  QV_FILTER_NOT_ACCOUNT, QV_FILTER_NOT_CONTACT,
                                    QV_FILTER_ONLINE};

using Index = std::unique_ptr<qv_index, decltype(&qv_close)>;
using Result = std::unique_ptr<qv_result, decltype(&qv_result_free)>;

Index Open(const std::string& strDirectory)
{
    qv_index* pIndex = nullptr;
    EXPECT_EQ(qv_open(strDirectory.c_str(), &pIndex), QV_OK);
    return {pIndex, &qv_close};
}

// UTF-8 by the C library, which takes characters beyond U+FFFF too.
std::string Utf8(const std::wstring& strText)
{
    std::string strUtf8(strText.size() * 4 + 1, '\0');
    strUtf8.resize(std::wcstombs(strUtf8.data(), strText.c_str(), strUtf8.size()));
    return strUtf8;
}
std::wstring FromUtf8(const std::string& strUtf8)
{
    std::wstring strText(strUtf8.size() + 1, L'\0');
    strText.resize(std::mbstowcs(strText.data(), strUtf8.c_str(), strText.size()));
    return strText;
}

// What is searched for, its text still to be typed.
struct tag_Question
{
    int32_t iKind = QV_KIND_WORD;
    std::vector<qv_filter> vFilters{};
};

// What the class answers.
struct tag_Answer
{
    std::shared_ptr<tag_LocalizerResult> set{};
    uint32_t uMask = 0;
    std::wstring strWords{};
};

class CInterfaceTest : public testing::Test
{
protected:
    CInterfaceTest()
    {
        m_directory.InstallPinyinTable();
        m_index = Open(m_directory.Root());
    }

    void FillDatabase()
    {
        CContactDatabase database = CContactDatabase::Replace(DatabaseFile());
        for (tag_DatabaseContact contact : MakeSampleContacts(CONTACTS, NOW))
        {
            contact.strKey = Key(contact.strName);
            database.Add(contact);
            m_vNames.push_back(contact.strName);
        }
        database.Commit();
    }

    std::string DatabaseFile() const { return m_directory.Root() + "/databases/contacts2.db"; }

    std::string Key(const std::string& strName)
    {
        char szKey[QV_KEY_SIZE] = "?";
        EXPECT_EQ(qv_localizer_key(m_index.get(), strName.c_str(), szKey, sizeof(szKey)), QV_OK);
        return szKey;
    }

    Result Search(const tag_Question& question, const std::string& strText,
                  const qv_result* pPrevious = nullptr)
    {
        const qv_query query = {strText.c_str(), question.iKind, question.vFilters.data(),
                                question.vFilters.size()};
        qv_result* pResult = nullptr;
        EXPECT_EQ(qv_search(m_index.get(), &query, pPrevious, &pResult), QV_OK) << strText;
        return {pResult, &qv_result_free};
    }

    tag_Answer AskClass(const tag_Question& question, std::wstring strText,
                        const tag_Answer& previous)
    {
        std::vector<int> vKinds(1);
        std::vector<QVLong32> vIds(1);
        for (const qv_filter& filter : question.vFilters)
        {
            vKinds.push_back(filter.kind);
            vIds.push_back(filter.id);
        }
        CFilterChain* pChain = nullptr;
        EXPECT_EQ(m_logic.CreateFilterChain(vKinds.data() + 1, vIds.data() + 1,
                                            static_cast<int>(question.vFilters.size()), &pChain),
                  0);
        const std::unique_ptr<CFilterChain> chain(pChain);
        wchar_t szWords[CN_WORD_MAX + 1] = {};
        long lMask = 0;
        tag_LocalizerResult* pSet = nullptr;
        EXPECT_EQ(m_logic.Search(previous.set.get(), strText.data(),
                                 static_cast<IME_SEARCH_TYPE>(question.iKind), pChain, 0, &pSet,
                                 &lMask, szWords),
                  0);
        return {std::shared_ptr<tag_LocalizerResult>(pSet, [this](tag_LocalizerResult* p)
                                                     { m_logic.FreeSearchResult(p); }),
                static_cast<uint32_t>(lMask), szWords};
    }

    static void ExpectSame(const qv_result* pResult, const tag_Answer& expected)
    {
        const tag_LocalizerResult& set = *expected.set;
        ASSERT_EQ(qv_result_count(pResult), static_cast<size_t>(set.iResultNum));
        EXPECT_EQ(qv_next_keys(pResult), expected.uMask);
        EXPECT_EQ(qv_candidates(pResult), Utf8(expected.strWords));
        const qv_match* pMatches = qv_result_matches(pResult);
        EXPECT_EQ(pMatches == nullptr, set.iResultNum == 0);
        for (int i = 0; i < set.iResultNum; ++i)
        {
            const tag_LocalizerDetail& detail = set.pDetail[i];
            ASSERT_EQ(pMatches[i].contact_id, detail.iContactID) << i;
            EXPECT_EQ(pMatches[i].name_order, detail.iSortIndex);
            EXPECT_EQ(pMatches[i].first, MatchFirst(detail.iMatchPos));
            EXPECT_EQ(pMatches[i].last, MatchLast(detail.iMatchPos));
            EXPECT_EQ(pMatches[i].index_character, detail.iFirstWord);
            EXPECT_EQ(pMatches[i].last_contacted, detail.llLastTimeContacted);
            EXPECT_EQ(std::memcmp(pMatches[i].codes, detail.szLocalizerKey,
                                  sizeof(detail.szLocalizerKey)),
                      0);
        }
    }

    // The beginning of a name or of a text, with what nobody types among them.
    std::wstring AnyText(std::mt19937& random) const
    {
        static const std::wstring TEXTS[] = {
            L"zhangs", L"ZS",           L"wxm",     L"lixiao", L"z#s",     L"tom#l",  L"张s",
            L"chang",  L"王\U0001F600", L"\u00E9a", L"zzz",    L"hjzhong", L"tianqi", L"xiaoming",
            L"94264",  L"97",           L"5494",    L"74#",    L"100",     L"2436"};
        const std::wstring strText = random() % 4 == 0
                                         ? FromUtf8(m_vNames[random() % m_vNames.size()])
                                         : TEXTS[random() % std::size(TEXTS)];
        return strText.substr(0, random() % (QV_MAX_TYPED + 1));
    }

    static tag_Question AnyQuestion(std::mt19937& random)
    {
        tag_Question question;
        question.iKind = static_cast<int32_t>(random() % 8);
        question.iKind = question.iKind > QV_KIND_SPECIAL ? question.iKind % 2 : question.iKind;
        for (size_t i = random() % 4; i > 0; --i)
        {
            const int32_t iKind = FILTER_KINDS[random() % std::size(FILTER_KINDS)];
            question.vFilters.push_back({iKind, static_cast<int32_t>(random() % 9) - 1});
        }
        return question;
    }

    CDataDirectory m_directory;
    CLocalizerLogic m_logic;
    Index m_index{nullptr, &qv_close};
    std::vector<std::string> m_vNames;
};

// Texts are typed on and taken back, so that a result is searched within and asked for afresh.
TEST_F(CInterfaceTest, AnswersLikeTheClass)
{
    FillDatabase();
    EXPECT_EQ(qv_needs_build(m_index.get()), 1);
    ASSERT_EQ(qv_build(m_index.get(), 0), QV_OK);
    EXPECT_EQ(qv_needs_build(m_index.get()), 0);
    std::mt19937 random(15);
    size_t uMatches = 0;
    for (const int iSortType : {QV_SORT_NAME, QV_SORT_TIME})
    {
        ASSERT_EQ(qv_set_sort_type(m_index.get(), iSortType), QV_OK);
        EXPECT_EQ(qv_get_sort_type(m_index.get()), iSortType);
        ASSERT_EQ(qv_build(m_index.get(), 1), QV_OK);
        for (int iRound = 0; iRound < 400; ++iRound)
        {
            const tag_Question question = AnyQuestion(random);
            const std::wstring strText = AnyText(random);
            Result result(nullptr, &qv_result_free);
            tag_Answer answer;
            for (size_t uTyped = random() % (strText.size() + 1); uTyped <= strText.size();
                 ++uTyped)
            {
                const std::string strTyped = Utf8(strText.substr(0, uTyped));
                SCOPED_TRACE(strTyped + ", round " + std::to_string(iRound));
                const Result previous = std::move(result);
                const tag_Answer before = answer;
                result = Search(question, strTyped, previous.get());
                answer = AskClass(question, strText.substr(0, uTyped), before);
                ExpectSame(result.get(), answer);
                if (previous != nullptr)
                {
                    ExpectSame(previous.get(), before);
                }
                uMatches += qv_result_count(result.get());
            }
            if (HasFatalFailure() || HasNonfatalFailure())
            {
                return;
            }
        }
    }
    EXPECT_GT(uMatches, 10000U) << "too little was compared";
}

TEST_F(CInterfaceTest, PagesAndFindsWithoutCopying)
{
    FillDatabase();
    ASSERT_EQ(qv_build(m_index.get(), 1), QV_OK);
    const Result result = Search({}, "");
    const size_t uCount = qv_result_count(result.get());
    const qv_match* pMatches = qv_result_matches(result.get());
    const qv_match* pPage = nullptr;
    EXPECT_EQ(qv_result_page(result.get(), uCount, 0, &pPage), QV_OK);
    EXPECT_EQ(qv_result_page(result.get(), 7, 3, &pPage), QV_OK);
    EXPECT_EQ(pPage, pMatches + 7);
    EXPECT_EQ(qv_result_page(result.get(), 1, uCount, &pPage), QV_ERROR_ARGUMENT);
    EXPECT_EQ(qv_result_page(result.get(), SIZE_MAX, 2, &pPage), QV_ERROR_ARGUMENT);
    EXPECT_EQ(qv_result_find(result.get(), -5), -1);
    // A result outlives its index and the store's next build.
    m_index.reset();
    EXPECT_EQ(m_logic.MemInit(true), 0);
    EXPECT_EQ(qv_result_find(result.get(), pMatches[9].contact_id), 9);
}

// Keys and picked characters are those of the class, for characters of any length.
TEST_F(CInterfaceTest, ConvertsNamesAndPicksLikeTheClass)
{
    FillDatabase(); // before there is an index
    m_vNames.insert(m_vNames.end(), {"\U0001F600\u5F20", "\u00E9\u0416z", std::string(4000, 'q')});
    std::vector<const char*> vNames;
    for (const std::string& strName : m_vNames)
    {
        vNames.push_back(strName.c_str());
    }
    std::vector<char[QV_KEY_SIZE]> vKeys(vNames.size());
    ASSERT_EQ(qv_localizer_keys(m_index.get(), vNames.data(), vNames.size(), vKeys.data()), QV_OK);
    for (size_t i = 0; i < vNames.size(); ++i)
    {
        wchar_t szCodes[CONTACT_MAX_KEY + 1] = {};
        EXPECT_EQ(m_logic.GetLocalizer(FromUtf8(m_vNames[i]).data(), szCodes), 0);
        EXPECT_EQ(vKeys[i], Utf8(szCodes)) << m_vNames[i];
    }
    const std::wstring TEXTS[] = {L"zhangs",      L"ZHANGSAN", L"",
                                  L"\U0001F600s", L"张s",      L"qqqqqqqqqq"};
    const std::wstring PICKED[] = {L"三", L"張", L"张", L"abc", L"", L"\U0001F600", L"三三", L"龘"};
    for (const std::wstring& strText : TEXTS)
    {
        for (const std::wstring& strWord : PICKED)
        {
            for (const int iPosition : {0, 1, static_cast<int>(strText.size()), 1000})
            {
                SCOPED_TRACE(Utf8(strText) + " " + Utf8(strWord) + std::to_string(iPosition));
                std::wstring strInput = strText;
                wchar_t szOut[64] = {};
                const int iRet = m_logic.GetLocalizerString(strInput.data(), iPosition,
                                                            std::wstring(strWord).data(), szOut);
                char szPicked[QV_PICK_SIZE] = "?";
                EXPECT_EQ(qv_pick(m_index.get(), Utf8(strText).c_str(), iPosition,
                                  Utf8(strWord).c_str(), szPicked, sizeof(szPicked)),
                          iRet == 0 ? QV_OK : QV_ERROR_CHARACTER);
                EXPECT_EQ(szPicked, iRet == 0 ? Utf8(szOut) : "?");
            }
        }
    }
    EXPECT_EQ(Key("\u4E09"), LocalizerKeyOf("三"));
    EXPECT_EQ(qv_needs_build(m_index.get()), 1) << "names need no index and make none";
}

// The changes leave the store that a build from the database makes.
TEST_F(CInterfaceTest, FollowsChangesOfTheDatabase)
{
    FillDatabase();
    ASSERT_EQ(qv_build(m_index.get(), 0), QV_OK);
    const auto DifferenceFromFresh = [this] {
        return DifferenceOf(ReadStore(), FreshBuild(m_directory.Root(), ReadStore().reg.iSortType));
    };
    CProviderDatabase provider;
    provider.Execute("update status_updates set status = 'online'");
    EXPECT_EQ(qv_status_changed(m_index.get()), QV_OK);
    const int64_t aIds[] = {1, 2};
    provider.SetName(1, "张红", Key("张红"));
    provider.SetVisible(2, false);
    EXPECT_EQ(qv_contacts_changed(m_index.get(), aIds, 2), QV_OK);
    EXPECT_EQ(aIds[0], 1) << "the list stays the caller's";
    provider.SetStarred(3, true);
    EXPECT_EQ(qv_star_changed(m_index.get(), 3, 7), QV_OK);
    provider.SetLastTime(4, NOW);
    EXPECT_EQ(qv_time_changed(m_index.get(), 4, NOW), QV_OK);
    EXPECT_EQ(DifferenceFromFresh(), "");
    provider.SetVisible(2, true);
    EXPECT_EQ(qv_set_sort_type(m_index.get(), QV_SORT_TIME), QV_OK);
    EXPECT_EQ(qv_all_contacts_changed(m_index.get()), QV_OK);
    EXPECT_EQ(DifferenceFromFresh(), "");
    EXPECT_EQ(ReadStore().reg.iSortType, STORE_ORDER_TIME);
}

TEST_F(CInterfaceTest, RefusesWhatIsNoTextAndNoArgument)
{
    FillDatabase();
    ASSERT_EQ(qv_build(m_index.get(), 0), QV_OK);
    const qv_filter NO_FILTER = {3, 0};
    std::multimap<int, qv_query> mapQueries = {
        {QV_ERROR_ARGUMENT, {nullptr, QV_KIND_WORD, nullptr, 0}},
        {QV_ERROR_ARGUMENT, {"z", 3, nullptr, 0}},
        {QV_ERROR_ARGUMENT, {"z", -1, nullptr, 0}},
        {QV_ERROR_ARGUMENT, {"z", QV_KIND_WORD, nullptr, 1}},
        {QV_ERROR_ARGUMENT, {"z", QV_KIND_WORD, &NO_FILTER, 1}},
        {QV_ERROR_ARGUMENT, {"z", QV_KIND_WORD, &NO_FILTER, SIZE_MAX}},
        {QV_ERROR_TOO_LONG, {"zhangsansix", QV_KIND_WORD, nullptr, 0}},
    };
    for (const char* szText : {"张张张张张张张张张张", "\xF0\x9F\x98\x80", "\xF4\x8F\xBF\xBF"})
    {
        mapQueries.insert({QV_OK, {szText, QV_KIND_WORD, nullptr, 0}});
    }
    // Beyond U+10FFFF, a surrogate, three that are overlong, two with what begins no character and
    // two that are cut short.
    for (const char* szText :
         {"\xF4\x90\x80\x80", "\xED\xA0\x80", "\xC0\xBA", "\xE0\x80\xBA", "\xF0\x80\x80\xBA",
          "z\x80", "z\xFF", "z\xE5\xBC", "zhangsansix\xE5"})
    {
        mapQueries.insert({QV_ERROR_UTF8, {szText, QV_KIND_WORD, nullptr, 0}});
    }
    for (const auto& [iStatus, query] : mapQueries)
    {
        qv_result* pResult = reinterpret_cast<qv_result*>(this);
        EXPECT_EQ(qv_search(m_index.get(), &query, nullptr, &pResult), iStatus) << iStatus;
        EXPECT_EQ(pResult == nullptr, iStatus != QV_OK);
        qv_result_free(pResult);
    }
    char szText[QV_PICK_SIZE] = "?";
    char szKeys[2][QV_KEY_SIZE] = {"?", "?"};
    const char* const NAMES[] = {"三", "\xFF"};
    EXPECT_EQ(qv_localizer_key(m_index.get(), "三", szText, 3), QV_ERROR_BUFFER);
    EXPECT_EQ(qv_localizer_key(m_index.get(), "三", szText, 0), QV_ERROR_BUFFER);
    EXPECT_EQ(qv_localizer_keys(m_index.get(), NAMES, 2, szKeys), QV_ERROR_UTF8);
    EXPECT_EQ(qv_pick(m_index.get(), "zs", -1, "三", szText, sizeof(szText)), QV_ERROR_ARGUMENT);
    EXPECT_EQ(qv_pick(m_index.get(), "zs", 2, "abcd", szText, sizeof(szText)), QV_ERROR_TOO_LONG);
    EXPECT_EQ(qv_pick(m_index.get(), "zs", 2, "三", szText, 4), QV_ERROR_BUFFER);
    EXPECT_STREQ(szText, "?");
    EXPECT_STREQ(szKeys[0], "?");
    EXPECT_EQ(qv_set_sort_type(m_index.get(), 2), QV_ERROR_ARGUMENT);
    EXPECT_EQ(qv_contacts_changed(m_index.get(), nullptr, 1), QV_ERROR_ARGUMENT);
    EXPECT_EQ(qv_build(nullptr, 0), QV_ERROR_ARGUMENT);
    EXPECT_EQ(qv_result_count(nullptr), 0U);
    EXPECT_STREQ(qv_candidates(nullptr), "");
    qv_result_free(nullptr);
    qv_close(nullptr);
    // Another directory, for as long as one index is open.
    const std::string strOther = m_directory.Root() + "/files";
    Open(m_directory.Root() + "/./files/../");
    qv_index* pIndex = m_index.get();
    EXPECT_EQ(qv_open(strOther.c_str(), &pIndex), QV_ERROR_OTHER_DIRECTORY);
    EXPECT_EQ(pIndex, nullptr);
    EXPECT_EQ(qv_open((strOther + "/none").c_str(), &pIndex), QV_ERROR_DIRECTORY);
}

TEST_F(CInterfaceTest, SaysWhatIsMissing)
{
    const auto status = [this](int iStatus)
    { EXPECT_EQ(qv_build(m_index.get(), 1), iStatus) << qv_strerror(iStatus); };
    std::filesystem::remove(DatabaseFile());
    status(QV_ERROR_DATABASE);
    std::filesystem::create_directory(DatabaseFile());
    status(QV_ERROR_STORE);
    std::filesystem::remove(m_directory.File("pyfile.bin"));
    status(QV_ERROR_PINYIN);
    EXPECT_EQ(qv_set_sort_type(m_index.get(), QV_SORT_TIME), QV_ERROR_STORE);
    const qv_query query = {"z", QV_KIND_WORD, nullptr, 0};
    qv_result* pResult = nullptr;
    EXPECT_EQ(qv_search(m_index.get(), &query, nullptr, &pResult), QV_ERROR_NOT_BUILT);
    CDataDirectory::WriteBytes(m_directory.File("ContactsReg.bin"), std::string(12, '\0'));
    EXPECT_EQ(qv_result_count(Search({}, "z").get()), 0U) << "an empty index is one";
    std::filesystem::remove(m_directory.File("PyFileMappint.bin"));
    EXPECT_EQ(qv_search(m_index.get(), &query, nullptr, &pResult), QV_ERROR_NOT_BUILT);
    char szKey[QV_KEY_SIZE];
    EXPECT_EQ(qv_localizer_key(m_index.get(), "三", szKey, sizeof(szKey)), QV_ERROR_PINYIN);
    std::set<std::string> words;
    for (int iStatus = QV_ERROR_PLATFORM - 1; iStatus <= QV_OK; ++iStatus)
    {
        EXPECT_TRUE(words.insert(qv_strerror(iStatus)).second) << iStatus;
    }
    EXPECT_EQ(qv_strerror(1), qv_strerror(-1000));
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_CTYPE, "C.UTF-8");
    testing::InitGoogleTest(&argc, argv);
    return RUN_ALL_TESTS();
}
