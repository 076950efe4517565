#ifndef QV_TOOLS_SQLITE_H
#define QV_TOOLS_SQLITE_H

#include <cstdint>
#include <string>

struct sqlite3;
struct sqlite3_stmt;

// An open database file. Every operation that SQLite refuses throws CToolError with its message. If
// another process has locked the file, an operation retries for two seconds first.
class CSqliteDatabase
{
public:
    static CSqliteDatabase OpenForReading(const std::string& strPath);
    static CSqliteDatabase OpenForWriting(const std::string& strPath); // which must exist
    static CSqliteDatabase Create(const std::string& strPath);         // if it is missing
    ~CSqliteDatabase();
    CSqliteDatabase(const CSqliteDatabase&) = delete;
    CSqliteDatabase& operator=(const CSqliteDatabase&) = delete;

    // Runs statements without parameters and ignores their rows.
    void Execute(const char* szSql);
    // Sets how long an operation waits for another process.
    void SetBusyWait(int iMilliseconds);
    sqlite3* Handle() const { return m_pDatabase; }

private:
    CSqliteDatabase(const std::string& strPath, int iFlags);

    sqlite3* m_pDatabase = nullptr;
};

// A statement that can be run many times. Parameters count from 1, columns from 0. The database
// outlives it.
class CSqliteStatement
{
public:
    CSqliteStatement(const CSqliteDatabase& database, const char* szSql);
    ~CSqliteStatement();
    CSqliteStatement(const CSqliteStatement&) = delete;
    CSqliteStatement& operator=(const CSqliteStatement&) = delete;

    void Bind(int iParameter, int64_t llValue);
    void Bind(int iParameter, const std::string& strValue);
    // Whether there is a further row.
    bool Step();
    // Makes the statement ready for its next run.
    void Reset();
    // Runs a change with these values for its parameters, in their order.
    template <typename... Values>
    void Run(const Values&... values)
    {
        int iParameter = 0;
        (Bind(++iParameter, values), ...);
        Step();
        Reset();
    }

    // Text of a column of the current row, empty for null.
    std::string Text(int iColumn) const;
    // Number in a column of the current row, 0 for null.
    int64_t Number(int iColumn) const;

private:
    sqlite3_stmt* m_pStatement = nullptr;
};

#endif
