#include "tests/DBOperator/ReaderFixture.h"
#include "tests/Support/MemoryFailure.h"

#include <cstdlib>

namespace
{

class COnlineTest : public CReaderTest
{
protected:
    std::vector<tag_ContactsStruct> m_vRecords;

    // Records with these status ids, every one of them marked online.
    void MakeRecords(const std::vector<int>& vStatusIds)
    {
        m_vRecords.assign(vStatusIds.size(), tag_ContactsStruct{});
        for (size_t i = 0; i < vStatusIds.size(); ++i)
        {
            m_vRecords[i].iStatusUpdateID = vStatusIds[i];
            m_vRecords[i].iFlags = CONTACT_FLAG_ONLINE | CONTACT_FLAG_PHONE;
        }
    }

    int ReadOnline()
    {
        tag_ContactsInfo set{static_cast<int32_t>(m_vRecords.size()), m_vRecords.data()};
        return m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr);
    }

    std::vector<int> OnlinePlaces() const
    {
        std::vector<int> vPlaces;
        for (size_t i = 0; i < m_vRecords.size(); ++i)
        {
            EXPECT_NE(0U, m_vRecords[i].iFlags & CONTACT_FLAG_PHONE);
            if ((m_vRecords[i].iFlags & CONTACT_FLAG_ONLINE) != 0)
            {
                vPlaces.push_back(static_cast<int>(i));
            }
        }
        return vPlaces;
    }
};

std::string FoundLine(int iStatusId)
{
    return "CSQLiteOperator:Find one contact is sms online:statusid:" + std::to_string(iStatusId) +
           "\n";
}

} // namespace

TEST_F(COnlineTest, MarksTheFirstRecordOfEachOnlineStatus)
{
    m_clProvider.Execute("insert into status_updates values(-5,'online'),(0,'online'),(7,'away'),"
                         "(8,null),(9,'online'),(11,'online'),(12,'Online')");
    const std::vector<std::string> LINES = {FoundLine(-5), FoundLine(0), FoundLine(9)};
    MakeRecords({7, 9, 0, 8, 9, 0, -5, 12});
    CLogCapture log;
    EXPECT_EQ(0, ReadOnline());
    EXPECT_EQ((std::vector<int>{1, 2, 6}), OnlinePlaces());
    EXPECT_EQ(LINES, log.Texts(DEBUG_LINE));
    EXPECT_TRUE(log.Texts(ERROR_LINE).empty());
}

// Whichever allocation is the first to fail: the read fails and changes nothing, or it finds the
// same records as with all its memory.
TEST_F(COnlineTest, FindsTheSameRecordsWithoutItsTable)
{
    std::srand(1);
    std::vector<int> vStatusIds(3000);
    std::generate(vStatusIds.begin(), vStatusIds.end(), [] { return std::rand() % 2000 - 1000; });
    m_clProvider.Execute("begin");
    for (int i = -1000; i < 1000; i += 3)
    {
        m_clProvider.SetOnline(i, true);
    }
    m_clProvider.Execute("commit");
    MakeRecords(vStatusIds);
    const std::vector<int> vUnchanged = OnlinePlaces();
    EXPECT_EQ(0, ReadOnline());
    const std::vector<int> vOnline = OnlinePlaces();
    EXPECT_GT(vOnline.size(), 100U);
    int iSuccesses = 0;
    for (int iGranted = 0, iFailures = 1; iFailures > 0; ++iGranted)
    {
        MakeRecords(vStatusIds);
        const CMemoryFailure failure(iGranted);
        const int iResult = ReadOnline();
        iFailures = failure.Failures();
        EXPECT_EQ(iResult == 0 ? vOnline : vUnchanged, OnlinePlaces()) << iGranted;
        iSuccesses += iResult == 0 ? 1 : 0;
    }
    EXPECT_EQ(2, iSuccesses); // without the table, and with everything
}

TEST_F(COnlineTest, ARecordArrayThatCannotBeHadFailsTheRead)
{
    m_clProvider.PutAll({{1}, {2}});
    const std::vector<std::string> LINES = {
        "QV_Contacts>>QV_ContactsLocalize_SO>>ReadAllLocalizer  NEW MEM ERR!!!!!!"};
    int iArrayFailures = 0;
    for (int iGranted = 0, iFailures = 1; iFailures > 0; ++iGranted)
    {
        CLogCapture log;
        tag_ReadSet set;
        CSQLiteOperator clReader;
        const CMemoryFailure failure(iGranted);
        const int iResult = clReader.ReadAllLocalizer(&set, 0, nullptr);
        iFailures = failure.Failures();
        EXPECT_EQ(iFailures > 0 ? -1 : 0, iResult) << iGranted;
        EXPECT_EQ(set.pContacts == nullptr ? 0 : 2, set.RecordNum) << iGranted;
        iArrayFailures += log.Texts(ERROR_LINE) == LINES ? 1 : 0;
    }
    EXPECT_EQ(1, iArrayFailures);
}
