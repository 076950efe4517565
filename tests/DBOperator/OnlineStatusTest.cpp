#include "tests/DBOperator/ReaderFixture.h"
#include "tests/Support/MemoryFailure.h"

#include <cstdlib>

namespace
{

class COnlineTest : public CReaderTest
{
protected:
    // The places of the records that are online after a read, with a record for each status id
    // that is online before it; nothing when the read fails.
    std::vector<int> ReadOnline(const std::vector<int>& vStatusIds)
    {
        std::vector<tag_ContactsStruct> vRecords(vStatusIds.size());
        for (size_t i = 0; i < vStatusIds.size(); ++i)
        {
            vRecords[i].iStatusUpdateID = vStatusIds[i];
            vRecords[i].iFlags = CONTACT_FLAG_ONLINE;
        }
        tag_ContactsInfo set{static_cast<int32_t>(vRecords.size()), vRecords.data()};
        m_iResult = m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr);
        std::vector<int> vPlaces;
        for (size_t i = 0; i < vRecords.size(); ++i)
        {
            if (vRecords[i].iFlags != 0)
            {
                vPlaces.push_back(static_cast<int>(i));
            }
        }
        return vPlaces;
    }

    int m_iResult = -1;
};

} // namespace

TEST_F(COnlineTest, MarksTheFirstRecordOfEachOnlineStatus)
{
    m_clProvider.Execute("insert into status_updates values(-5,'online'),(0,'online'),(7,'away'),"
                         "(8,null),(9,'online'),(11,'online'),(12,'Online')");
    const std::string strFound = "CSQLiteOperator:Find one contact is sms online:statusid:";
    CLogCapture log;
    EXPECT_EQ((std::vector<int>{1, 2, 6}), ReadOnline({7, 9, 0, 8, 9, 0, -5, 12}));
    EXPECT_EQ(0, m_iResult);
    EXPECT_EQ((Lines{strFound + "-5\n", strFound + "0\n", strFound + "9\n"}),
              log.Texts(DEBUG_LINE));
}

// Whichever allocation is the first to fail: the read fails and changes nothing, or it finds the
// same records as with all its memory.
TEST_F(COnlineTest, FindsTheSameRecordsWithoutItsTable)
{
    m_clProvider.Execute("with recursive n(i) as (select -1000 union all select i+3 from n where "
                         "i<997) insert into status_updates select i,'online' from n");
    std::srand(1);
    std::vector<int> vStatusIds(3000);
    std::generate(vStatusIds.begin(), vStatusIds.end(), [] { return std::rand() % 2000 - 1000; });
    const std::vector<int> vOnline = ReadOnline(vStatusIds);
    EXPECT_GT(vOnline.size(), 100U);
    int iSuccesses = 0;
    for (int iGranted = 0, iFailures = 1; iFailures > 0; ++iGranted)
    {
        const CMemoryFailure failure(iGranted);
        const std::vector<int> vFound = ReadOnline(vStatusIds);
        iFailures = failure.Failures();
        EXPECT_EQ(m_iResult == 0 ? vOnline.size() : 3000U, vFound.size()) << iGranted;
        EXPECT_TRUE(m_iResult != 0 || vFound == vOnline) << iGranted;
        iSuccesses += m_iResult == 0 ? 1 : 0;
    }
    EXPECT_EQ(2, iSuccesses); // without the table, and with everything
}

TEST_F(COnlineTest, AReadWithoutMemoryFails)
{
    m_clProvider.Put({1});
    const CLogCapture log;
    for (int iGranted = 0, iFailures = 1; iFailures > 0; ++iGranted)
    {
        tag_ReadSet set;
        CSQLiteOperator clReader;
        const CMemoryFailure failure(iGranted);
        const int iResult = clReader.ReadAllLocalizer(&set, 0, nullptr);
        iFailures = failure.Failures();
        EXPECT_EQ(iFailures > 0 ? -1 : 0, iResult) << iGranted;
    }
    EXPECT_EQ(1, log.Count(ERROR_LINE, "QV_Contacts>>QV_ContactsLocalize_SO>>ReadAllLocalizer  "
                                       "NEW MEM ERR!!!!!!"));
}
