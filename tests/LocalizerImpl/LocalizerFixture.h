#ifndef QV_TESTS_LOCALIZERIMPL_LOCALIZERFIXTURE_H
#define QV_TESTS_LOCALIZERIMPL_LOCALIZERFIXTURE_H

#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"
#include "tools/Utf8Text.h"

#include <cstring>
#include <gtest/gtest.h>
#include <string>

// The built pinyin table, installed and mapped, in a data directory of its own.
class LocalizerFixture : public testing::Test
{
protected:
    LocalizerFixture()
    {
        m_data.InstallPinyinTable();
        EXPECT_EQ(CQVLocalizerManager::InitMapFile(), 0);
        void* pMap = nullptr;
        EXPECT_EQ(CQVLocalizerManager::MemInit(&pMap), 0);
        m_pMap = static_cast<PYOFWORDS*>(pMap);
    }
    ~LocalizerFixture() override { CQVLocalizerManager::MemRelease(m_pMap); }

    // Takes the shared table away from whoever maps it from now on.
    void RemoveTable() const
    {
        EXPECT_EQ(std::remove(m_data.File("PyFileMappint.bin").c_str()), 0);
    }

    // The code of a three-byte character, found by looking at every record; 0 without a record.
    wchar_t HanZi(wchar_t character) const
    {
        const std::string strKey = Utf8Text({character});
        for (int i = 0; i < 15422; ++i)
        {
            if (strKey == m_pMap[i].szWord)
            {
                return static_cast<wchar_t>(0x1000 + i);
            }
        }
        return 0;
    }

    // The codes of a text in which '?' stands for any other character.
    std::wstring Codes(const std::wstring& strText) const
    {
        std::wstring strCodes;
        for (const wchar_t c : strText)
        {
            const bool bLetter = (c >= L'a' && c <= L'z') || (c >= L'A' && c <= L'Z');
            const bool bDigit = c >= L'0' && c <= L'9';
            strCodes += bLetter     ? static_cast<wchar_t>(0x4F00 + (c | 0x20) - L'a')
                        : bDigit    ? static_cast<wchar_t>(0x5A00 + c - L'0')
                        : c == L'?' ? static_cast<wchar_t>(0x5000)
                                    : HanZi(c);
        }
        return strCodes;
    }

    CDataDirectory m_data;
    PYOFWORDS* m_pMap = nullptr;
};

#endif
