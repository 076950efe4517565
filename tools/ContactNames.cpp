#include "tools/ContactNames.h"

#include "Common/DataPaths.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tools/Sqlite.h"
#include "tools/ToolError.h"

#include <memory>

namespace
{

class CDatabaseNames
{
public:
    CDatabaseNames()
        : m_database(CSqliteDatabase::OpenForReading(CDataPaths::Database())),
          m_statement(m_database, "SELECT display_name FROM localizer WHERE contact_id = ?")
    {
    }

    std::string NameOf(int iContactID)
    {
        m_statement.Bind(1, int64_t{iContactID});
        std::string strName = m_statement.Step() ? m_statement.Text(0) : "";
        m_statement.Reset();
        return strName;
    }

private:
    CSqliteDatabase m_database;
    CSqliteStatement m_statement;
};

class CPinyinTable
{
public:
    CPinyinTable()
    {
        if (CQVLocalizerManager::MemInit(&m_pMap) != 0)
        {
            throw CToolError(TOOL_EXIT_FAILED, "the search could not use the index's pinyin table",
                             BUILD_ANEW);
        }
    }
    ~CPinyinTable() { CQVLocalizerManager::MemRelease(m_pMap); }
    CPinyinTable(const CPinyinTable&) = delete;
    CPinyinTable& operator=(const CPinyinTable&) = delete;

    std::string CharacterOf(wchar_t code) const
    {
        if (!IsHanZiCode(CodeBits(code)))
        {
            return "?";
        }
        const char* szWord = static_cast<const PYOFWORDS*>(m_pMap)[HanZiRecord(code)].szWord;
        return {szWord, szWord + sizeof(PYOFWORDS::szWord) - 1};
    }

private:
    void* m_pMap = nullptr;
};

} // namespace

ContactNameLookup LookUpInDatabase()
{
    auto pNames = std::make_shared<CDatabaseNames>();
    return [pNames](const tag_LocalizerDetail& detail)
    { return pNames->NameOf(detail.iContactID); };
}

ContactNameLookup LookUpByCodes()
{
    auto pTable = std::make_shared<CPinyinTable>();
    return [pTable](const tag_LocalizerDetail& detail)
    {
        std::string strName;
        for (int i = 0; i < CONTACT_MAX_KEY && detail.szLocalizerKey[i] != 0; ++i)
        {
            strName += pTable->CharacterOf(detail.szLocalizerKey[i]);
        }
        return strName;
    };
}
