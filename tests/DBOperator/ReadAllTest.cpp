#include "tests/DBOperator/ReaderFixture.h"

#include <cstring>

namespace
{

using CReadAllTest = CReaderTest;

constexpr long long LATE = 1700000000123LL;

std::string Repeat(const std::string& strPart, int iTimes)
{
    std::string strText;
    for (int i = 0; i < iTimes; ++i)
    {
        strText += strPart;
    }
    return strText;
}

// "1.2.3" and so on up to iLast.
std::string IdText(int iLast)
{
    std::string strText = "1";
    for (int i = 2; i <= iLast; ++i)
    {
        strText += "." + std::to_string(i);
    }
    return strText;
}

} // namespace

TEST_F(CReadAllTest, FillsEveryFieldOfTheVisibleContacts)
{
    tag_ProviderContact full{3, "张 Li", "\xE1\x80\x80\xE5\x80\x80", "3.12.40", "8.9"};
    full.llLastTime = LATE;
    full.iTimes = 17;
    full.iStatusId = 70;
    full.bStarred = full.bPhone = full.bSecret = full.bMail = full.bAddress = true;
    tag_ProviderContact hidden{2, "hidden", "h"};
    hidden.bVisible = false;
    m_clProvider.PutAll({tag_ProviderContact{1, "a"}, hidden, full});

    tag_ContactsStruct expected[2] = {};
    expected[0].iContactID = 1;
    expected[0].szName[0] = L'a';
    expected[1].iContactID = 3;
    std::copy_n(std::begin({3, 12, 40, -1}), 4, expected[1].lGroupID);
    std::copy_n(std::begin({8, 9}), 2, expected[1].lAccountID);
    expected[1].iFlags = 0x1F;
    expected[1].llLastTimeContacted = LATE;
    expected[1].iTimesContacted = 17;
    expected[1].iStatusUpdateID = 70;
    std::copy_n(L"\u5F20 Li", 4, expected[1].szName);
    std::copy_n(L"\u1000\u5000", 2, expected[1].szLocalizerKey);

    tag_ReadSet set;
    ASSERT_EQ(0, ReadAll(set));
    ASSERT_EQ(2, set.RecordNum);
    EXPECT_EQ(0, std::memcmp(expected, set.pContacts, sizeof(expected)));
}

TEST_F(CReadAllTest, CutsNamesAndKeysToTheirFields)
{
    const std::string strZhang = "张"; // three bytes
    const struct
    {
        std::string strText;
        std::wstring wstrName;
        std::wstring wstrKey;
    } TEXTS[] = {
        {"", L"", L""},
        {std::string(40, 'x'), std::wstring(30, L'x'), std::wstring(10, L'x')},
        {Repeat(strZhang, 14), std::wstring(10, L'\u5F20'), std::wstring(10, L'\u5F20')},
        // The last character would end behind the limit.
        {"x" + Repeat(strZhang, 10), L"x" + std::wstring(9, L'\u5F20'),
         L"x" + std::wstring(9, L'\u5F20')},
        // Not UTF-8 from some byte on.
        {"ab\xFFzz", L"ab", L"ab"},
        {"ab\xF0\x9F\x98\x80zz", L"ab", L"ab"},
        {"\x80z", L"", L""},
        {std::string("ab\0cd", 5), L"ab", L"ab"},
    };
    int iId = 0;
    for (const auto& text : TEXTS)
    {
        m_clProvider.Put({++iId, text.strText, text.strText});
    }
    tag_ReadSet set;
    ASSERT_EQ(0, ReadAll(set));
    for (int i = 0; i < set.RecordNum; ++i)
    {
        EXPECT_EQ(TEXTS[i].wstrName, set.pContacts[i].szName) << i;
        EXPECT_EQ(TEXTS[i].wstrKey, set.pContacts[i].szLocalizerKey) << i;
    }
}

TEST_F(CReadAllTest, KeepsAPlaceForTheSecretGroup)
{
    tag_ProviderContact contacts[] = {{1, "", "", IdText(99)},
                                      {2, "", "", IdText(100)},
                                      {3, "", "", "5..7"},
                                      {4, "", "", "7.x.9"},
                                      {5, "", "", "", IdText(21)}};
    for (tag_ProviderContact& contact : contacts)
    {
        contact.bSecret = true;
        m_clProvider.Put(contact);
    }
    tag_ReadSet set;
    ASSERT_EQ(0, ReadAll(set));
    for (int i = 0; i < 2; ++i)
    {
        EXPECT_EQ(99, set.pContacts[i].lGroupID[98]) << i;
        EXPECT_EQ(SECRET_GROUP_ID, set.pContacts[i].lGroupID[99]) << i;
    }
    const std::vector<std::vector<QVLong32>> GROUPS = {{5, -1, 7, 0}, {7, -1, 0, 0}, {-1, 0, 0, 0}};
    for (size_t i = 0; i < GROUPS.size(); ++i)
    {
        const QVLong32* pGroups = set.pContacts[i + 2].lGroupID;
        EXPECT_EQ(GROUPS[i], std::vector<QVLong32>(pGroups, pGroups + 4)) << i;
    }
    EXPECT_EQ(20, set.pContacts[4].lAccountID[19]);
    EXPECT_EQ(0U, set.pContacts[4].iFlags & ~CONTACT_FLAG_SECRET);
}

TEST_F(CReadAllTest, ReadsTheListedVisibleContactsOnly)
{
    tag_ProviderContact hidden{4};
    hidden.bVisible = false;
    m_clProvider.PutAll({{1}, {2}, {3}, hidden, {5}});
    std::vector<long long> vIds = {5, 4, 2, 99};
    vIds.resize(201);
    const struct
    {
        long lCount;
        std::vector<int> vRead;
    } COUNTS[] = {{1, {5}},          {4, {2, 5}},       {200, {2, 5}}, {201, {1, 2, 3, 5}},
                  {0, {1, 2, 3, 5}}, {-1, {1, 2, 3, 5}}};
    for (const auto& count : COUNTS)
    {
        tag_ReadSet set;
        ASSERT_EQ(0, m_clReader.ReadAllLocalizer(&set, count.lCount, vIds.data()));
        EXPECT_EQ(count.vRead, set.Ids()) << count.lCount;
    }
}

TEST_F(CReadAllTest, LogsTheStatements)
{
    m_clProvider.PutAll({{1}, {2}});
    long long llIds[] = {2, 1};
    CLogCapture log;
    tag_ReadSet set;
    ASSERT_EQ(0, m_clReader.ReadAllLocalizer(&set, 2, llIds));
    const std::vector<tag_LogLine> EXPECTED = {
        {DEBUG_LINE, DB_TAG,
         "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> ReadAllLocalizer begin"},
        {DEBUG_LINE, DB_TAG,
         "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_3 = "
         "select count(*) from contacts where cast(exists(select _id from visible_contacts where "
         "contacts._id = visible_contacts._id ) as integer)=1 and _id  in(2,1)\n"},
        {DEBUG_LINE, DB_TAG,
         "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_4 = "
         "select _id,times_contacted,starred,has_phone_number,last_time_contacted,"
         "single_is_secret,photo_file_id,status_update_id  from contacts where cast(exists(select "
         "_id from visible_contacts where contacts._id = visible_contacts._id ) as integer)=1  "
         "and _id  in(2,1)\n"},
        {DEBUG_LINE, DB_TAG,
         "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_5 = "
         "select contact_id,display_name,localizerkey,group_id,account_id,hasMail,hasAddress from "
         "localizer where contact_id  in(2,1)\n"}};
    EXPECT_EQ(EXPECTED, log.Lines());
}

TEST_F(CReadAllTest, RefusesMissingArguments)
{
    tag_ReadSet set;
    const std::string strLine = " QV_Contacts >>QV_ContactsLocalize_SO>>SQLiteOperator>> "
                                "ReadAllLocalizer: the input param is wrong!";
    CLogCapture log;
    EXPECT_EQ(-1, m_clReader.ReadAllLocalizer(nullptr, 0, nullptr));
    EXPECT_EQ(-1, m_clReader.ReadAllLocalizer(&set, 1, nullptr));
    EXPECT_EQ(2, log.Count(ERROR_LINE, strLine));
    EXPECT_EQ(-1, m_clReader.GetContactsCount(nullptr));
    EXPECT_EQ(-1, m_clReader.ReadAllSmsOnlineStatus(nullptr, 0, nullptr));
    int iFound = 0;
    EXPECT_EQ(-1, m_clReader.ReadContactsByID(1, nullptr, iFound));
}
