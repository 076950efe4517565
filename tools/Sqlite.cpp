#include "tools/Sqlite.h"

#include "tools/ToolError.h"

#include <sqlite3.h>

namespace
{

constexpr int BUSY_WAIT_MS = 2000;

[[noreturn]] void Fail(sqlite3* pDatabase, const std::string& strDoing)
{
    throw CToolError(TOOL_EXIT_FAILED, strDoing + ": " + sqlite3_errmsg(pDatabase));
}

} // namespace

CSqliteDatabase CSqliteDatabase::OpenForReading(const std::string& strPath)
{
    return {strPath, SQLITE_OPEN_READONLY};
}

CSqliteDatabase CSqliteDatabase::OpenForWriting(const std::string& strPath)
{
    return {strPath, SQLITE_OPEN_READWRITE};
}

CSqliteDatabase CSqliteDatabase::Create(const std::string& strPath)
{
    return {strPath, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE};
}

CSqliteDatabase::CSqliteDatabase(const std::string& strPath, int iFlags)
{
    if (sqlite3_open_v2(strPath.c_str(), &m_pDatabase, iFlags, nullptr) != SQLITE_OK)
    {
        const std::string strReason = sqlite3_errmsg(m_pDatabase);
        sqlite3_close(m_pDatabase);
        throw CToolError(TOOL_EXIT_FAILED, "cannot open " + strPath + ": " + strReason);
    }
    SetBusyWait(BUSY_WAIT_MS);
}

CSqliteDatabase::~CSqliteDatabase()
{
    sqlite3_close(m_pDatabase);
}

void CSqliteDatabase::Execute(const char* szSql)
{
    if (sqlite3_exec(m_pDatabase, szSql, nullptr, nullptr, nullptr) != SQLITE_OK)
    {
        Fail(m_pDatabase, "the database refuses a change");
    }
}

void CSqliteDatabase::SetBusyWait(int iMilliseconds)
{
    sqlite3_busy_timeout(m_pDatabase, iMilliseconds);
}

CSqliteStatement::CSqliteStatement(const CSqliteDatabase& database, const char* szSql)
{
    if (sqlite3_prepare_v2(database.Handle(), szSql, -1, &m_pStatement, nullptr) != SQLITE_OK)
    {
        // A query that cannot be prepared names a missing table or column, unless the file is bad.
        const int iError = sqlite3_errcode(database.Handle());
        const bool bOther = iError == SQLITE_ERROR || iError == SQLITE_NOTADB;
        Fail(database.Handle(),
             bOther ? "the database is not a contacts database" : "the database cannot be read");
    }
}

CSqliteStatement::~CSqliteStatement()
{
    sqlite3_finalize(m_pStatement);
}

void CSqliteStatement::Bind(int iParameter, int64_t llValue)
{
    if (sqlite3_bind_int64(m_pStatement, iParameter, llValue) != SQLITE_OK)
    {
        Fail(sqlite3_db_handle(m_pStatement), "the database refuses a number");
    }
}

void CSqliteStatement::Bind(int iParameter, const std::string& strValue)
{
    const int iBytes = static_cast<int>(strValue.size());
    if (sqlite3_bind_text(m_pStatement, iParameter, strValue.data(), iBytes, SQLITE_TRANSIENT) !=
        SQLITE_OK)
    {
        Fail(sqlite3_db_handle(m_pStatement), "the database refuses a text");
    }
}

bool CSqliteStatement::Step()
{
    const int iResult = sqlite3_step(m_pStatement);
    if (iResult != SQLITE_ROW && iResult != SQLITE_DONE)
    {
        Fail(sqlite3_db_handle(m_pStatement), "the database cannot be read or written");
    }
    return iResult == SQLITE_ROW;
}

void CSqliteStatement::Reset()
{
    sqlite3_reset(m_pStatement);
    sqlite3_clear_bindings(m_pStatement);
}

std::string CSqliteStatement::Text(int iColumn) const
{
    const unsigned char* pText = sqlite3_column_text(m_pStatement, iColumn);
    return pText == nullptr ? std::string() : reinterpret_cast<const char*>(pText);
}

int64_t CSqliteStatement::Number(int iColumn) const
{
    return sqlite3_column_int64(m_pStatement, iColumn);
}
