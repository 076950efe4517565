#include "LocalizerImpl/PinyinTable.h"

#include "Common/Utf8.h"
#include "LocalizerImpl/QVLocalizerManager.h"

CPinyinTable::CPinyinTable()
{
    void* pMap = nullptr;
    if (CQVLocalizerManager::MemInit(&pMap) == 0)
    {
        m_pRecords = static_cast<PYOFWORDS*>(pMap);
    }
}

CPinyinTable::~CPinyinTable()
{
    CQVLocalizerManager::MemRelease(m_pRecords);
}

wchar_t RecordCharacter(const PYOFWORDS& record)
{
    char szKey[sizeof(record.szWord) + 1] = {};
    std::memcpy(szKey, record.szWord, sizeof(record.szWord));
    wchar_t szCharacter[sizeof(szKey)] = {};
    _mbstowcs(szCharacter, szKey, static_cast<int>(sizeof(record.szWord)) - 1);
    return szCharacter[0];
}
