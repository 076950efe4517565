// The pinyin table: its shared file, its mapping, and lookups in it.

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Common/WideString.h"
#include "LocalizerImpl/LowMapping.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/Syllables.h"
#include "MemManager/Files/Descriptor.h"
#include "MemManager/Files/MappingGuards.h"
#include "MemManager/Files/ShareMemory.h"

#include <algorithm>
#include <cstring>
#include <fcntl.h>
#include <iterator>
#include <memory>
#include <new>
#include <sys/mman.h>
#include <sys/time.h>
#include <unistd.h>

namespace
{

// A zero-padded word as a number in the order of its bytes.
uint32_t WordNumber(const char (&szWord)[sizeof(PYOFWORDS::szWord)])
{
    uint32_t uNumber = 0;
    for (const char cByte : szWord)
    {
        uNumber = (uNumber << 8) | static_cast<unsigned char>(cByte);
    }
    return uNumber;
}

// Fills the buffer, PY_FILE_SIZE zeroed bytes, from the shipped table.
bool ReadShippedTable(char* pBuffer)
{
    const CDescriptor file(OpenStoreFile(CDataPaths::PinyinSource(), O_RDWR));
    // A short file is no failure: the characters that it lacks have no readings.
    return file.IsOpen() && read(file.Get(), pBuffer, PY_FILE_SIZE) >= 0;
}

} // namespace

int CQVLocalizerManager::InitMapFile()
{
    const std::unique_ptr<char[]> buffer(new (std::nothrow) char[PY_FILE_SIZE]());
    if (buffer == nullptr || !ReadShippedTable(buffer.get()))
    {
        return LOC_ERR_MAP;
    }
    CWriteMapping mapping(CDataPaths::PinyinMapping(), PY_FILE_SIZE);
    if (!mapping.IsOpen())
    {
        return LOC_ERR_MAP;
    }
    std::memcpy(mapping.As<char>(), buffer.get(), PY_FILE_SIZE);
    // On the disk before a registration record says that there is an index.
    if (!mapping.Flush())
    {
        return LOC_ERR_MAP;
    }
    // Writing through a mapping shows in the file's times at the first byte of a page only;
    // searches that keep what they read go by these times.
    static_cast<void>(utimes(CDataPaths::PinyinMapping(), nullptr));
    return 0;
}

int CQVLocalizerManager::MemInit(void** ppMap)
{
    if (ppMap == nullptr)
    {
        return LOC_ERR_PARAM;
    }
    *ppMap = OpenReadShareMemory(CDataPaths::PinyinMapping(), PY_FILE_SIZE);
    return *ppMap == MAP_FAILED ? LOC_ERR_MAP : 0;
}

int CQVLocalizerManager::MemRelease(void* pMap)
{
    if (pMap != nullptr && pMap != MAP_FAILED)
    {
        CloseReadShareMemory(pMap, PY_FILE_SIZE);
    }
    return 0;
}

long CQVLocalizerManager::CreatePinYinFileMapping()
{
    void* pMap = nullptr;
    int iRet = MemInit(&pMap);
    if (iRet == 0 && !CLowMapping::IsHandle(pMap))
    {
        MemRelease(pMap);
        pMap = CLowMapping::Map(CDataPaths::PinyinMapping(), PY_FILE_SIZE);
        iRet = pMap == MAP_FAILED ? LOC_ERR_MAP : 0;
    }
    if (iRet != 0)
    {
        QV_LOGE(QV_LOG_TAG, "CQVLocalizerManager::CreatePinYinFileMapping memInit error code = %d",
                iRet);
        return -1;
    }
    return reinterpret_cast<long>(pMap);
}

int CQVLocalizerManager::ReleasePinYinFileMapping(long hMap)
{
    if (hMap > 0)
    {
        return MemRelease(reinterpret_cast<void*>(hMap));
    }
    QV_LOGE(QV_LOG_TAG, "CQVLocalizerManager::ReleasePinYinFileMapping the input mapping is %ld ",
            hMap);
    QV_LOGE(QV_LOG_TAG,
            "CQVLocalizerManager::ReleasePinYinFileMapping the input mapping is wrong!");
    return LOC_ERR_PARAM;
}

// A conversion asks this for every character, so the few bytes of a key are compared as one number.
int CQVLocalizerManager::FindRecord(const PYOFWORDS* pMap, const char* szKey)
{
    char szWord[sizeof(PYOFWORDS::szWord)] = {};
    const size_t uLength = strnlen(szKey, sizeof(szWord));
    if (pMap == nullptr || uLength == sizeof(szWord))
    {
        return -1;
    }
    std::memcpy(szWord, szKey, uLength);
    const uint32_t uWanted = WordNumber(szWord);
    const PYOFWORDS* pEnd = pMap + PY_WORD_COUNT;
    if (WordNumber(pEnd[-1].szWord) < uWanted)
    {
        return -1; // also any character of a table whose tail is missing: it is not in order
    }
    const PYOFWORDS* pFound = std::lower_bound(pMap, pEnd, uWanted,
                                               [](const PYOFWORDS& record, uint32_t uKey)
                                               { return WordNumber(record.szWord) < uKey; });
    const bool bFound = pFound != pEnd && WordNumber(pFound->szWord) == uWanted;
    return bFound ? static_cast<int>(pFound - pMap) : -1;
}

bool CQVLocalizerManager::IsHanZi(unsigned short code)
{
    return IsHanZiCode(code);
}

bool CQVLocalizerManager::IsGBWord(unsigned short uRecord)
{
    return IsGBIndex(uRecord);
}

bool CQVLocalizerManager::IsAlpha(unsigned short code)
{
    return IsAlphaCode(code);
}

bool CQVLocalizerManager::IsDigtal(unsigned short code)
{
    return IsDigitCode(code);
}

bool CQVLocalizerManager::IsEnglishWord(wchar_t unit)
{
    return (unit >= L'A' && unit <= L'Z') || (unit >= L'a' && unit <= L'z');
}

bool CQVLocalizerManager::IsDigitalChar(wchar_t unit)
{
    return unit >= L'0' && unit <= L'9';
}

bool CQVLocalizerManager::IsPyWords(wchar_t* szText)
{
    if (szText == nullptr)
    {
        return false;
    }
    // The syllables ascend, so the first one that is not below the text begins with it or none
    // does.
    const auto below = [](const wchar_t(&szSyllable)[PY_MAX_LETTERS + 1], const wchar_t* szWanted)
    { return _wcscmp(szSyllable, szWanted) < 0; };
    const auto* pSyllable =
        std::lower_bound(std::begin(g_pyWords), std::end(g_pyWords), szText, below);
    return pSyllable != std::end(g_pyWords) && _wcsncmp(*pSyllable, szText, _wcslen(szText)) == 0;
}
