#ifndef QV_TESTS_DBOPERATOR_READERFIXTURE_H
#define QV_TESTS_DBOPERATOR_READERFIXTURE_H

#include "DBOperator/SQLiteOperator.h"
#include "Platform/LogSink.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/ProviderDatabase.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>

// "1.2.3" and so on up to iLast.
inline std::string IdText(int iLast)
{
    return iLast == 1 ? "1" : IdText(iLast - 1) + "." + std::to_string(iLast);
}

// What a read leaves, released with the object.
struct tag_ReadSet : tag_ContactsInfo
{
    tag_ReadSet() : tag_ContactsInfo{0, nullptr} {}
    ~tag_ReadSet() { delete[] pContacts; }
    tag_ReadSet(const tag_ReadSet&) = delete;
    tag_ReadSet& operator=(const tag_ReadSet&) = delete;

    std::vector<int> Ids() const
    {
        std::vector<int> vIds(static_cast<size_t>(RecordNum));
        std::transform(pContacts, pContacts + RecordNum, vIds.begin(),
                       [](const auto& record) { return record.iContactID; });
        return vIds;
    }
};

// Runs a function at every log line, in the middle of the operation that logs it: this is how a
// test plays the other process at an exact moment.
class CLineHook
{
public:
    explicit CLineHook(std::function<void(const std::string&)> fnAtLine)
        : m_fnAtLine(std::move(fnAtLine))
    {
        CLogSink::Set(&CLineHook::AtLine, this);
    }
    ~CLineHook() { CLogSink::Set(nullptr, nullptr); }
    CLineHook(const CLineHook&) = delete;
    CLineHook& operator=(const CLineHook&) = delete;

    int Count(const std::string& strText) const
    {
        return static_cast<int>(std::count(m_vTexts.begin(), m_vTexts.end(), strText));
    }

private:
    static void AtLine(void* pContext, int /*iPriority*/, const char* /*szTag*/, const char* szText)
    {
        auto* pHook = static_cast<CLineHook*>(pContext);
        pHook->m_vTexts.emplace_back(szText);
        pHook->m_fnAtLine(szText);
    }

    std::function<void(const std::string&)> m_fnAtLine;
    std::vector<std::string> m_vTexts;
};

// A reader on an empty provider database in a directory of its own.
class CReaderTest : public ::testing::Test
{
protected:
    CDataDirectory m_clDirectory;
    CProviderDatabase m_clProvider;
    CSQLiteOperator m_clReader;

    int ReadAll(tag_ContactsInfo& set) { return m_clReader.ReadAllLocalizer(&set, 0, nullptr); }
};

#endif
