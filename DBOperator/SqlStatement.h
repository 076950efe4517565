#ifndef QV_DBOPERATOR_SQLSTATEMENT_H
#define QV_DBOPERATOR_SQLSTATEMENT_H

#include <sqlite3.h>

// The tag of every line about the database.
constexpr const char* DB_LOG_TAG = "QV_ContactsLocalize_SO";

// One prepared statement, finalized with the object. Results are SQLite's codes. It uses the legacy
// prepare, with which most failures of a step are a plain SQLITE_ERROR.
class CSqlStatement
{
public:
    explicit CSqlStatement(sqlite3* pDB) : m_pDB(pDB), m_pStatement(nullptr) {}
    ~CSqlStatement() { Finalize(); }
    CSqlStatement(const CSqlStatement&) = delete;
    CSqlStatement& operator=(const CSqlStatement&) = delete;

    int Prepare(const char* szSql);
    // Four attempts; after each busy one, logs the line and sleeps 100 ms.
    int PrepareBounded(const char* szSql, int iPriority, const char* szBusyLine);
    // Tries every 100 ms, with an error line, until the database is no longer busy.
    int PrepareUnbounded(const char* szSql, const char* szBusyLine);

    int Step() { return sqlite3_step(m_pStatement); }
    // Up to three retries 20 ms apart; pfnLogTry gets the number of each, from 1.
    int StepBounded(void (*pfnLogTry)(int iTry));
    void Finalize();

    // Columns of the current row; a value of another type is converted as SQLite does it.
    int Int(int iColumn) const { return sqlite3_column_int(m_pStatement, iColumn); }
    long long Int64(int iColumn) const { return sqlite3_column_int64(m_pStatement, iColumn); }
    // Zero-terminated, null for NULL or if an allocation fails; valid until the next step.
    const char* Text(int iColumn) const
    {
        return reinterpret_cast<const char*>(sqlite3_column_text(m_pStatement, iColumn));
    }
    // Whether SQLite failed to allocate a text of the current row.
    bool IsOutOfMemory() const { return sqlite3_errcode(m_pDB) == SQLITE_NOMEM; }
    // Bytes of what Text returned last for the column.
    int Bytes(int iColumn) const { return sqlite3_column_bytes(m_pStatement, iColumn); }

private:
    sqlite3* m_pDB;
    sqlite3_stmt* m_pStatement;
};

#endif
