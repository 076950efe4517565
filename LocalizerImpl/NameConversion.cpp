// From a display name to its codes, its pinyin key and its index character.
//
// A name is walked in UTF-8, item by item:
//
//   first byte                                    item           bytes
//   'A'..'Z', 'a'..'z'                            letter         1
//   '0'..'9'                                      digit          1
//   C2..DF, a character of two bytes              other          2
//   81..A0 or AA..FE, followed by 40..FE          Chinese        3
//   A1..A9                                        symbol         3
//   anything else                                 other          1
//
// Text that comes from wide characters holds whole characters of one to three bytes, so that
// every character is one item.

#include "Common/Log.h"
#include "Common/Utf8.h"
#include "Common/WideString.h"
#include "LocalizerImpl/NameFolding.h"
#include "LocalizerImpl/PinyinTable.h"
#include "LocalizerImpl/QVLocalizerManager.h"

#include <algorithm>
#include <cstring>

namespace
{

constexpr int NAME_UTF8_BUFFER = 121; // a name of 30 characters in UTF-8 fits
constexpr int LONG_ITEM_BYTES = 3;
constexpr int SHORT_ITEM_BYTES = 2;
constexpr int WORD_UTF8_BUFFER = 10; // a picked character in UTF-8, with room to spare

constexpr long long DAY_MS = 24LL * 60 * 60 * 1000;

enum ITEM_CLASS
{
    ITEM_LETTER,
    ITEM_DIGIT,
    ITEM_CHINESE,
    ITEM_SYMBOL,
    ITEM_OTHER
};

// One character of a name in UTF-8, with its bytes and a terminator.
struct tag_NameItem
{
    ITEM_CLASS eClass;
    int iBytes;
    char szBytes[LONG_ITEM_BYTES + 1];
};

bool IsBetween(unsigned char uByte, unsigned char uFirst, unsigned char uLast)
{
    return uByte >= uFirst && uByte <= uLast;
}

bool IsChineseLead(unsigned char uByte, unsigned char uNext)
{
    return (IsBetween(uByte, 0x81, 0xA0) || IsBetween(uByte, 0xAA, 0xFE)) &&
           IsBetween(uNext, 0x40, 0xFE);
}

void ClassifyItem(const char* szText, tag_NameItem& item)
{
    const unsigned char uByte = static_cast<unsigned char>(szText[0]);
    const unsigned char uNext = static_cast<unsigned char>(szText[1]);
    const wchar_t unit = static_cast<wchar_t>(uByte);
    item.iBytes = 1;
    item.eClass = ITEM_OTHER;
    if (CQVLocalizerManager::IsEnglishWord(unit))
    {
        item.eClass = ITEM_LETTER;
    }
    else if (CQVLocalizerManager::IsDigitalChar(unit))
    {
        item.eClass = ITEM_DIGIT;
    }
    else if (IsBetween(uByte, 0xC2, 0xDF) && IsBetween(uNext, 0x80, 0xBF))
    {
        item.iBytes = SHORT_ITEM_BYTES;
    }
    else if (IsChineseLead(uByte, uNext))
    {
        item.eClass = ITEM_CHINESE;
        item.iBytes = LONG_ITEM_BYTES;
    }
    else if (IsBetween(uByte, 0xA1, 0xA9))
    {
        item.eClass = ITEM_SYMBOL;
        item.iBytes = LONG_ITEM_BYTES;
    }
}

// The item at the start of szText, which is not empty; shorter when the text ends inside it.
tag_NameItem NextItem(const char* szText)
{
    tag_NameItem item = {};
    ClassifyItem(szText, item);
    item.iBytes = static_cast<int>(strnlen(szText, static_cast<size_t>(item.iBytes)));
    std::memcpy(item.szBytes, szText, static_cast<size_t>(item.iBytes));
    return item;
}

// The first 30 characters of a name in UTF-8.
void EncodeName(const wchar_t* szName, char (&szUtf8)[NAME_UTF8_BUFFER])
{
    std::memset(szUtf8, 0, sizeof(szUtf8));
    Unicode2Utf8(szName, szUtf8, CONTACT_MAX_NAME - 1);
}

// Copies the first 30 characters of a name, which may have no terminator behind them.
void CopyName(const wchar_t* szName, wchar_t (&szCopy)[LOC_NAME_BUFFER])
{
    _wcsncpy(szCopy, szName, CONTACT_MAX_NAME);
    szCopy[CONTACT_MAX_NAME] = 0;
}

int LetterIndex(char cLetter)
{
    return (cLetter | ('a' - 'A')) - 'a';
}

wchar_t DigitCode(int iDigit)
{
    const wchar_t code = LOC_DIGIT_BASE + static_cast<wchar_t>(iDigit);
    QV_LOGD(QV_LOG_TAG,
            "QV_Contacts: TranslateNameToLocal the char is digital: %d , the localize char is "
            "0x%4x",
            iDigit, static_cast<unsigned>(code));
    return code;
}

wchar_t CodeOfItem(PYOFWORDS* pMap, const tag_NameItem& item)
{
    if (item.eClass == ITEM_LETTER)
    {
        return LOC_ALPHA_BASE + static_cast<wchar_t>(LetterIndex(item.szBytes[0]));
    }
    if (item.eClass == ITEM_DIGIT)
    {
        return DigitCode(item.szBytes[0] - '0');
    }
    const int iRecord =
        item.eClass == ITEM_CHINESE ? CQVLocalizerManager::FindRecord(pMap, item.szBytes) : -1;
    return iRecord < 0 ? LOC_OTHER : LOC_HANZI_BASE + static_cast<wchar_t>(iRecord);
}

// Appends the bytes, each as one wide character; returns how many.
int AppendBytes(const char* pBytes, int iBytes, wchar_t* szOut)
{
    for (int i = 0; i < iBytes; ++i)
    {
        szOut[i] = static_cast<wchar_t>(static_cast<unsigned char>(pBytes[i]));
    }
    return iBytes;
}

// Appends first reading, blank and character; returns how many wide characters that are.
int AppendReading(const PYOFWORDS& record, const tag_NameItem& item, wchar_t* szOut)
{
    const char(&szReading)[PY_MAX_LETTERS + 1] = record.szPinyin[0];
    int iCount = AppendBytes(szReading, SpellingLength(szReading), szOut);
    szOut[iCount++] = L' ';
    wchar_t szCharacter[LONG_ITEM_BYTES + 1] = {};
    _mbstowcs(szCharacter, item.szBytes, item.iBytes);
    szOut[iCount++] = szCharacter[0];
    return iCount;
}

int AppendSpelling(PYOFWORDS* pMap, const tag_NameItem& item, wchar_t* szOut)
{
    if (item.eClass == ITEM_CHINESE)
    {
        const int iRecord = CQVLocalizerManager::FindRecord(pMap, item.szBytes);
        return iRecord < 0 ? AppendBytes(item.szBytes, item.iBytes, szOut)
                           : AppendReading(pMap[iRecord], item, szOut);
    }
    if (item.iBytes == SHORT_ITEM_BYTES && item.eClass == ITEM_OTHER)
    {
        return _mbstowcs(szOut, item.szBytes, item.iBytes);
    }
    return AppendBytes(item.szBytes, item.iBytes, szOut);
}

// The picked word as far as its UTF-8 form fits its buffer.
struct tag_PickedWord
{
    explicit tag_PickedWord(const wchar_t* szWord)
    {
        int iBytes = 0;
        for (int i = 0; szWord[i] != 0; ++i)
        {
            const wchar_t szUnit[] = {szWord[i], 0};
            char szBytes[LONG_ITEM_BYTES + 1] = {};
            const int iUnitBytes = Unicode2Utf8(szUnit, szBytes, 0);
            if (iBytes + iUnitBytes >= WORD_UTF8_BUFFER)
            {
                return;
            }
            std::memcpy(szUtf8 + iBytes, szBytes, static_cast<size_t>(iUnitBytes));
            iBytes += iUnitBytes;
            szUnits[i] = szWord[i];
        }
    }

    bool IsChinese() const
    {
        return IsChineseLead(static_cast<unsigned char>(szUtf8[0]),
                             static_cast<unsigned char>(szUtf8[1]));
    }

    char szUtf8[WORD_UTF8_BUFFER] = {};
    wchar_t szUnits[WORD_UTF8_BUFFER] = {};
};

// Whether the letter begins a reading of the record.
bool BeginsReading(const PYOFWORDS& record, wchar_t unit)
{
    for (const auto& szReading : record.szPinyin)
    {
        if (szReading[0] != 0 && unit == static_cast<wchar_t>(szReading[0]))
        {
            return true;
        }
    }
    return false;
}

// Puts szWord over the last letter before iPos that begins one of its readings; false when there
// is none.
bool ReplaceLetters(const PYOFWORDS& record, int iPos, const wchar_t* szWord, wchar_t* szText)
{
    const int iLength = static_cast<int>(_wcslen(szText));
    for (int q = std::min(std::max(iPos, 0), iLength) - 1; q >= 0; --q)
    {
        if (BeginsReading(record, szText[q]))
        {
            _wcscpy(szText + q, szWord);
            return true;
        }
    }
    return false;
}

// Codes of a name with its traditional characters folded; the name itself is not changed.
void FoldAndTranslate(PYOFWORDS* pMap, const wchar_t* szName, wchar_t* szOut)
{
    wchar_t szCopy[LOC_NAME_BUFFER];
    CopyName(szName, szCopy);
    Ft2Jt(szCopy);
    CQVLocalizerManager::TranslateNameToLocal(pMap, szCopy, szOut);
}

} // namespace

int CQVLocalizerManager::TranslateNameToLocal(PYOFWORDS* pMap, wchar_t* szDisplayName,
                                              wchar_t* szOut)
{
    if (pMap == nullptr || szDisplayName == nullptr || szOut == nullptr)
    {
        return 1;
    }
    std::fill_n(szOut, CONTACT_MAX_KEY, L'\0');
    char szUtf8[NAME_UTF8_BUFFER];
    EncodeName(szDisplayName, szUtf8);
    int iCodes = 0;
    for (const char* p = szUtf8; *p != 0 && iCodes < CONTACT_MAX_KEY; ++iCodes)
    {
        const tag_NameItem item = NextItem(p);
        szOut[iCodes] = CodeOfItem(pMap, item);
        p += item.iBytes;
    }
    return 1;
}

int CQVLocalizerManager::TranslateChineseToPinyin(Common_Qsort* /*pSorter*/, PYOFWORDS* pMap,
                                                  wchar_t* szDisplayName, wchar_t* szOut)
{
    if (pMap == nullptr || szDisplayName == nullptr || szOut == nullptr)
    {
        return 1;
    }
    _wcslwr(szDisplayName);
    char szUtf8[NAME_UTF8_BUFFER];
    EncodeName(szDisplayName, szUtf8);
    int iCount = 0;
    for (const char* p = szUtf8; *p != 0 && iCount < CONTACT_MAX_NAME;)
    {
        const tag_NameItem item = NextItem(p);
        iCount += AppendSpelling(pMap, item, szOut + iCount);
        p += item.iBytes;
    }
    return 1;
}

int CQVLocalizerManager::GetLocalizerChars(wchar_t* szDisplayName, wchar_t* szOut)
{
    if (szDisplayName == nullptr || szOut == nullptr)
    {
        return LOC_ERR_PARAM;
    }
    const CPinyinTable table;
    if (!table.IsOpen())
    {
        return -1;
    }
    if (szDisplayName[0] != 0)
    {
        FoldAndTranslate(table.Records(), szDisplayName, szOut);
    }
    return 0;
}

int CQVLocalizerManager::GetLocalizerString(long hMap, wchar_t* szDisplayName, wchar_t* szOut)
{
    QV_LOGE(QV_LOG_TAG, "CQVLocalizerManager::GetLocalizerString the input mapping %ld!", hMap);
    if (hMap <= 0 || szDisplayName == nullptr || szOut == nullptr)
    {
        QV_LOGE(QV_LOG_TAG, "CQVLocalizerManager::GetLocalizerString the input mapping is wrong!");
        return LOC_ERR_PARAM;
    }
    FoldAndTranslate(reinterpret_cast<PYOFWORDS*>(hMap), szDisplayName, szOut);
    return 0;
}

int CQVLocalizerManager::GetLocalizerBatch(tag_ContactsInfo* pInfo)
{
    if (pInfo == nullptr)
    {
        return LOC_ERR_PARAM;
    }
    const CPinyinTable table;
    if (!table.IsOpen())
    {
        return LOC_ERR_MAP;
    }
    for (int i = 0; pInfo->pContacts != nullptr && i < pInfo->RecordNum; ++i)
    {
        tag_ContactsStruct& record = pInfo->pContacts[i];
        if (record.szName[0] != 0)
        {
            FoldAndTranslate(table.Records(), record.szName, record.szLocalizerKey);
        }
    }
    return 0;
}

int CQVLocalizerManager::TransNameToPY(tag_ContactsStruct* pRecords, int iCount)
{
    if (pRecords == nullptr)
    {
        return LOC_ERR_PARAM;
    }
    const CPinyinTable table;
    if (!table.IsOpen())
    {
        return LOC_ERR_MAP;
    }
    for (int i = 0; i < iCount; ++i)
    {
        if (pRecords[i].szName[0] == 0)
        {
            pRecords[i].szName[0] = NAME_EMPTY_MARK;
        }
        else
        {
            SpellName(table.Records(), pRecords[i]);
        }
    }
    return 0;
}

// Replaces the record's name by its pinyin key, zero-padded to 30 characters.
void CQVLocalizerManager::SpellName(PYOFWORDS* pMap, tag_ContactsStruct& record)
{
    wchar_t szName[LOC_NAME_BUFFER];
    CopyName(record.szName, szName);
    Ft2Jt(szName);
    wchar_t szSpelling[LOC_SPELLING_BUFFER] = {};
    TranslateChineseToPinyin(nullptr, pMap, szName, szSpelling);
    _wcsncpy(record.szName, szSpelling, CONTACT_MAX_NAME);
}

int CQVLocalizerManager::GetLocalizerString(wchar_t* szInput, int iPos, wchar_t* szWord,
                                            wchar_t* szOut)
{
    if (szInput == nullptr || szWord == nullptr || szOut == nullptr)
    {
        return LOC_ERR_PARAM;
    }
    const CPinyinTable table;
    if (!table.IsOpen())
    {
        return LOC_ERR_MAP;
    }
    _wcslwr(szInput);
    const tag_PickedWord word(szWord);
    _wcscpy(szOut, szInput);
    if (!word.IsChinese())
    {
        _wcscat(szOut, word.szUnits);
        _wcsupr(szOut);
        return 0;
    }
    const int iRecord = FindRecord(table.Records(), word.szUtf8);
    if (iRecord < 0)
    {
        return LOC_ERR_MAP;
    }
    if (ReplaceLetters(table.Records()[iRecord], iPos, word.szUnits, szOut))
    {
        _wcsupr(szOut);
    }
    return 0;
}

void CQVLocalizerManager::GetFirstWord(PYOFWORDS* pMap, wchar_t code, wchar_t* szOut)
{
    if (pMap == nullptr || szOut == nullptr)
    {
        return;
    }
    const bool bChinese = IsHanZiCode(CodeBits(code));
    szOut[0] = IndexCharacter(code, bChinese ? pMap + HanZiRecord(code) : nullptr);
}

wchar_t CQVLocalizerManager::IndexCharacter(wchar_t code, const PYOFWORDS* pRecord)
{
    if (IsAlphaCode(CodeBits(code)))
    {
        return L'A' + static_cast<wchar_t>(CodeBits(code) - LOC_ALPHA_BASE);
    }
    if (pRecord == nullptr)
    {
        return L'#';
    }
    const char cFirst = pRecord->szPinyin[0][0];
    return cFirst >= 'a' && cFirst <= 'z' ? L'A' + static_cast<wchar_t>(cFirst - 'a') : L'\0';
}

void CQVLocalizerManager::GetFirstWord(long long llTime, wchar_t* szOut)
{
    if (szOut == nullptr)
    {
        return;
    }
    constexpr long long BUCKET_DAYS[] = {30, 90, 180, 360};
    // Unsigned, since a stored time may lie anywhere in 64 bits.
    const long long llAge =
        static_cast<long long>(static_cast<uint64_t>(m_llNowMs) - static_cast<uint64_t>(llTime));
    wchar_t bucket = L'1';
    for (const long long llDays : BUCKET_DAYS)
    {
        if (llAge < llDays * DAY_MS)
        {
            break;
        }
        ++bucket;
    }
    szOut[0] = bucket;
}

int CQVLocalizerManager::SubString(const wchar_t* szSource, int iLen, wchar_t* szTarget, int iFrom,
                                   int iTo)
{
    if (szSource != nullptr && szTarget != nullptr && iFrom >= 0 && iTo >= iFrom && iTo <= iLen)
    {
        std::copy(szSource + iFrom, szSource + iTo, szTarget);
    }
    return 1;
}
