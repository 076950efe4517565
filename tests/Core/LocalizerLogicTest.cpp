// Building the index: what it says, what it writes and what it leaves when it fails; and the
// operations that the facade only hands on.

#include "Platform/LogSink.h"
#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/MemoryFailure.h"

#include <algorithm>
#include <cwchar>
#include <filesystem>
#include <functional>
#include <regex>

namespace fs = std::filesystem;

namespace
{

using Lines = std::vector<std::string>;

constexpr const char* MAIN_TAG = "QV_Localize";
constexpr const char* READER_TAG = "QV_ContactsLocalize_SO";

// The line with the milliseconds, which differ from run to run, left out.
tag_LogLine Timeless(const tag_LogLine& line)
{
    static const std::regex TIME(" time = [0-9]+\n$");
    return {line.iPriority, line.strTag, std::regex_replace(line.strText, TIME, " time = ms\n")};
}

// The lines that tell a build's order: all but the SQL texts.
std::vector<tag_LogLine> Story(const CLogCapture& log)
{
    std::vector<tag_LogLine> vStory;
    for (const tag_LogLine& line : log.Lines())
    {
        if (line.strText.find("sqlstat_") == std::string::npos)
        {
            vStory.push_back(Timeless(line));
        }
    }
    return vStory;
}

// Runs a function at the first line that contains a text, in the middle of the operation.
class CAtLine
{
public:
    CAtLine(const char* szText, std::function<void()> fnAct)
        : m_strText(szText), m_fnAct(std::move(fnAct))
    {
        CLogSink::Set(&CAtLine::Line, this);
    }
    ~CAtLine() { CLogSink::Set(nullptr, nullptr); }
    CAtLine(const CAtLine&) = delete;
    CAtLine& operator=(const CAtLine&) = delete;

private:
    static void Line(void* pContext, int /*iPriority*/, const char* /*szTag*/, const char* szText)
    {
        auto* pThis = static_cast<CAtLine*>(pContext);
        if (pThis->m_fnAct != nullptr && std::strstr(szText, pThis->m_strText.c_str()) != nullptr)
        {
            std::exchange(pThis->m_fnAct, nullptr)();
        }
    }

    std::string m_strText;
    std::function<void()> m_fnAct;
};

template <size_t N>
void SetText(wchar_t (&szField)[N], const std::wstring& strText)
{
    ASSERT_LT(strText.size(), N);
    std::copy(strText.begin(), strText.end(), szField);
}

std::string BytesOf(const Records& vRecords)
{
    return {reinterpret_cast<const char*>(vRecords.data()),
            vRecords.size() * sizeof(tag_ContactsStruct)};
}

} // namespace

class CMemInitTest : public CFacadeTest
{
protected:
    // Three contacts whose order differs by id, by name and by last contact.
    void StoreThree()
    {
        std::vector<tag_ProviderContact> vContacts(3);
        vContacts[0].iId = 5;
        vContacts[0].strName = "張三";
        vContacts[0].strGroups = "7.9";
        vContacts[0].strAccounts = "2.40";
        vContacts[0].bSecret = vContacts[0].bMail = vContacts[0].bAddress = true;
        vContacts[0].llLastTime = 5'000'000'000'123;
        vContacts[0].iTimes = 3;
        vContacts[0].iStatusId = 70;
        vContacts[0].bOnline = true;
        vContacts[1].iId = 6;
        vContacts[1].llLastTime = 6'000'000'000'000;
        vContacts[1].bPhone = vContacts[1].bStarred = true;
        vContacts[2].iId = 9;
        vContacts[2].strName = "Tom A";
        vContacts[2].llLastTime = 4;
        Store(vContacts);
        m_log.Clear();
    }

    // The last phase whose time was told.
    std::string LastPhase() const
    {
        static const std::regex PHASE("QV_Contacts: MemInit (\\w+) time = \\d+\n");
        std::string strPhase;
        for (const std::string& strText : m_log.Texts(DEBUG_LINE))
        {
            std::smatch match;
            strPhase = std::regex_match(strText, match, PHASE) ? match[1].str() : strPhase;
        }
        return strPhase;
    }

    // Their records in name order.
    Records ThreeByName()
    {
        Records vRecords(3, tag_ContactsStruct{});
        vRecords[0].iContactID = 9;
        vRecords[0].llLastTimeContacted = 4;
        SetText(vRecords[0].szName, L"tom a");
        SetText(vRecords[0].szLocalizerKey, L"\x4F13\x4F0E\x4F0C\x5000\x4F00");
        vRecords[1].iContactID = 5;
        vRecords[1].lGroupID[0] = 7;
        vRecords[1].lGroupID[1] = 9;
        vRecords[1].lGroupID[2] = SECRET_GROUP_ID;
        vRecords[1].lAccountID[0] = 2;
        vRecords[1].lAccountID[1] = 40;
        vRecords[1].iFlags =
            CONTACT_FLAG_SECRET | CONTACT_FLAG_MAIL | CONTACT_FLAG_ADDRESS | CONTACT_FLAG_ONLINE;
        vRecords[1].iSortIndex = 1;
        vRecords[1].llLastTimeContacted = 5'000'000'000'123;
        vRecords[1].iTimesContacted = 3;
        vRecords[1].iStatusUpdateID = 70;
        SetText(vRecords[1].szName, L"zhang 张san 三");
        std::wstring strKey = L"张三";
        m_logic.GetLocalizer(strKey.data(), vRecords[1].szLocalizerKey);
        vRecords[2].iContactID = 6;
        vRecords[2].iFlags = CONTACT_FLAG_PHONE | CONTACT_FLAG_STARRED;
        vRecords[2].iSortIndex = 2;
        vRecords[2].llLastTimeContacted = 6'000'000'000'000;
        vRecords[2].szName[0] = NAME_EMPTY_MARK;
        return vRecords;
    }
};

TEST_F(CMemInitTest, TellsEachStepInOrder)
{
    StoreThree();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    m_log.Clear();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const std::string strReader = "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> ";
    const std::vector<tag_LogLine> vExpected = {
        {DEBUG_LINE, MAIN_TAG, "QV_Contacts: MemInit IFL_InitalMap time = ms\n"},
        {DEBUG_LINE, READER_TAG, strReader + "ReadAllLocalizer begin"},
        {DEBUG_LINE, READER_TAG, "CSQLiteOperator:Find one contact is sms online:statusid:70\n"},
        {DEBUG_LINE, MAIN_TAG, "QV_Contacts: MemInit ReadAllLocalizer time = ms\n"},
        {DEBUG_LINE, MAIN_TAG, "QV_Contacts: MemInit IFL_PtrQuickSort time = ms\n"},
        {DEBUG_LINE, MAIN_TAG, "QV_Contacts:Lock TRY LOCK"},
        {DEBUG_LINE, MAIN_TAG, "QV_Contacts:LOCK RET = 1 "},
        {DEBUG_LINE, MAIN_TAG, "QV_Contacts:UnLock TRY UNLOCK"},
        {DEBUG_LINE, MAIN_TAG, "QV_Contacts:UNLOCK RET = 1 "},
        {DEBUG_LINE, MAIN_TAG, "QV_Contacts: MemInit InitContactRecord time = ms\n"},
    };
    EXPECT_EQ(Story(m_log), vExpected);
}

TEST_F(CMemInitTest, WritesTheFilesByteForByte)
{
    StoreThree();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    std::string strExpected = BytesOf(ThreeByName());
    strExpected.resize((3 + STORE_SPARE_RECORDS) * sizeof(tag_ContactsStruct));
    EXPECT_TRUE(RecordsFile() == strExpected);
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 0, 3 + STORE_SPARE_RECORDS}));
    EXPECT_TRUE(CDataDirectory::ReadBytes(CDataPaths::PinyinMapping()) ==
                CDataDirectory::ReadBytes(CDataPaths::PinyinSource()));

    // A smaller store keeps the file's size and what lies behind the capacity's last byte.
    m_provider.SetVisible(6, false);
    ASSERT_EQ(m_logic.MemInit(true), 0);
    EXPECT_TRUE(RecordsFile() == strExpected);
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 2 + STORE_SPARE_RECORDS}));
}

TEST_F(CMemInitTest, KeepsTheSortTypeAndWritesInItsOrder)
{
    StoreThree();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const struct
    {
        int iSortType;
        Ids vOrder;
    } CASES[] = {{1, {6, 5, 9}}, {7, {9, 5, 6}}, {-1, {9, 5, 6}}, {0, {9, 5, 6}}};
    for (const auto& row : CASES)
    {
        m_logic.SetSortType(row.iSortType);
        EXPECT_EQ(Reg(), (tag_ContactReg{3, row.iSortType, 0}));
        EXPECT_EQ(m_logic.GetSortType(), row.iSortType);
        ASSERT_EQ(m_logic.MemInit(true), 0);
        EXPECT_EQ(Reg(), (tag_ContactReg{3, row.iSortType, 3 + STORE_SPARE_RECORDS}));
        Records vExpected;
        const Records vByName = ThreeByName(); // with the places in name order, whatever the order
        for (const int iId : row.vOrder)
        {
            vExpected.push_back(*std::find_if(vByName.begin(), vByName.end(),
                                              [iId](const tag_ContactsStruct& record)
                                              { return record.iContactID == iId; }));
        }
        EXPECT_TRUE(BytesOf(StoredRecords(3)) == BytesOf(vExpected)) << row.iSortType;
    }
}

TEST_F(CMemInitTest, BuildsAnEmptyIndexWithoutConvertingAnything)
{
    ASSERT_EQ(m_logic.MemInit(false), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 0, STORE_SPARE_RECORDS}));
    EXPECT_FALSE(CDataDirectory::Exists(CDataPaths::ContactRecords()));
    const Lines vDebug = m_log.Texts(DEBUG_LINE);
    EXPECT_EQ(std::count_if(vDebug.begin(), vDebug.end(),
                            [](const std::string& strText)
                            { return strText.find("QV_Contacts: MemInit ") == 0; }),
              4);
    EXPECT_EQ(m_log.Texts(ERROR_LINE), Lines{}); // the sort type is not even looked for
    const tag_Found found = Search("");
    EXPECT_EQ(found.iRet, 0);
    EXPECT_EQ(found.set->iResultNum, 0);
    EXPECT_EQ(found.set->pDetail, nullptr);
    EXPECT_EQ(found.lMask, 0);
}

TEST_F(CMemInitTest, ReloadsWhenAFileIsMissingOrEmpty)
{
    StoreThree();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const std::string strMapping = CDataDirectory::ReadBytes(CDataPaths::PinyinMapping());
    const std::string strReg = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
    const std::string strMappingLine = "QV_Contacts: IsNeedReload 2 size = ";
    const std::string strRegLine = "QV_Contacts: IsNeedReload 4 size = 12\n";
    const struct
    {
        const char* szFile; // what is missing or has these bytes
        const char* szBytes;
        int iNeeded;
        Lines vLines;
    } CASES[] = {
        {"nothing", nullptr, 0, {strMappingLine + "709412\n", strRegLine}},
        {CDataPaths::PinyinMapping(), nullptr, 1, {}},
        {CDataPaths::PinyinMapping(), "", 1, {}},
        {CDataPaths::PinyinMapping(), "x", 0, {strMappingLine + "1\n", strRegLine}},
        {CDataPaths::ContactReg(), nullptr, 1, {strMappingLine + "709412\n"}},
        {CDataPaths::ContactReg(), "", 1, {strMappingLine + "709412\n"}},
        {CDataPaths::ContactRecords(), nullptr, 0, {strMappingLine + "709412\n", strRegLine}},
    };
    for (const auto& row : CASES)
    {
        SCOPED_TRACE(row.szFile);
        CDataDirectory::WriteBytes(CDataPaths::PinyinMapping(), strMapping);
        CDataDirectory::WriteBytes(CDataPaths::ContactReg(), strReg);
        fs::remove(row.szFile);
        if (row.szBytes != nullptr)
        {
            CDataDirectory::WriteBytes(row.szFile, row.szBytes);
        }
        m_log.Clear();
        EXPECT_EQ(IsNeedReload(), row.iNeeded);
        EXPECT_EQ(m_log.Texts(DEBUG_LINE), row.vLines);
        m_log.Clear();
        EXPECT_EQ(m_logic.MemInit(false), 0);
        EXPECT_EQ(LastPhase(), row.iNeeded == 1 ? "InitContactRecord" : "");
        EXPECT_EQ(m_log.Lines().size() == row.vLines.size(), row.iNeeded == 0);
        EXPECT_EQ(Reg(), (tag_ContactReg{3, 0, 3 + STORE_SPARE_RECORDS}));
    }
}

// What fails: the code, the last phase that is told, and an index that stays as it was.
TEST_F(CMemInitTest, FailsWithTheCodeOfTheStep)
{
    StoreThree();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const std::string strRecords = RecordsFile();
    const std::string strReg = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
    m_provider.Put({1, "Adam", "\u4F00"}); // would come first
    const std::string strSource = CDataPaths::PinyinSource();
    const std::string strMapping = CDataPaths::PinyinMapping();
    const std::string strDatabase = CDataPaths::Database();
    const std::string strAside = m_directory.File("aside");
    std::unique_ptr<CLockHolder> holder;

    const struct
    {
        const char* szWhat;
        std::function<void()> fnBreak;
        std::function<void()> fnRepair;
        int iCode;
        const char* szLastPhase;
    } CASES[] = {
        {"no source", [&] { fs::rename(strSource, strAside); },
         [&] { fs::rename(strAside, strSource); }, LOC_ERR_MAP, ""},
        {"no place for the shared table",
         [&]
         {
             fs::remove(strMapping);
             fs::create_directory(strMapping);
         },
         [&] { fs::remove(strMapping); }, LOC_ERR_MAP, ""},
        {"no database", [&] { fs::rename(strDatabase, strAside); },
         [&] { fs::rename(strAside, strDatabase); }, -1, "IFL_InitalMap"},
        {"no localizer row",
         [&] { m_provider.Execute("delete from localizer where contact_id=1"); },
         [&] {
             m_provider.Put({1, "Adam", "\u4F00"});
         },
         -1, "IFL_InitalMap"},
        {"lock held", [&] { holder = std::make_unique<CLockHolder>(); }, [&] { holder.reset(); },
         -1, "IFL_PtrQuickSort"},
        {"nothing broken", [] {}, [] {}, 0, "InitContactRecord"},
    };
    for (const auto& row : CASES)
    {
        SCOPED_TRACE(row.szWhat);
        CLocalizerLogic logic; // has no connection open to a database that was there before
        m_log.Clear();
        row.fnBreak();
        EXPECT_EQ(logic.MemInit(true), row.iCode);
        EXPECT_EQ(LastPhase(), row.szLastPhase);
        row.fnRepair();
        if (row.iCode != 0)
        {
            EXPECT_TRUE(RecordsFile() == strRecords);
            EXPECT_TRUE(CDataDirectory::ReadBytes(CDataPaths::ContactReg()) == strReg);
        }
    }
    EXPECT_EQ(Reg(), (tag_ContactReg{4, 0, 4 + STORE_SPARE_RECORDS}));
}

TEST_F(CMemInitTest, FailsWhenTheTableGoesBeforeTheNamesAreConverted)
{
    StoreThree();
    const CAtLine hook("MemInit ReadAllLocalizer", [] { fs::remove(CDataPaths::PinyinMapping()); });
    EXPECT_EQ(m_logic.MemInit(true), LOC_ERR_MAP);
    EXPECT_FALSE(CDataDirectory::Exists(CDataPaths::ContactReg()));
}

TEST_F(CMemInitTest, LeavesNewRecordsUnderTheOldRegistrationWhenOnlyThatFails)
{
    StoreThree();
    fs::create_directory(CDataPaths::ContactReg());
    EXPECT_EQ(m_logic.MemInit(true), -1);
    EXPECT_TRUE(BytesOf(StoredRecords(3)) == BytesOf(ThreeByName()));
    EXPECT_EQ(LastPhase(), "IFL_PtrQuickSort");
    fs::remove(CDataPaths::ContactReg());
    EXPECT_EQ(m_logic.MemInit(false), 0); // the lock is free again
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 0, 3 + STORE_SPARE_RECORDS}));
}

TEST_F(CMemInitTest, BuildsWithoutTheOnlineState)
{
    StoreThree();
    m_provider.Execute("drop table status_updates");
    EXPECT_EQ(m_logic.MemInit(true), 0);
    const std::vector<tag_LogLine> vStory = Story(m_log);
    const tag_LogLine lineError = {DEBUG_LINE, MAIN_TAG,
                                   "QV_Contacts: ReadAllSmsOnlineStatus  error = -1\n"};
    const auto place = std::find(vStory.begin(), vStory.end(), lineError);
    ASSERT_NE(place, vStory.end());
    EXPECT_EQ((place + 1)->strText, "QV_Contacts: MemInit ReadAllLocalizer time = ms\n");
    Records vExpected = ThreeByName();
    vExpected[1].iFlags &= ~CONTACT_FLAG_ONLINE;
    EXPECT_TRUE(BytesOf(StoredRecords(3)) == BytesOf(vExpected));
}

// The old index or the new one, of which only the online state may be missing.
TEST_F(CMemInitTest, LeavesAWholeIndexWheneverMemoryRunsOut)
{
    StoreThree();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const std::string strOld = RecordsFile();
    const tag_ContactReg regOld = Reg();
    m_provider.SetName(9, "Zoe", "\u4F19\u4F0E\u4F04");
    ASSERT_EQ(m_logic.MemInit(true), 0);
    const Records vNew = StoredRecords(3);
    int iFailures = 1;
    for (int iGranted = 0; iFailures > 0; ++iGranted)
    {
        SCOPED_TRACE(iGranted);
        CDataDirectory::WriteBytes(CDataPaths::ContactRecords(), strOld);
        int iRet = 0;
        {
            const CMemoryFailure failure(iGranted);
            iRet = m_logic.MemInit(true);
            iFailures = failure.Failures();
        }
        EXPECT_EQ(Reg(), regOld);
        if (iRet != 0)
        {
            EXPECT_TRUE(iRet == -1 || iRet == LOC_ERR_MAP) << iRet;
            EXPECT_GT(iFailures, 0);
            EXPECT_TRUE(RecordsFile() == strOld);
            continue;
        }
        Records vRecords = StoredRecords(3);
        if (iFailures > 0)
        {
            vRecords[1].iFlags |= CONTACT_FLAG_ONLINE;
        }
        EXPECT_TRUE(BytesOf(vRecords) == BytesOf(vNew));
    }
}

TEST_F(CMemInitTest, OneProcessBuildsAllProcessesRead)
{
    StoreThree();
    EXPECT_TRUE(RunInChild(
        []
        {
            CLocalizerLogic logic;
            EXPECT_EQ(logic.MemInit(false), 0);
        }));
    m_provider.Remove(9); // the other process's index is there: nothing is read
    EXPECT_EQ(m_logic.MemInit(false), 0);
    EXPECT_EQ(Search("").Contacts(), (Ids{9, 5, 6}));
}

// Another library user's lookups of names, and their failures, which are the callee's own.
TEST_F(CMemInitTest, HandsThePinyinOperationsOn)
{
    std::wstring strName = L"王Li 3";
    wchar_t szCodes[CONTACT_MAX_KEY + 1] = {};
    EXPECT_EQ(m_logic.GetLocalizer(strName.data(), szCodes), -1); // no shared table yet
    EXPECT_EQ(m_logic.CreatePinYinFileMapping(), -1);
    EXPECT_EQ(m_logic.GetLocalizer(nullptr, szCodes), LOC_ERR_PARAM);
    tag_ContactsStruct records[2] = {};
    std::copy(strName.begin(), strName.end(), records[0].szName);
    tag_ContactsInfo info = {2, records};
    EXPECT_EQ(m_logic.GetLocalizerBatch(&info), LOC_ERR_MAP);
    EXPECT_EQ(m_logic.GetLocalizerBatch(nullptr), LOC_ERR_PARAM);

    ASSERT_EQ(m_logic.MemInit(true), 0);
    EXPECT_EQ(m_logic.GetLocalizer(strName.data(), szCodes), 0);
    EXPECT_EQ(std::wstring(szCodes + 1), L"\x4F0B\x4F08\x5000\x5A03");
    EXPECT_TRUE(IsHanZiCode(CodeBits(szCodes[0])));
    EXPECT_EQ(m_logic.GetLocalizerBatch(&info), 0);
    EXPECT_EQ(std::wstring(records[0].szLocalizerKey), szCodes);
    EXPECT_EQ(records[1].szLocalizerKey[0], 0);

    const long hMap = m_logic.CreatePinYinFileMapping();
    ASSERT_GT(hMap, 0);
    wchar_t szAgain[CONTACT_MAX_KEY + 1] = {};
    EXPECT_EQ(m_logic.GetLocalizerString(hMap, strName.data(), szAgain), 0);
    EXPECT_EQ(std::wstring(szAgain), szCodes);
    EXPECT_EQ(m_logic.GetLocalizerString(0L, strName.data(), szAgain), LOC_ERR_PARAM);
    EXPECT_EQ(m_logic.ReleasePinYinFileMapping(hMap), 0);
    EXPECT_EQ(m_logic.ReleasePinYinFileMapping(-1), LOC_ERR_PARAM);

    std::wstring strTyped = L"zhangs";
    std::wstring strPicked = L"三";
    wchar_t szText[20] = {};
    EXPECT_EQ(m_logic.GetLocalizerString(strTyped.data(), 6, strPicked.data(), szText), 0);
    EXPECT_EQ(std::wstring(szText), L"ZHANG三");
}

TEST_F(CMemInitTest, HandsTheResultOperationsOn)
{
    BuildNames({"Ben", "Ann", "张三", "", "Bob"});
    const tag_Found found = Search("");
    ASSERT_EQ(found.Contacts(), (Ids{2, 1, 5, 3, 4}));
    tag_LocalizerResult page = {-7, nullptr};
    EXPECT_EQ(m_logic.GetSearchResult(found.set.get(), 5, 0, &page), -1);
    EXPECT_EQ(m_logic.GetSearchResult(found.set.get(), 4, 2, &page), -1);
    EXPECT_EQ(m_logic.GetSearchResult(nullptr, 0, 0, &page), -1);
    EXPECT_EQ(page.iResultNum, -7);
    EXPECT_EQ(m_logic.GetSearchResult(found.set.get(), 1, 3, &page), 0);
    EXPECT_EQ(page.iResultNum, 3);
    EXPECT_EQ(page.pDetail, found.set->pDetail + 1);
    EXPECT_EQ(m_logic.GetIndexByContactsId(found.set.get(), 3), 3);
    EXPECT_EQ(m_logic.GetIndexByContactsId(found.set.get(), 99), 0);
    EXPECT_EQ(m_logic.GetIndexByContactsId(nullptr, 3), -1);
    EXPECT_EQ(m_logic.GetFirstWordInfo(nullptr, nullptr), -1);
    EXPECT_EQ(m_logic.FreeSearchResult(nullptr), -1);
    CFilterChain* pChain = nullptr;
    EXPECT_EQ(m_logic.CreateFilterChain(nullptr, nullptr, 0, &pChain), -1);
    EXPECT_EQ(pChain, nullptr);
}
