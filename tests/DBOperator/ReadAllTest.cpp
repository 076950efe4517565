#include "tests/DBOperator/ReaderFixture.h"

namespace
{

using CReadAllTest = CReaderTest;

} // namespace

TEST_F(CReadAllTest, CutsNamesAndKeysToTheirFields)
{
    const std::string strZhang = "张张张张张张张张张张"; // three bytes each
    const struct
    {
        std::string strText;
        std::wstring wstrName;
        std::wstring wstrKey;
    } TEXTS[] = {
        {std::string(40, 'x'), std::wstring(30, L'x'), std::wstring(10, L'x')},
        {strZhang + strZhang, std::wstring(10, L'\u5F20'), std::wstring(10, L'\u5F20')},
        // The last character would end behind the limit.
        {"x" + strZhang, L"x" + std::wstring(9, L'\u5F20'), L"x" + std::wstring(9, L'\u5F20')},
        // Not UTF-8 from some byte on.
        {"ab\xF0\x9F\x98\x80zz", L"ab", L"ab"},
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
    tag_ProviderContact contacts[] = {
        {1, "", "", IdText(99)}, {2, "", "", IdText(100)}, {3, "", "", "7.x.9", IdText(21)}};
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
    EXPECT_EQ(SECRET_GROUP_ID, set.pContacts[2].lGroupID[1]);
    EXPECT_EQ(0, set.pContacts[2].lGroupID[2]);
    EXPECT_EQ(20, set.pContacts[2].lAccountID[19]);
    EXPECT_EQ(0U, set.pContacts[2].iFlags & ~CONTACT_FLAG_SECRET);
}

TEST_F(CReadAllTest, ReadsTheListedVisibleContactsOnly)
{
    tag_ProviderContact hidden{4};
    hidden.bVisible = false;
    m_clProvider.PutAll({{1}, {2}, {3}, hidden, {5}});
    std::vector<long long> vIds = {5, 4, 2, 99};
    vIds.resize(201);
    const std::pair<long, std::vector<int>> COUNTS[] = {
        {1, {5}}, {200, {2, 5}}, {201, {1, 2, 3, 5}}, {-1, {1, 2, 3, 5}}};
    for (const auto& [lCount, vRead] : COUNTS)
    {
        tag_ReadSet set;
        ASSERT_EQ(0, m_clReader.ReadAllLocalizer(&set, lCount, vIds.data()));
        EXPECT_EQ(vRead, set.Ids()) << lCount;
    }
}

TEST_F(CReadAllTest, LogsTheStatements)
{
    m_clProvider.PutAll({{1}, {2}});
    long long llIds[] = {2, 1};
    const CLogCapture log;
    tag_ReadSet set;
    ASSERT_EQ(0, m_clReader.ReadAllLocalizer(&set, 2, llIds));
    const Lines EXPECTED = {
        "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> ReadAllLocalizer begin",
        "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_3 = "
        "select count(*) from contacts where cast(exists(select _id from visible_contacts where "
        "contacts._id = visible_contacts._id ) as integer)=1 and _id  in(2,1)\n",
        "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_4 = "
        "select _id,times_contacted,starred,has_phone_number,last_time_contacted,"
        "single_is_secret,photo_file_id,status_update_id  from contacts where cast(exists(select "
        "_id from visible_contacts where contacts._id = visible_contacts._id ) as integer)=1  "
        "and _id  in(2,1)\n",
        "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_5 = "
        "select contact_id,display_name,localizerkey,group_id,account_id,hasMail,hasAddress from "
        "localizer where contact_id  in(2,1)\n"};
    EXPECT_EQ(EXPECTED, log.Texts(DEBUG_LINE));
}
