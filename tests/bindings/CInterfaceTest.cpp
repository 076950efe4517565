// libqvlocalize as a program of C calls it: what the class behind it answers, what the changes
// leave, and what is refused. The searches of other languages are compared with the tool's in
// languages_test.py.

#include "bindings/c/qvlocalize.h"
#include "tests/Core/FacadeFixture.h"

#include <filesystem>
#include <set>
#include <tuple>

namespace
{

using Index = std::unique_ptr<qv_index, decltype(&qv_close)>;
using Result = std::unique_ptr<qv_result, decltype(&qv_result_free)>;

Index Open(const std::string& strDirectory)
{
    qv_index* pIndex = nullptr;
    EXPECT_EQ(qv_open(strDirectory.c_str(), &pIndex), QV_OK);
    return {pIndex, &qv_close};
}

// An index that is still to be built, of a database with contacts 1 to 6.
class CInterfaceTest : public CFacadeTest
{
protected:
    CInterfaceTest()
    {
        Store({Contact(1, "张三"), Contact(2, "李四"), Contact(3, "长孙无忌"), Contact(4, "Tom"),
               Contact(5, ""), Contact(6, "王小明")});
    }

    Result Search(const char* szText, const qv_result* pPrevious = nullptr)
    {
        const qv_query query = {szText, QV_KIND_WORD, nullptr, 0};
        qv_result* pResult = nullptr;
        EXPECT_EQ(qv_search(m_index.get(), &query, pPrevious, &pResult), QV_OK) << szText;
        return {pResult, &qv_result_free};
    }

    Index m_index = Open(m_directory.Root());
};

TEST_F(CInterfaceTest, SearchesWithinAResultAndPages)
{
    char szKey[QV_KEY_SIZE] = "?";
    EXPECT_EQ(qv_localizer_key(m_index.get(), "张三", szKey, sizeof(szKey)), QV_OK);
    EXPECT_EQ(szKey, LocalizerKeyOf("张三"));
    EXPECT_EQ(qv_needs_build(m_index.get()), 1) << "names need no index and make none";
    ASSERT_EQ(qv_build(m_index.get(), 0), QV_OK);
    EXPECT_EQ(qv_needs_build(m_index.get()), 0);
    const Result all = Search("");
    ASSERT_EQ(qv_result_count(all.get()), 6U);
    const qv_match* pAll = qv_result_matches(all.get());
    const qv_match* pPage = nullptr;
    EXPECT_EQ(qv_result_page(all.get(), 6, 0, &pPage), QV_OK);
    EXPECT_EQ(qv_result_page(all.get(), 2, 3, &pPage), QV_OK);
    EXPECT_EQ(pPage, pAll + 2);
    EXPECT_EQ(qv_result_page(all.get(), 1, 6, &pPage), QV_ERROR_ARGUMENT);
    EXPECT_EQ(qv_result_page(all.get(), SIZE_MAX, 2, &pPage), QV_ERROR_ARGUMENT);
    const Result found = Search("zhangs", all.get());
    ASSERT_EQ(qv_result_count(found.get()), 2U);
    EXPECT_EQ(qv_next_keys(found.get()), 0x501001U) << "a, m, u and w";
    EXPECT_STREQ(qv_candidates(found.get()), "孙三");
    const qv_match& match = qv_result_matches(found.get())[1];
    EXPECT_EQ(std::tie(match.contact_id, match.name_order, match.first, match.last),
              std::make_tuple(1, 4, 0, 1));
    EXPECT_EQ(std::wstring(match.codes, match.codes + 3), WideText(szKey) + L'\0');
    EXPECT_EQ(match.last_contacted, Contact(1, "").llLastTimeContacted);
    EXPECT_EQ(qv_result_matches(Search("qqq").get()), nullptr);
    // A result outlives its index and the store's next build.
    EXPECT_EQ(qv_build(m_index.get(), 1), QV_OK);
    m_index.reset();
    EXPECT_EQ(qv_result_find(all.get(), pAll[5].contact_id), 5);
    EXPECT_EQ(qv_result_find(all.get(), -5), -1);
}

TEST_F(CInterfaceTest, FollowsChangesOfTheDatabase)
{
    ASSERT_EQ(qv_build(m_index.get(), 0), QV_OK);
    m_provider.SetOnline(1005, true);
    EXPECT_EQ(qv_status_changed(m_index.get()), QV_OK);
    const int64_t aIds[] = {1, 2};
    m_provider.SetName(1, "张红", LocalizerKeyOf("张红"));
    m_provider.SetVisible(2, false);
    EXPECT_EQ(qv_contacts_changed(m_index.get(), aIds, 2), QV_OK);
    EXPECT_EQ(aIds[0], 1) << "the list stays the caller's";
    m_provider.SetStarred(3, true);
    EXPECT_EQ(qv_star_changed(m_index.get(), 3, 7), QV_OK);
    m_provider.SetLastTime(4, FIRST_TIME + 60'000);
    EXPECT_EQ(qv_time_changed(m_index.get(), 4, FIRST_TIME + 60'000), QV_OK);
    ExpectFresh();
    m_provider.SetVisible(2, true);
    EXPECT_EQ(qv_set_sort_type(m_index.get(), QV_SORT_TIME), QV_OK);
    EXPECT_EQ(qv_all_contacts_changed(m_index.get()), QV_OK);
    ExpectFresh();
    EXPECT_EQ(ReadStore().reg.iSortType, STORE_ORDER_TIME);
}

TEST_F(CInterfaceTest, RefusesWhatIsNoTextAndNoArgument)
{
    ASSERT_EQ(qv_build(m_index.get(), 0), QV_OK);
    const auto StatusOf = [this](const qv_query& query)
    {
        qv_result* pResult = reinterpret_cast<qv_result*>(this);
        const int iStatus = qv_search(m_index.get(), &query, nullptr, &pResult);
        EXPECT_EQ(pResult == nullptr, iStatus != QV_OK);
        qv_result_free(pResult);
        return iStatus;
    };
    const qv_filter NO_FILTER = {3, 0};
    for (const qv_query& query :
         {qv_query{nullptr, QV_KIND_WORD, nullptr, 0}, qv_query{"z", 3, nullptr, 0},
          qv_query{"z", -1, nullptr, 0}, qv_query{"z", QV_KIND_WORD, nullptr, 1},
          qv_query{"z", QV_KIND_WORD, &NO_FILTER, 1},
          qv_query{"z", QV_KIND_WORD, &NO_FILTER, SIZE_MAX}})
    {
        EXPECT_EQ(StatusOf(query), QV_ERROR_ARGUMENT) << query.kind << ' ' << query.filter_count;
    }
    const std::pair<int, const char*> TEXTS[] = {
        {QV_OK, "张张张张张张张张张张"},    {QV_OK, "\xF0\x9F\x98\x80"},
        {QV_OK, "\xF4\x8F\xBF\xBF"},        {QV_ERROR_UTF8, "\xF4\x90\x80\x80"}, // beyond U+10FFFF
        {QV_ERROR_UTF8, "\xED\xA0\x80"},                                         // a surrogate
        {QV_ERROR_UTF8, "\xC0\xBA"}, // three that are overlong
        {QV_ERROR_UTF8, "\xE0\x80\xBA"},    {QV_ERROR_UTF8, "\xF0\x80\x80\xBA"},
        {QV_ERROR_UTF8, "z\x80"}, // what begins no character
        {QV_ERROR_UTF8, "z\xFF"},           {QV_ERROR_UTF8, "z\xE5\xBC"}, // cut short
        {QV_ERROR_UTF8, "zhangsansix\xE5"}, {QV_ERROR_TOO_LONG, "zhangsansix"},
    };
    for (const auto& [iStatus, szTyped] : TEXTS)
    {
        EXPECT_EQ(StatusOf({szTyped, QV_KIND_WORD, nullptr, 0}), iStatus) << szTyped;
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
    EXPECT_EQ(qv_pick(m_index.get(), "zs", 2, "한", szText, sizeof(szText)), QV_ERROR_CHARACTER);
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
    const std::string strDatabase = m_directory.Root() + "/databases/contacts2.db";
    std::filesystem::remove(strDatabase);
    status(QV_ERROR_DATABASE);
    std::filesystem::create_directory(strDatabase);
    status(QV_ERROR_STORE);
    std::filesystem::remove(m_directory.File("pyfile.bin"));
    status(QV_ERROR_PINYIN);
    EXPECT_EQ(qv_set_sort_type(m_index.get(), QV_SORT_TIME), QV_ERROR_STORE);
    const qv_query query = {"z", QV_KIND_WORD, nullptr, 0};
    qv_result* pResult = nullptr;
    EXPECT_EQ(qv_search(m_index.get(), &query, nullptr, &pResult), QV_ERROR_NOT_BUILT);
    CDataDirectory::WriteBytes(m_directory.File("ContactsReg.bin"), std::string(12, '\0'));
    EXPECT_EQ(qv_result_count(Search("z").get()), 0U) << "an empty index is one";
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
