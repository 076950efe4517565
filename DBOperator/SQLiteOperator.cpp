#include "DBOperator/SQLiteOperator.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "DBOperator/ContactRow.h"
#include "DBOperator/SqlIdList.h"
#include "DBOperator/SqlStatement.h"
#include "DBOperator/StatusIndex.h"

#include <algorithm>
#include <cstdio>
#include <new>
#include <unistd.h>

namespace
{

constexpr char SELECT_COUNT[] =
    "select count(*) from contacts where cast(exists(select _id from visible_contacts where "
    "contacts._id = visible_contacts._id ) as integer)=1";
constexpr char SELECT_CONTACTS[] =
    "select _id,times_contacted,starred,has_phone_number,last_time_contacted,single_is_secret,"
    "photo_file_id,status_update_id  from contacts where cast(exists(select _id from "
    "visible_contacts where contacts._id = visible_contacts._id ) as integer)=1 ";
constexpr char SELECT_LOCALIZER[] =
    "select contact_id,display_name,localizerkey,group_id,account_id,hasMail,hasAddress from "
    "localizer";
constexpr char SELECT_ONLINE[] =
    "select status_update_data_id from status_updates where status=\"online\"";
constexpr char SELECT_CONTACT_BY_ID[] =
    "select _id,times_contacted,starred,has_phone_number,last_time_contacted,single_is_secret,"
    "photo_file_id  from contacts where _id = %d";
constexpr char SELECT_LOCALIZER_BY_ID[] =
    "select contact_id,display_name,localizerkey,group_id,account_id,hasMail,hasAddress from "
    "localizer where contact_id = %d";
constexpr char AND_ID[] = " and _id ";
constexpr char WHERE_CONTACT_ID[] = " where contact_id ";

constexpr size_t LIST_STATEMENT_SIZE =
    sizeof(SELECT_CONTACTS) + sizeof(AND_ID) + CSqlIdList::TEXT_SIZE;
static_assert(sizeof(SELECT_LOCALIZER) + sizeof(WHERE_CONTACT_ID) <=
                  sizeof(SELECT_CONTACTS) + sizeof(AND_ID),
              "the contacts query is the longest");
constexpr size_t ID_STATEMENT_SIZE = 200;
static_assert(sizeof(SELECT_CONTACT_BY_ID) + sizeof("-2147483648") <= ID_STATEMENT_SIZE &&
                  sizeof(SELECT_LOCALIZER_BY_ID) + sizeof("-2147483648") <= ID_STATEMENT_SIZE,
              "any id fits");

// A query, limited to the ids of a list when there is one.
class CListStatement
{
public:
    CListStatement(const char* szQuery, const char* szJoin, const CSqlIdList& ids)
    {
        std::snprintf(m_szText, sizeof(m_szText), "%s%s%s", szQuery, ids.IsEmpty() ? "" : szJoin,
                      ids.Text());
    }
    const char* Text() const { return m_szText; }

private:
    char m_szText[LIST_STATEMENT_SIZE];
};

// The log lines of a count that is busy or fails; SQLite's result follows the error texts.
struct tag_CountLines
{
    const char* szBusy;
    void (*pfnLogTry)(int iTry);
    const char* szPrepareError;
    const char* szStepError;
};

void LogReadCountTry(int iTry)
{
    QV_LOGE(DB_LOG_TAG,
            " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select contacts count "
            "sqlite3_step is busy try %d times",
            iTry);
}

void LogGetCountTry(int iTry)
{
    QV_LOGE(DB_LOG_TAG,
            " QV_Contacts>>QV_ContactsLocalize_SO>> sqlite3_step error result=%d first, and has "
            "try %d times.",
            SQLITE_BUSY, iTry);
}

constexpr tag_CountLines READ_COUNT_LINES = {
    "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: select count", &LogReadCountTry,
    " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select contacts count "
    "sqlite3_prepare ERROR result=",
    " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select contacts count "
    "sqlite3_step ERROR result="};
constexpr tag_CountLines GET_COUNT_LINES = {
    "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: GetContactsCount", &LogGetCountTry,
    " QV_Contacts>>QV_ContactsLocalize_SO>> select contacts count ERROR result=",
    " QV_Contacts>>QV_ContactsLocalize_SO>> sqlite3_step error result="};

// Stores the number that the query returns in iCount, which keeps its value on failure.
int QueryCount(sqlite3* pDB, const char* szSql, const tag_CountLines& lines, int& iCount)
{
    CSqlStatement row(pDB);
    int iRetCode = row.PrepareBounded(szSql, QV_LOG_ERROR, lines.szBusy);
    if (iRetCode != SQLITE_OK)
    {
        QV_LOGE(DB_LOG_TAG, "%s%d", lines.szPrepareError, iRetCode);
        return -1;
    }
    iRetCode = row.StepBounded(lines.pfnLogTry);
    if (iRetCode != SQLITE_ROW)
    {
        QV_LOGE(DB_LOG_TAG, "%s%d", lines.szStepError, iRetCode);
        return -1;
    }
    iCount = row.Int(0);
    return 0;
}

int AllocateRecords(tag_ContactsInfo* pRecord)
{
    pRecord->pContacts =
        new (std::nothrow) tag_ContactsStruct[static_cast<size_t>(pRecord->RecordNum)]();
    if (pRecord->pContacts != nullptr)
    {
        return 0;
    }
    QV_LOGE(DB_LOG_TAG, "QV_Contacts>>QV_ContactsLocalize_SO>>ReadAllLocalizer  NEW MEM ERR!!!!!!");
    pRecord->RecordNum = 0;
    return -1;
}

// One record per row. Rows that were added since the count are dropped; if rows were removed since
// the count, the last records stay zero and MergeLocalizer will not complete them.
void FillContacts(CSqlStatement& rows, tag_ContactsInfo* pRecord)
{
    int iFilled = 0;
    int iRetCode = rows.Step();
    while (iRetCode == SQLITE_ROW && iFilled < pRecord->RecordNum)
    {
        tag_ContactsStruct* pContact = &pRecord->pContacts[iFilled++];
        FillFromContactsRow(rows, pContact);
        pContact->iStatusUpdateID = rows.Int(CONTACTS_STATUS_COLUMN);
        iRetCode = rows.Step();
    }
    if (iRetCode != SQLITE_DONE)
    {
        QV_LOGE(DB_LOG_TAG,
                " QV_Contacts>>QV_ContactsLocalize_SO>> select from contacts sqlite3_step ERROR "
                "result=%d",
                iRetCode);
    }
}

// Completes the records, in order, from their rows; rows of other contacts are skipped. Returns the
// number of records completed.
int MergeLocalizer(CSqlStatement& rows, tag_ContactsInfo* pRecord)
{
    int iIndex = 0;
    int iRetCode = rows.Step();
    while (iRetCode == SQLITE_ROW && iIndex < pRecord->RecordNum)
    {
        if (rows.Int(LOCALIZER_ID_COLUMN) == pRecord->pContacts[iIndex].iContactID)
        {
            if (!FillFromLocalizerRow(rows, ROW_GROUPS, &pRecord->pContacts[iIndex]))
            {
                break;
            }
            ++iIndex;
        }
        iRetCode = rows.Step();
    }
    if (iRetCode != SQLITE_DONE)
    {
        QV_LOGE(DB_LOG_TAG, "QV_Contacts>>QV_ContactsLocalize_SO>> "
                            "SQLiteOperator>>ReadAllLocalizer: sqlite3_step  error from localizer");
    }
    return iIndex;
}

int RecordCount(const tag_ContactsInfo* pRecord)
{
    return pRecord->pContacts == nullptr ? 0 : std::max(pRecord->RecordNum, 0);
}

void ClearOnline(tag_ContactsInfo* pRecord)
{
    for (int i = 0; i < RecordCount(pRecord); ++i)
    {
        pRecord->pContacts[i].iFlags &= ~CONTACT_FLAG_ONLINE;
    }
}

// Marks the contacts of the current row and of all following rows.
void MarkOnline(CSqlStatement& rows, tag_ContactsInfo* pRecord)
{
    const CStatusIndex index(pRecord->pContacts, RecordCount(pRecord));
    do
    {
        const int iStatusId = rows.Int(0);
        tag_ContactsStruct* pContact = index.First(iStatusId);
        if (pContact != nullptr)
        {
            QV_LOGD(DB_LOG_TAG, "CSQLiteOperator:Find one contact is sms online:statusid:%d\n",
                    iStatusId);
            pContact->iFlags |= CONTACT_FLAG_ONLINE;
        }
    } while (rows.Step() == SQLITE_ROW);
}

} // namespace

CSQLiteOperator::CSQLiteOperator() : m_pDB(nullptr) {}

CSQLiteOperator::~CSQLiteOperator()
{
    if (m_pDB != nullptr)
    {
        close();
    }
}

int CSQLiteOperator::open()
{
    if (m_pDB != nullptr)
    {
        return 0;
    }
    // sqlite3_open would make an empty database where there is none.
    const char* szPath = CDataPaths::Database();
    const int iRetCode = access(szPath, F_OK) == 0 ? sqlite3_open(szPath, &m_pDB) : SQLITE_CANTOPEN;
    if (iRetCode == SQLITE_OK)
    {
        return 0;
    }
    close();
    QV_LOGE(DB_LOG_TAG, "QV_Contacts>>QV_ContactsLocalize_SO>>CSQLiteOperator  open iRetCode = %d",
            iRetCode);
    return -1;
}

void CSQLiteOperator::close()
{
    sqlite3_close(m_pDB);
    m_pDB = nullptr;
}

int CSQLiteOperator::GetContactsCount(int* piCount)
{
    QV_LOGD(DB_LOG_TAG,
            "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> GetContactsCount begin");
    const bool bReady = piCount != nullptr && EnsureOpen() == 0;
    const int iResult = bReady ? QueryCount(m_pDB, SELECT_COUNT, GET_COUNT_LINES, *piCount) : -1;
    QV_LOGD(DB_LOG_TAG,
            "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> GetContactsCount end");
    return iResult;
}

int CSQLiteOperator::ReadAllLocalizer(tag_ContactsInfo* pRecord, long lCount, long long* pIds)
{
    QV_LOGD(DB_LOG_TAG,
            "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> ReadAllLocalizer begin");
    if (pRecord == nullptr || (CSqlIdList::IsListed(lCount) && pIds == nullptr))
    {
        QV_LOGE(DB_LOG_TAG, " QV_Contacts >>QV_ContactsLocalize_SO>>SQLiteOperator>> "
                            "ReadAllLocalizer: the input param is wrong!");
        return -1;
    }
    if (EnsureOpen() != 0)
    {
        return -1;
    }
    const CSqlIdList ids(lCount, pIds);
    if (CountContacts(ids, pRecord) != 0)
    {
        return -1;
    }
    if (pRecord->RecordNum == 0)
    {
        return 0;
    }
    if (AllocateRecords(pRecord) != 0 || ReadContacts(ids, pRecord) != 0)
    {
        return -1;
    }
    return ReadLocalizer(ids, pRecord);
}

int CSQLiteOperator::ReadContactsByID(int iContactID, tag_ContactsStruct* pContact, int& iFound)
{
    QV_LOGD(DB_LOG_TAG,
            "QV_Contacts>>QV_ContactsLocalize_SO>> CSQLiteOperator ReadContactsByID iContactID = "
            "%d\n",
            iContactID);
    if (pContact == nullptr || EnsureOpen() != 0 ||
        ReadContactRow(iContactID, pContact, iFound) != 0 ||
        ReadLocalizerRow(iContactID, pContact, iFound) != 0)
    {
        return -1;
    }
    close();
    return 0;
}

int CSQLiteOperator::ReadAllSmsOnlineStatus(tag_ContactsInfo* pRecord, long /*lCount*/,
                                            long long* /*pIds*/)
{
    if (pRecord == nullptr || EnsureOpen() != 0)
    {
        return -1;
    }
    CSqlStatement rows(m_pDB);
    int iRetCode =
        rows.PrepareBounded(SELECT_ONLINE, QV_LOG_DEBUG, "!!! SQLITE_BUSY: select count");
    if (iRetCode != SQLITE_OK)
    {
        if (iRetCode != SQLITE_BUSY)
        {
            QV_LOGE(DB_LOG_TAG, " select contacts count ERROR result=%d", iRetCode);
        }
        return -1;
    }
    iRetCode = rows.Step();
    if (iRetCode != SQLITE_ROW && iRetCode != SQLITE_DONE)
    {
        return -1;
    }
    ClearOnline(pRecord);
    if (iRetCode == SQLITE_ROW)
    {
        MarkOnline(rows, pRecord);
    }
    return 0;
}

void CSQLiteOperator::ParseIDString(const char* szText, QVLong32* pIds, int iMax)
{
    ParseIdText(szText, pIds, iMax);
}

int CSQLiteOperator::EnsureOpen()
{
    return m_pDB != nullptr ? 0 : open();
}

// RecordNum becomes the number of contacts that the two record queries are expected to give.
int CSQLiteOperator::CountContacts(const CSqlIdList& ids, tag_ContactsInfo* pRecord)
{
    const CListStatement sql(SELECT_COUNT, AND_ID, ids);
    QV_LOGD(DB_LOG_TAG,
            "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_3 = "
            "%s\n",
            sql.Text());
    int iCount = 0;
    if (QueryCount(m_pDB, sql.Text(), READ_COUNT_LINES, iCount) != 0)
    {
        return -1;
    }
    if (iCount < 0)
    {
        QV_LOGE(DB_LOG_TAG,
                " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select contacts count "
                "sqlite3_column_int ERROR result=%d",
                iCount);
        return -1;
    }
    pRecord->RecordNum = iCount;
    return 0;
}

int CSQLiteOperator::ReadContacts(const CSqlIdList& ids, tag_ContactsInfo* pRecord)
{
    const CListStatement sql(SELECT_CONTACTS, AND_ID, ids);
    QV_LOGD(DB_LOG_TAG, "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_4 = %s\n",
            sql.Text());
    CSqlStatement rows(m_pDB);
    const int iRetCode = rows.PrepareUnbounded(
        sql.Text(), "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: select from contacts");
    if (iRetCode != SQLITE_OK)
    {
        QV_LOGE(DB_LOG_TAG,
                " QV_Contacts>>QV_ContactsLocalize_SO>> select from contacts ERROR result=%d",
                iRetCode);
        return -1;
    }
    FillContacts(rows, pRecord);
    return 0;
}

int CSQLiteOperator::ReadLocalizer(const CSqlIdList& ids, tag_ContactsInfo* pRecord)
{
    const CListStatement sql(SELECT_LOCALIZER, WHERE_CONTACT_ID, ids);
    QV_LOGD(DB_LOG_TAG, "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_5 = %s\n",
            sql.Text());
    CSqlStatement rows(m_pDB);
    if (rows.PrepareUnbounded(sql.Text(), "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: "
                                          "select from localizer") != SQLITE_OK)
    {
        return -1;
    }
    const int iCompleted = MergeLocalizer(rows, pRecord);
    rows.Finalize();
    close();
    if (iCompleted < pRecord->RecordNum)
    {
        QV_LOGE(DB_LOG_TAG, "QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>>"
                            "ReadAllLocalizer: iIndex < pRecord->RecordNum\n");
        return -1;
    }
    return 0;
}

// A contact without a row is not found here, but may still have a name row.
int CSQLiteOperator::ReadContactRow(int iContactID, tag_ContactsStruct* pContact, int& iFound)
{
    char szSql[ID_STATEMENT_SIZE];
    std::snprintf(szSql, sizeof(szSql), SELECT_CONTACT_BY_ID, iContactID);
    CSqlStatement row(m_pDB);
    if (row.Prepare(szSql) != SQLITE_OK)
    {
        return -1;
    }
    iFound = row.Step() == SQLITE_ROW ? 1 : 0;
    if (iFound == 1)
    {
        FillFromContactsRow(row, pContact);
    }
    return 0;
}

int CSQLiteOperator::ReadLocalizerRow(int iContactID, tag_ContactsStruct* pContact, int& iFound)
{
    char szSql[ID_STATEMENT_SIZE];
    std::snprintf(szSql, sizeof(szSql), SELECT_LOCALIZER_BY_ID, iContactID);
    CSqlStatement row(m_pDB);
    if (row.Prepare(szSql) != SQLITE_OK)
    {
        return -1;
    }
    iFound = row.Step() == SQLITE_ROW ? 1 : 0;
    const bool bHasName = iFound == 1 && row.Int(LOCALIZER_ID_COLUMN) == pContact->iContactID;
    return !bHasName || FillFromLocalizerRow(row, SINGLE_ROW_GROUPS, pContact) ? 0 : -1;
}
