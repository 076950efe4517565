// Keys of names and picked characters.

#include "Common/DataPaths.h"
#include "LocalizerImpl/NameFolding.h"
#include "LocalizerImpl/PinyinTable.h"
#include "bindings/c/Objects.h"

#include <cstring>
#include <unistd.h>

namespace
{

constexpr int MAX_PICKED = 3; // characters of a picked word, which fit the library's buffer
static_assert(QV_PICK_SIZE == (QV_MAX_TYPED + MAX_PICKED) * UTF8_MAX_BYTES + 1, "any text fits");
constexpr size_t CODE_BYTES = 3; // no code needs more in UTF-8
static_assert(QV_KEY_SIZE == CONTACT_MAX_KEY * CODE_BYTES + 1, "any key fits");

// The contacts database needs keys before the first build: the shared table may still be missing.
void MakeMissingPinyinTable()
{
    if (access(CDataPaths::PinyinMapping(), F_OK) != 0)
    {
        CQVLocalizerManager::InitMapFile(); // after a failure the table cannot be mapped
    }
}

// Writes the key of a name, already checked, with the table mapped at pMap.
void WriteKey(PYOFWORDS* pMap, const char* szName, char (&szKey)[QV_KEY_SIZE])
{
    wchar_t szCharacters[LOC_NAME_BUFFER] = {};
    DecodeText(szName, szCharacters, CONTACT_MAX_NAME);
    Ft2Jt(szCharacters);
    wchar_t szCodes[CONTACT_MAX_KEY + 1] = {};
    CQVLocalizerManager::TranslateNameToLocal(pMap, szCharacters, szCodes);
    EncodeText(szCodes, szKey, sizeof(szKey));
}

int CheckNames(const char* const* pszNames, size_t uCount)
{
    for (size_t i = 0; i < uCount; ++i)
    {
        wchar_t szNone[1];
        if (pszNames[i] == nullptr)
        {
            return QV_ERROR_ARGUMENT;
        }
        if (DecodeText(pszNames[i], szNone, 0) < 0)
        {
            return QV_ERROR_UTF8;
        }
    }
    return QV_OK;
}

} // namespace

int qv_localizer_key(qv_index* index, const char* name, char* buffer, size_t size)
{
    if (buffer == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    char szKey[1][QV_KEY_SIZE];
    const int iStatus = qv_localizer_keys(index, &name, 1, szKey);
    if (iStatus != QV_OK)
    {
        return iStatus;
    }
    const size_t uBytes = std::strlen(szKey[0]) + 1;
    if (uBytes > size)
    {
        return QV_ERROR_BUFFER;
    }
    std::memcpy(buffer, szKey[0], uBytes);
    return QV_OK;
}

int qv_localizer_keys(qv_index* index, const char* const* names, size_t count,
                      char (*keys)[QV_KEY_SIZE])
{
    if (index == nullptr || ((names == nullptr || keys == nullptr) && count > 0))
    {
        return QV_ERROR_ARGUMENT;
    }
    const int iStatus = CheckNames(names, count);
    if (iStatus != QV_OK)
    {
        return iStatus;
    }
    MakeMissingPinyinTable();
    const CPinyinTable table;
    if (!table.IsOpen())
    {
        return QV_ERROR_PINYIN;
    }
    for (size_t i = 0; i < count; ++i)
    {
        WriteKey(table.Records(), names[i], keys[i]);
    }
    return QV_OK;
}

int qv_pick(qv_index* index, const char* text, int position, const char* word, char* buffer,
            size_t size)
{
    if (index == nullptr || text == nullptr || position < 0 || word == nullptr || buffer == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    wchar_t szText[QV_MAX_TYPED + 1] = {};
    wchar_t szWord[MAX_PICKED + 1] = {};
    int iStatus = DecodeShort(text, szText, QV_MAX_TYPED);
    if (iStatus == QV_OK)
    {
        iStatus = DecodeShort(word, szWord, MAX_PICKED);
    }
    if (iStatus != QV_OK)
    {
        return iStatus;
    }
    MakeMissingPinyinTable();
    if (!CPinyinTable().IsOpen())
    {
        return QV_ERROR_PINYIN;
    }
    wchar_t szOut[QV_MAX_TYPED + MAX_PICKED + 1] = {};
    if (index->m_logic.GetLocalizerString(szText, position, szWord, szOut) != 0)
    {
        return QV_ERROR_CHARACTER; // arguments and table are checked
    }
    return EncodeText(szOut, buffer, size) ? QV_OK : QV_ERROR_BUFFER;
}
