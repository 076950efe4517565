#include "tests/DBOperator/ReaderFixture.h"

#include <cstring>
#include <numeric>

namespace
{

using CSingleContactTest = CReaderTest;

// The place of a virtual operation, as it stands in a pointer to it.
template <typename T>
size_t SlotOf(T pfnOperation)
{
    size_t uOffset = 0;
    std::memcpy(&uOffset, &pfnOperation, sizeof(uOffset));
    return uOffset / sizeof(void*);
}

} // namespace

TEST(DBOperatorInterface, KeepsTheOrderOfItsSlots)
{
    EXPECT_EQ(2U, SlotOf(&CDBOperator::GetContactsCount));
    EXPECT_EQ(3U, SlotOf(&CDBOperator::ReadAllLocalizer));
    EXPECT_EQ(4U, SlotOf(&CDBOperator::ReadContactsByID));
    EXPECT_EQ(5U, SlotOf(&CDBOperator::ReadAllSmsOnlineStatus));
}

TEST(ParseIDString, StoresWhatTheTextHolds)
{
    const struct
    {
        const char* szText;
        int iMax;
        std::vector<QVLong32> vStored; // -9 where nothing is written
    } TEXTS[] = {{nullptr, 4, {-9, -9, -9, -9}},
                 {"3.12.40", 4, {3, 12, 40, -9}},
                 {"5..7", 4, {5, 0, 7, -9}},
                 {"7.x.9", 4, {7, -9, -9, -9}},
                 {"-7", 4, {-9, -9, -9, -9}},
                 {"1.2.3", 2, {1, 2, -9, -9}},
                 {"2147483648.4294967303", 4, {-2147483647 - 1, 7, -9, -9}}};
    CSQLiteOperator clReader;
    for (const auto& text : TEXTS)
    {
        std::vector<QVLong32> vIds(4, -9);
        clReader.ParseIDString(text.szText, vIds.data(), text.iMax);
        EXPECT_EQ(text.vStored, vIds) << (text.szText == nullptr ? "null" : text.szText);
    }
}

TEST_F(CSingleContactTest, FillsOneRecordVisibleOrNot)
{
    tag_ProviderContact contact{-4, "安", "k", IdText(101), "6"};
    contact.llLastTime = 1700000000123LL;
    contact.iTimes = 2;
    contact.iStatusId = 8;
    contact.bSecret = contact.bMail = true;
    contact.bVisible = false;
    m_clProvider.Put(contact);

    tag_ContactsStruct expected{};
    expected.iContactID = -4;
    std::iota(std::begin(expected.lGroupID), std::end(expected.lGroupID), 1);
    expected.lAccountID[0] = 6;
    expected.iFlags = CONTACT_FLAG_SECRET | CONTACT_FLAG_MAIL;
    expected.llLastTimeContacted = contact.llLastTime;
    expected.iTimesContacted = 2;
    expected.iStatusUpdateID = 77;
    expected.szName[0] = L'\u5B89';
    expected.szLocalizerKey[0] = L'k';

    CLogCapture log;
    tag_ContactsStruct record{};
    record.iStatusUpdateID = 77;
    int iFound = 5;
    ASSERT_EQ(0, m_clReader.ReadContactsByID(-4, &record, iFound));
    EXPECT_EQ(1, iFound);
    EXPECT_EQ(0, std::memcmp(&expected, &record, sizeof(record)));
    EXPECT_TRUE(log.Has(DEBUG_LINE, "QV_Contacts>>QV_ContactsLocalize_SO>> CSQLiteOperator "
                                    "ReadContactsByID iContactID = -4\n"));
}

TEST_F(CSingleContactTest, FoundTellsOfTheNameRow)
{
    m_clProvider.PutAll({{1, "a"}, {2, "b"}});
    m_clProvider.Execute("delete from contacts where _id=1; delete from localizer where "
                         "contact_id=2");
    const int cases[][3] = {{1, 1, 0}, {2, 0, 2}, {3, 0, 0}};
    for (const auto& [iId, iExpected, iFilledId] : cases)
    {
        tag_ContactsStruct record{};
        int iFound = -1;
        EXPECT_EQ(0, m_clReader.ReadContactsByID(iId, &record, iFound));
        EXPECT_EQ(iExpected, iFound) << iId;
        EXPECT_EQ(iFilledId, record.iContactID) << iId;
    }
}
