#include "DBOperator/SqlStatement.h"

#include "Common/Log.h"
#include "Common/SystemTime.h"

namespace
{

constexpr int WHOLE_TEXT = -1;
constexpr int PREPARE_ATTEMPTS = 4;
constexpr unsigned int PREPARE_PAUSE_MS = 100;
constexpr int STEP_RETRIES = 3;
constexpr unsigned int STEP_PAUSE_MS = 20;

} // namespace

int CSqlStatement::Prepare(const char* szSql)
{
    Finalize();
    return sqlite3_prepare(m_pDB, szSql, WHOLE_TEXT, &m_pStatement, nullptr);
}

int CSqlStatement::PrepareBounded(const char* szSql, int iPriority, const char* szBusyLine)
{
    int iRetCode = SQLITE_BUSY;
    for (int i = 0; i < PREPARE_ATTEMPTS && iRetCode == SQLITE_BUSY; ++i)
    {
        iRetCode = Prepare(szSql);
        if (iRetCode == SQLITE_BUSY)
        {
            __android_log_print(iPriority, DB_LOG_TAG, "%s", szBusyLine);
            Sleep(PREPARE_PAUSE_MS);
        }
    }
    return iRetCode;
}

int CSqlStatement::PrepareUnbounded(const char* szSql, const char* szBusyLine)
{
    int iRetCode = Prepare(szSql);
    while (iRetCode == SQLITE_BUSY)
    {
        QV_LOGE(DB_LOG_TAG, "%s", szBusyLine);
        Sleep(PREPARE_PAUSE_MS);
        iRetCode = Prepare(szSql);
    }
    return iRetCode;
}

int CSqlStatement::StepBounded(void (*pfnLogTry)(int iTry))
{
    int iRetCode = Step();
    for (int iTry = 1; iTry <= STEP_RETRIES && iRetCode == SQLITE_BUSY; ++iTry)
    {
        pfnLogTry(iTry);
        Sleep(STEP_PAUSE_MS);
        iRetCode = Step();
    }
    return iRetCode;
}

void CSqlStatement::Finalize()
{
    sqlite3_finalize(m_pStatement);
    m_pStatement = nullptr;
}
